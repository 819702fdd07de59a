#include "support/Cli.h"

#include <fcntl.h>
#include <poll.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <stdexcept>
#include <utility>

#include "framework/Render.h"

extern char** environ;

namespace TestSupport {

namespace {

// The current environment with `extra` "NAME=VALUE" entries added or replacing.
std::vector<std::string> Environment(const std::vector<std::string>& extra)
{
    const auto nameOf = [](const std::string& entry) { return entry.substr(0, entry.find('=')); };
    std::vector<std::string> entries(extra);
    for (char** entry = environ; *entry != nullptr; ++entry) {
        if (std::none_of(extra.begin(), extra.end(), [&](const auto& e) { return nameOf(e) == nameOf(*entry); })) {
            entries.push_back(*entry);
        }
    }
    return entries;
}

std::vector<char*> Pointers(std::vector<std::string>& texts)
{
    std::vector<char*> pointers;
    for (auto& text : texts) {
        pointers.push_back(text.data());
    }
    pointers.push_back(nullptr);
    return pointers;
}

// Runs `argv`; a program that cannot be started throws when `mustStart`, else ends with 127
// and says why on standard error, as a shell would.
CliResult Spawn(std::vector<std::string> argv, const std::vector<std::string>& env, bool mustStart)
{
    auto envp = Environment(env);
    auto argvPointers = Pointers(argv);
    auto envPointers = Pointers(envp);

    int outPipe[2];
    int errPipe[2];
    if (::pipe2(outPipe, O_CLOEXEC) != 0 || ::pipe2(errPipe, O_CLOEXEC) != 0) {
        throw std::runtime_error(std::string("pipe: ") + std::strerror(errno));
    }
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, STDIN_FILENO, "/dev/null", O_RDONLY, 0);
    posix_spawn_file_actions_adddup2(&actions, outPipe[1], STDOUT_FILENO);
    posix_spawn_file_actions_adddup2(&actions, errPipe[1], STDERR_FILENO);
    pid_t pid = -1;
    const int spawned = posix_spawnp(&pid, argv[0].c_str(), &actions, nullptr, argvPointers.data(), envPointers.data());
    posix_spawn_file_actions_destroy(&actions);
    ::close(outPipe[1]);
    ::close(errPipe[1]);
    CliResult result;
    if (spawned != 0) {
        ::close(outPipe[0]);
        ::close(errPipe[0]);
        const std::string why = "cannot start " + argv[0] + ": " + std::strerror(spawned);
        if (mustStart) {
            throw std::runtime_error(why);
        }
        result.exitCode = 127;
        result.err = why;
        return result;
    }

    pollfd fds[2] = {{outPipe[0], POLLIN, 0}, {errPipe[0], POLLIN, 0}};
    std::string* sinks[2] = {&result.out, &result.err};
    int open = 2;
    char buffer[65536];
    while (open > 0) {
        if (::poll(fds, 2, -1) < 0) {
            if (errno == EINTR) {
                continue;
            }
            break;
        }
        for (int i = 0; i < 2; ++i) {
            if (fds[i].fd < 0 || fds[i].revents == 0) {
                continue;
            }
            const ssize_t n = ::read(fds[i].fd, buffer, sizeof buffer);
            if (n > 0) {
                sinks[i]->append(buffer, static_cast<std::size_t>(n));
            } else if (n == 0 || errno != EINTR) {
                ::close(fds[i].fd);
                fds[i].fd = -1;
                --open;
            }
        }
    }
    for (auto& fd : fds) {
        if (fd.fd >= 0) {
            ::close(fd.fd);
        }
    }
    int status = 0;
    while (::waitpid(pid, &status, 0) < 0 && errno == EINTR) {
    }
    result.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    return result;
}

} // namespace

CliResult RunAutocli(const std::vector<std::string>& args, const std::string& statePath,
                     const std::vector<std::string>& env)
{
    std::vector<std::string> argv{AUTOCLI_BINARY};
    if (!statePath.empty()) {
        argv.insert(argv.end(), {"--state", statePath});
    }
    argv.insert(argv.end(), args.begin(), args.end());
    return Spawn(std::move(argv), env, true);
}

CliResult RunProgram(const std::vector<std::string>& argv, const std::vector<std::string>& env)
{
    return Spawn(argv, env, false);
}

CommandResult Execute(Quillets::AutoCli::Command& command, const std::shared_ptr<Quillets::CallSpec::Input>& in)
{
    // As autocli does: the command may read only what it declares.
    if (in && !in->IsDeclared()) {
        in->Declare(command.GetInputSpec(), command.GetName());
    }
    auto out = Quillets::CallSpec::Output::New();
    command.Execute(in, out);
    return {out->GetErrorMessages(), out->GetRootObject()};
}

std::string Render(Quillets::AutoCli::Command& command, const std::shared_ptr<Quillets::MetaObj::MetaObject>& root,
                   const std::string& formatter)
{
    if (!formatter.empty() && !Quillets::Cli::ParseFormatter(formatter)) {
        throw std::invalid_argument("unknown formatter '" + formatter + "'");
    }
    const Quillets::Cli::OutputHints hints{command.GetDefaultOutputFormatter(), command.GetDefaultOutputParameters()};
    Quillets::Cli::OutputOptions options;
    options.formatter = formatter;
    return Quillets::Cli::RenderResult(root, command.GetOutputSpec()->GetRootObject(), hints, options);
}

} // namespace TestSupport

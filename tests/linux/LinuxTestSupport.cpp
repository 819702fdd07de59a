#include "LinuxTestSupport.h"

#include <fcntl.h>
#include <poll.h>
#include <sched.h>
#include <spawn.h>
#include <sys/mount.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <stdexcept>

#include "support/Cli.h"

extern char** environ;

namespace LinuxTest {

namespace {

std::vector<std::string> Environment(const std::vector<std::string>& extra)
{
    std::vector<std::string> entries;
    for (char** entry = environ; *entry != nullptr; ++entry) {
        const std::string text = *entry;
        const std::string name = text.substr(0, text.find('='));
        bool replaced = false;
        for (const auto& addition : extra)
            replaced = replaced || addition.substr(0, addition.find('=')) == name;
        if (!replaced)
            entries.push_back(text);
    }
    entries.insert(entries.end(), extra.begin(), extra.end());
    return entries;
}

std::vector<char*> Pointers(std::vector<std::string>& texts)
{
    std::vector<char*> pointers;
    for (auto& text : texts)
        pointers.push_back(text.data());
    pointers.push_back(nullptr);
    return pointers;
}

// Reads both pipes to their end.
void Drain(int outFd, int errFd, Ran& result)
{
    pollfd fds[2] = {{outFd, POLLIN, 0}, {errFd, POLLIN, 0}};
    std::string* sinks[2] = {&result.out, &result.err};
    int open = 2;
    char buffer[65536];
    while (open > 0) {
        if (::poll(fds, 2, -1) < 0) {
            if (errno == EINTR)
                continue;
            break;
        }
        for (int i = 0; i < 2; ++i) {
            if (fds[i].fd < 0 || fds[i].revents == 0)
                continue;
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
}

} // namespace

Ran Run(const std::vector<std::string>& args, const std::vector<std::string>& env)
{
    std::vector<std::string> argv = args;
    auto envp = Environment(env);
    auto argvPointers = Pointers(argv);
    auto envPointers = Pointers(envp);
    int outPipe[2];
    int errPipe[2];
    if (::pipe2(outPipe, O_CLOEXEC) != 0 || ::pipe2(errPipe, O_CLOEXEC) != 0)
        throw std::runtime_error(std::string("pipe: ") + std::strerror(errno));
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
    Ran result;
    if (spawned != 0) {
        ::close(outPipe[0]);
        ::close(errPipe[0]);
        result.exitCode = 127;
        result.err = "cannot start " + argv[0] + ": " + std::strerror(spawned);
        return result;
    }
    Drain(outPipe[0], errPipe[0], result);
    int status = 0;
    while (::waitpid(pid, &status, 0) < 0 && errno == EINTR) {
    }
    result.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    return result;
}

Ran Autocli(const std::vector<std::string>& args, const std::vector<std::string>& env)
{
    const auto ran = TestSupport::RunAutocli(args, "", env);
    return {ran.exitCode, ran.out, ran.err};
}

Ran RunInNamespaces(const std::vector<std::string>& flags, const std::string& script,
                    const std::vector<std::string>& env)
{
    std::vector<std::string> argv{"unshare"};
    argv.insert(argv.end(), flags.begin(), flags.end());
    argv.insert(argv.end(), {"--", "/bin/sh", "-c", script});
    std::vector<std::string> fullEnv{std::string("AUTOCLI=") + AUTOCLI_BINARY};
    fullEnv.insert(fullEnv.end(), env.begin(), env.end());
    return Run(argv, fullEnv);
}

const char* const kStepFunction =
    "step() { name=$1; shift; out=$(\"$@\" 2>&1); echo \"@@$name $?\"; echo \"$out\"; }\n";

std::map<std::string, Step> ParseSteps(const std::string& out)
{
    std::map<std::string, Step> steps;
    std::string current;
    std::istringstream in(out);
    for (std::string line; std::getline(in, line);) {
        if (line.rfind("@@", 0) == 0) {
            const auto blank = line.find(' ');
            current = line.substr(2, blank - 2);
            steps[current].exitCode = std::stoi(line.substr(blank + 1));
        } else {
            steps[current].output += line + "\n";
        }
    }
    return steps;
}

std::optional<std::string> NamespaceProblem(const std::vector<std::string>& flags)
{
    std::vector<std::string> argv{"unshare"};
    argv.insert(argv.end(), flags.begin(), flags.end());
    argv.insert(argv.end(), {"--", "true"});
    const Ran ran = Run(argv);
    if (ran.exitCode == 0)
        return std::nullopt;
    std::string flagText;
    for (const auto& f : flags)
        flagText += " " + f;
    return "cannot make a private namespace (unshare" + flagText +
           "): " + (ran.err.empty() ? "exit " + std::to_string(ran.exitCode) : ran.err);
}

std::string InPrivateMountNamespace(const std::function<std::string()>& body)
{
    int pipeFds[2];
    if (::pipe2(pipeFds, O_CLOEXEC) != 0)
        return std::string("pipe: ") + std::strerror(errno);
    const pid_t pid = ::fork();
    if (pid < 0)
        return std::string("fork: ") + std::strerror(errno);
    if (pid == 0) {
        ::close(pipeFds[0]);
        std::string answer;
        if (::unshare(CLONE_NEWNS) != 0)
            answer = std::string("SKIP: cannot make a private mount namespace: ") + std::strerror(errno);
        else if (::mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) != 0)
            answer = std::string("SKIP: cannot make the mounts private: ") + std::strerror(errno);
        else {
            try {
                answer = body();
            } catch (const std::exception& e) {
                answer = std::string("exception: ") + e.what();
            }
        }
        const char* data = answer.data();
        std::size_t left = answer.size();
        while (left > 0) {
            const ssize_t n = ::write(pipeFds[1], data, left);
            if (n <= 0)
                break;
            data += n;
            left -= static_cast<std::size_t>(n);
        }
        ::_exit(0);
    }
    ::close(pipeFds[1]);
    std::string answer;
    char buffer[4096];
    for (;;) {
        const ssize_t n = ::read(pipeFds[0], buffer, sizeof buffer);
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0)
            break;
        answer.append(buffer, static_cast<std::size_t>(n));
    }
    ::close(pipeFds[0]);
    int status = 0;
    while (::waitpid(pid, &status, 0) < 0 && errno == EINTR) {
    }
    if (!WIFEXITED(status) || WEXITSTATUS(status) != 0)
        return "the child ended abnormally (status " + std::to_string(status) + "): " + answer;
    return answer;
}

TempDir::TempDir()
{
    const char* base = std::getenv("TMPDIR");
    std::string pattern = std::string(base && *base ? base : "/tmp") + "/linuxhost.XXXXXX";
    if (!::mkdtemp(pattern.data()))
        throw std::runtime_error("mkdtemp failed for " + pattern);
    path_ = pattern;
}

TempDir::~TempDir()
{
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

std::string ReadFile(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
}

void WriteFile(const std::string& path, const std::string& text) { std::ofstream(path, std::ios::binary) << text; }

bool KernelHasNfsClient()
{
    std::ifstream in("/proc/filesystems");
    for (std::string line; std::getline(in, line);)
        if (line.size() > 4 && line.substr(line.size() - 4) == "\tnfs")
            return true;
    return false;
}

} // namespace LinuxTest

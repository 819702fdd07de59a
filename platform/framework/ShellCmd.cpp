#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <ctime>
#include <string>

#include <nlohmann/json.hpp>

#include "framework/Frontend.h"
#include "quillets/AutoCli.h"

extern char** environ;

namespace {
std::function<void(const std::string&)> gShellSink;
} // namespace

namespace Quillets::Cli {
void SetShellCommandSink(std::function<void(const std::string&)> sink) { gShellSink = std::move(sink); }
} // namespace Quillets::Cli

namespace Quillets::AutoCli {

namespace {

std::string JournalLine(const std::string& command, const std::string& input)
{
    nlohmann::ordered_json entry;
    entry["call"] = "AutoCli_ShellCmd";
    entry["target"] = "";
    entry["args"] = nlohmann::ordered_json::array({command, input});
    return entry.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
}

// Appends one line to the call journal named by AUTOCLI_JOURNAL, in the host's journal format.
void Journal(const std::string& command, const std::string& input)
{
    const char* path = std::getenv("AUTOCLI_JOURNAL");
    if (path == nullptr || *path == '\0') {
        return;
    }
    const std::string line = JournalLine(command, input) + "\n";
    // Never through a link, and never waiting on a pipe nobody reads.
    const int fd = ::open(path, O_WRONLY | O_APPEND | O_CREAT | O_NOFOLLOW | O_CLOEXEC | O_NONBLOCK, 0644);
    if (fd < 0) {
        return;
    }
    // One write per line keeps lines whole when several writers append.
    std::size_t done = 0;
    while (done < line.size()) {
        const ssize_t n = ::write(fd, line.data() + done, line.size() - done);
        if (n < 0 && errno == EINTR) {
            continue;
        }
        if (n <= 0) {
            break;
        }
        done += static_cast<std::size_t>(n);
    }
    ::close(fd);
}

// One pipe to the child; each end is closed as soon as this side is done with it, and
// whatever is still open goes when the exchange ends.
class Pipe {
public:
    Pipe()
    {
        if (::pipe2(ends_, O_CLOEXEC) != 0) {
            ends_[0] = ends_[1] = -1;
        }
    }
    ~Pipe()
    {
        CloseRead();
        CloseWrite();
    }
    Pipe(const Pipe&) = delete;
    Pipe& operator=(const Pipe&) = delete;
    bool Open() const { return ends_[0] >= 0; }
    int Read() const { return ends_[0]; }
    int Write() const { return ends_[1]; }
    void CloseRead() { Close(ends_[0]); }
    void CloseWrite() { Close(ends_[1]); }

private:
    static void Close(int& fd)
    {
        if (fd >= 0) {
            ::close(fd);
            fd = -1;
        }
    }
    int ends_[2] = {-1, -1};
};

// Writing to a child that stopped reading must not kill this process: SIGPIPE is
// blocked for the exchange and a pending one is consumed before it is unblocked.
class SigPipeGuard {
public:
    SigPipeGuard()
    {
        sigemptyset(&pipeSet_);
        sigaddset(&pipeSet_, SIGPIPE);
        sigset_t pending;
        sigpending(&pending);
        wasPending_ = sigismember(&pending, SIGPIPE) == 1;
        pthread_sigmask(SIG_BLOCK, &pipeSet_, &old_);
    }
    ~SigPipeGuard()
    {
        if (raised_ && !wasPending_) {
            const timespec zero{0, 0};
            while (sigtimedwait(&pipeSet_, nullptr, &zero) < 0 && errno == EINTR) {
            }
        }
        pthread_sigmask(SIG_SETMASK, &old_, nullptr);
    }
    SigPipeGuard(const SigPipeGuard&) = delete;
    SigPipeGuard& operator=(const SigPipeGuard&) = delete;
    void Raised() { raised_ = true; }

private:
    sigset_t pipeSet_{};
    sigset_t old_{};
    bool wasPending_ = false;
    bool raised_ = false;
};

} // namespace

int AutoCli_ShellCmd(const std::string& command, std::string& output, const std::string& input)
{
    output.clear();
    if (gShellSink) {
        gShellSink(JournalLine(command, input));
        return 0;
    }
    Journal(command, input);

    Pipe in;
    if (!in.Open()) {
        return -1;
    }
    Pipe out;
    if (!out.Open()) {
        return -1;
    }

    posix_spawn_file_actions_t actions;
    if (posix_spawn_file_actions_init(&actions) != 0) {
        return -1;
    }
    posix_spawn_file_actions_adddup2(&actions, in.Read(), STDIN_FILENO);
    posix_spawn_file_actions_adddup2(&actions, out.Write(), STDOUT_FILENO);
    posix_spawn_file_actions_adddup2(&actions, out.Write(), STDERR_FILENO);

    SigPipeGuard sigPipe;
    // The child starts with default signal handling and an empty mask.
    posix_spawnattr_t attributes;
    posix_spawnattr_init(&attributes);
    sigset_t none;
    sigemptyset(&none);
    sigset_t defaults;
    sigemptyset(&defaults);
    sigaddset(&defaults, SIGPIPE);
    posix_spawnattr_setsigmask(&attributes, &none);
    posix_spawnattr_setsigdefault(&attributes, &defaults);
    posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETSIGMASK | POSIX_SPAWN_SETSIGDEF);

    const char* argv[] = {"sh", "-c", command.c_str(), nullptr};
    pid_t pid = -1;
    const int spawned = posix_spawn(&pid, "/bin/sh", &actions, &attributes, const_cast<char* const*>(argv), environ);
    posix_spawn_file_actions_destroy(&actions);
    posix_spawnattr_destroy(&attributes);
    in.CloseRead();
    out.CloseWrite();
    if (spawned != 0) {
        return -1;
    }

    // Feed the input and drain the output together, so that neither side can block the other.
    ::fcntl(in.Write(), F_SETFL, ::fcntl(in.Write(), F_GETFL) | O_NONBLOCK);
    std::size_t written = 0;
    if (input.empty()) {
        in.CloseWrite();
    }
    char buffer[65536];
    while (out.Read() >= 0) {
        pollfd fds[2];
        nfds_t count = 0;
        fds[count++] = {out.Read(), POLLIN, 0};
        if (in.Write() >= 0) {
            fds[count++] = {in.Write(), POLLOUT, 0};
        }
        if (::poll(fds, count, -1) < 0) {
            if (errno == EINTR) {
                continue;
            }
            break;
        }
        if (count > 1 && fds[1].revents != 0) {
            const ssize_t n = ::write(in.Write(), input.data() + written, input.size() - written);
            if (n > 0) {
                written += static_cast<std::size_t>(n);
            } else if (n < 0 && errno == EPIPE) {
                sigPipe.Raised();
            }
            if ((n < 0 && errno != EAGAIN && errno != EINTR) || written == input.size()) {
                in.CloseWrite();
            }
        }
        if (fds[0].revents != 0) {
            const ssize_t n = ::read(out.Read(), buffer, sizeof buffer);
            if (n > 0) {
                output.append(buffer, static_cast<std::size_t>(n));
            } else if (n == 0 || (errno != EINTR && errno != EAGAIN)) {
                out.CloseRead();
            }
        }
    }
    in.CloseWrite();

    int status = 0;
    while (::waitpid(pid, &status, 0) < 0) {
        if (errno != EINTR) {
            return -1;
        }
    }
    if (WIFEXITED(status)) {
        return WEXITSTATUS(status);
    }
    if (WIFSIGNALED(status)) {
        return 128 + WTERMSIG(status);
    }
    return -1;
}

} // namespace Quillets::AutoCli

#include "LinuxTestSupport.h"

#include <gtest/gtest.h>

#include <fcntl.h>
#include <sched.h>
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

namespace LinuxTest {

Ran Run(const std::vector<std::string>& args, const std::vector<std::string>& env)
{
    return TestSupport::RunProgram(args, env);
}

Ran Autocli(const std::vector<std::string>& args, const std::vector<std::string>& env)
{
    return TestSupport::RunAutocli(args, "", env);
}

std::string ErrorOf(const std::function<void()>& body)
{
    try {
        body();
    } catch (const std::runtime_error& e) {
        return e.what();
    }
    return "<no error>";
}

std::vector<std::string> Words(const std::string& line)
{
    std::vector<std::string> words;
    std::istringstream stream(line);
    for (std::string word; stream >> word;)
        words.push_back(word);
    return words;
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

void ExpectSteps(std::map<std::string, Step>& steps, const std::vector<StepExpectation>& expected)
{
    for (const auto& e : expected) {
        SCOPED_TRACE(e.step);
        EXPECT_EQ(steps[e.step].exitCode, e.exitCode) << steps[e.step].output;
        EXPECT_NE(steps[e.step].output.find(e.contains), std::string::npos) << steps[e.step].output;
    }
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

bool KernelHasNfsClient()
{
    std::ifstream in("/proc/filesystems");
    for (std::string line; std::getline(in, line);)
        if (line.size() > 4 && line.substr(line.size() - 4) == "\tnfs")
            return true;
    return false;
}

} // namespace LinuxTest

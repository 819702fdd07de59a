#pragma once

// Helpers for the Linux host's tests: running programs, temporary folders, and private
// namespaces so that nothing a test does reaches the machine's own mounts or packet filter.

#include <functional>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "support/Cli.h"
#include "support/Files.h"

namespace LinuxTest {

using Ran = TestSupport::CliResult;

// Runs `args` (args[0] looked up in PATH) with no standard input; `env` adds or replaces
// "NAME=VALUE" entries.
Ran Run(const std::vector<std::string>& args, const std::vector<std::string>& env = {});

// Runs autocli with `args`.
Ran Autocli(const std::vector<std::string>& args, const std::vector<std::string>& env = {});

// The message of the std::runtime_error `body` throws, or "<no error>".
std::string ErrorOf(const std::function<void()>& body);

// The words of `line`, split at spaces.
std::vector<std::string> Words(const std::string& line);

// Runs `script` with /bin/sh inside fresh namespaces made by unshare(1) (`flags`, e.g.
// {"-n"} or {"-m", "--propagation", "private"}). The script finds autocli in $AUTOCLI.
Ran RunInNamespaces(const std::vector<std::string>& flags, const std::string& script,
                    const std::vector<std::string>& env = {});

// Scripts run their commands through this shell function: `step NAME command...` prints
// "@@NAME EXIT" and then the command's output (standard output and error together).
extern const char* const kStepFunction;

struct Step {
    int exitCode = -1;
    std::string output;
};
// The steps a script printed, by name.
std::map<std::string, Step> ParseSteps(const std::string& out);

// What one step must end with: its exit code, and a text its output contains.
struct StepExpectation {
    const char* step;
    int exitCode;
    const char* contains;
};
// Checks the steps in `expected` (a missing step fails) against those a script printed.
void ExpectSteps(std::map<std::string, Step>& steps, const std::vector<StepExpectation>& expected);

// Why namespaces of that kind cannot be made here, or nothing when they can.
std::optional<std::string> NamespaceProblem(const std::vector<std::string>& flags);

// Runs `body` in a child process inside a private mount namespace. The body returns "" on
// success, a failure text otherwise, or "SKIP: reason". Returns what the body returned, or
// "SKIP: ..." when the namespace could not be made.
std::string InPrivateMountNamespace(const std::function<std::string()>& body);

// A fresh folder under $TMPDIR (or /tmp), removed with everything in it at the end.
class TempDir {
public:
    TempDir();
    ~TempDir();
    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;
    const std::string& Path() const { return path_; }

private:
    std::string path_;
};

using TestSupport::ReadFile;
using TestSupport::WriteFile;

// True when the running kernel lists an "nfs" file system.
bool KernelHasNfsClient();

} // namespace LinuxTest

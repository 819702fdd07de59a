#pragma once

#include <exception>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "framework/Parser.h"
#include "quillets/AutoCli.h"

// From a command line to what autocli prints and its exit code, over a ready tree.
namespace Quillets::Cli {

enum ExitCode : int {
    kExitOk = 0,        // ran, no error message
    kExitErrors = 1,    // ran, at least one error message
    kExitUsage = 2,     // nothing was run
    kExitException = 3, // an exception left the command
};

struct CliOutcome {
    int exitCode = kExitOk;
    std::string out;
    std::string err;
};

struct DispatchHooks {
    // The effective host state for --dump-state (may throw).
    std::function<std::string()> dumpState;
    // The message of an exception the framework does not know by type (the host's); nothing
    // when the hook does not know it either.
    std::function<std::optional<std::string>(const std::exception_ptr&)> describeException;
    // When set, a command's printed result goes here as it is produced instead of into
    // CliOutcome::out, so a large result is never held as one text.
    std::function<void(std::string_view)> writeOut;
};

std::string VersionText();

// While set, AutoCli_ShellCmd runs nothing: it hands its journal line (without the newline)
// to `sink` and reports success. A dry run uses it; an empty function restores real runs.
void SetShellCommandSink(std::function<void(const std::string&)> sink);

// The message of any exception; unknown ones are described by `hooks` or generically.
std::string DescribeException(const std::exception_ptr& error, const DispatchHooks& hooks);

// Runs what `invocation` asks for. Every exception is caught and becomes exit code 3.
CliOutcome RunInvocation(const Invocation& invocation, const DispatchHooks& hooks);

// ParseCommandLine and RunInvocation; `args` are the arguments after the program name.
CliOutcome Dispatch(const std::shared_ptr<AutoCli::NamespaceNode>& root, const std::vector<std::string>& args,
                    const DispatchHooks& hooks = {});

} // namespace Quillets::Cli

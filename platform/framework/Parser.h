#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "framework/Render.h"
#include "framework/TreeWalk.h"
#include "quillets/AutoCli.h"
#include "quillets/CallSpec.h"

// The command line: global options, the path through the tree, the command's parameters.
// Every check the framework makes happens here, before anything runs.
namespace Quillets::Cli {

struct GlobalOptions {
    std::optional<std::string> statePath;
    std::optional<std::string> hostName; // --host: "sim" or "linux"
    OutputOptions output;
    bool help = false;
    bool version = false;
    bool dumpState = false;
    bool listCommands = false;
    std::optional<std::string> completionShell; // --completion: "bash" or "zsh"
    std::optional<std::string> valueList;       // hidden --list-values KIND, for completion scripts
    bool manPage = false;                       // hidden --man-page, for the build
    bool initState = false;                     // create the state file from the demo host and stop
    bool dryRun = false;                        // run on the state in memory, save nothing
};

// The global options that stand before the path, read on their own: enough to choose the
// host state and to answer --version or --dump-state before anything is loaded.
struct LeadingGlobals {
    GlobalOptions globals;
    std::size_t next = 0; // index of the first argument after them
    std::string error;    // a usage error ("" when none)
};
LeadingGlobals ParseLeadingGlobals(const std::vector<std::string>& args);

struct Invocation {
    enum class Action { Run, Help, Version, DumpState, ListCommands, Completion, ListValues, ManPage, UsageError };

    Action action = Action::UsageError;
    GlobalOptions globals;
    CommandPath path;                             // as far as it was resolved
    std::shared_ptr<AutoCli::NamespaceNode> node; // the node at `path`
    std::shared_ptr<AutoCli::Command> command;    // for Run
    std::shared_ptr<CallSpec::OutputSpec> outputSpec;
    std::shared_ptr<CallSpec::Input> input;
    std::string error; // the one-line usage message for UsageError
};

// `args` are the arguments after the program name.
Invocation ParseCommandLine(const std::shared_ptr<AutoCli::NamespaceNode>& root, const std::vector<std::string>& args);

// Value syntax shared with --format-param: true/false, yes/no, 1/0, on/off in any case.
std::optional<bool> ParseBool(const std::string& text);
// A signed 64-bit decimal integer with an optional sign; nothing for junk or overflow.
std::optional<std::int64_t> ParseInt64(const std::string& text);

} // namespace Quillets::Cli

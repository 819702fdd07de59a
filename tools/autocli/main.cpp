// autocli: opens the host session, builds the command tree from the plug-ins, then
// parses, runs and prints one command, and saves what it changed.

#include <unistd.h>

#include <cstdio>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "HostChoice.h"
#include "HostValues.h"
#include "Plugins.h"
#include "framework/Frontend.h"
#include "host/HostSession.h"
#include "host/linux/LinuxHost.h"
#include "hostctl/HostCtlException.h"
#include "quillets/AutoCli.h"
#include "quillets/QuilletException.h"

namespace {

using Quillets::AutoCli::Namespace;
using Quillets::AutoCli::NamespaceNode;
using Quillets::Cli::DispatchHooks;

std::optional<std::string> DescribeHostException(const std::exception_ptr& error)
{
    try {
        std::rethrow_exception(error);
    } catch (const HostCtl::Lib::HostCtlException& e) {
        return e.message;
    } catch (...) {
        return std::nullopt;
    }
}

DispatchHooks Hooks()
{
    DispatchHooks hooks;
    hooks.dumpState = [] { return HostSim::DumpState(); };
    hooks.describeException = DescribeHostException;
    hooks.writeOut = [](std::string_view text) { std::fwrite(text.data(), 1, text.size(), stdout); };
    hooks.valueSources = Autocli::VolumeParameters();
    hooks.listValues = Autocli::HostValues;
    return hooks;
}

void Print(std::FILE* stream, const std::string& text)
{
    if (!text.empty()) {
        std::fwrite(text.data(), 1, text.size(), stream);
    }
    std::fflush(stream);
}

int Finish(const Quillets::Cli::CliOutcome& outcome)
{
    Print(stdout, outcome.out);
    Print(stderr, outcome.err);
    return outcome.exitCode;
}

int Fail(const std::string& message)
{
    Print(stderr, message + "\n");
    return Quillets::Cli::kExitException;
}

std::string Describe(const std::exception_ptr& error) { return Quillets::Cli::DescribeException(error, Hooks()); }

// A file name as one shell word.
std::string ShellQuoted(const std::string& text)
{
    std::string quoted = "'";
    for (char c : text) {
        if (c == '\'')
            quoted += "'\\''";
        else
            quoted += c;
    }
    return quoted + "'";
}

int InitState(const std::string& path)
{
    try {
        HostSim::InitState(path);
    } catch (const HostSim::StateFileExists& e) {
        Print(stderr, std::string(e.what()) + "\n");
        return Quillets::Cli::kExitErrors;
    } catch (...) {
        return Fail(Describe(std::current_exception()));
    }
    Print(stdout, "Created host state file '" + path + "' from the demo host.\n");
    return Quillets::Cli::kExitOk;
}

// Runs the command line's invocation. In a dry run the host and shell calls are collected
// instead of journaled or run, and listed after the command's own output.
Quillets::Cli::CliOutcome RunCommandLine(const std::shared_ptr<NamespaceNode>& root,
                                         const std::vector<std::string>& args, const DispatchHooks& hooks,
                                         bool& saveAllowed)
{
    Quillets::Cli::Invocation invocation;
    try {
        invocation = Quillets::Cli::ParseCommandLine(root, args);
    } catch (...) {
        // Describing a command's input is the command's code, and may fail.
        return {Quillets::Cli::kExitException, "", Describe(std::current_exception()) + "\n"};
    }
    const bool dryRun = invocation.globals.dryRun && invocation.action == Quillets::Cli::Invocation::Action::Run;
    saveAllowed = !invocation.globals.dryRun;
    if (!dryRun)
        return Quillets::Cli::RunInvocation(invocation, hooks);

    std::vector<std::string> calls;
    auto collect = [&calls](const std::string& line) { calls.push_back(line); };
    HostSim::SetJournalSink(collect);
    Quillets::Cli::SetShellCommandSink(collect);
    auto outcome = Quillets::Cli::RunInvocation(invocation, hooks);
    HostSim::SetJournalSink({});
    Quillets::Cli::SetShellCommandSink({});
    outcome.err += "Dry run: nothing was saved.\n";
    for (const auto& call : calls)
        outcome.err += call + "\n";
    return outcome;
}

// `tree` receives the command tree, so that it can outlive Run() (see main).
int Run(const std::vector<std::string>& args, std::shared_ptr<NamespaceNode>& tree)
{
    const DispatchHooks hooks = Hooks();
    const auto leading = Quillets::Cli::ParseLeadingGlobals(args);
    if (!leading.error.empty()) {
        Print(stderr, leading.error + "\n");
        return Quillets::Cli::kExitUsage;
    }
    if (leading.globals.version) {
        Print(stdout, Quillets::Cli::VersionText());
        return Quillets::Cli::kExitOk;
    }
    const HostChoice host = ChooseHost(leading.globals);
    if (!host.error.empty()) {
        Print(stderr, host.error + "\n");
        return Quillets::Cli::kExitUsage;
    }
    const auto state = HostSim::ChooseStatePath(leading.globals.statePath ? &*leading.globals.statePath : nullptr);
    if (leading.globals.initState) {
        if (leading.globals.dryRun) {
            Print(stderr, "Options '--init-state' and '--dry-run' cannot be used together. See 'autocli --help'.\n");
            return Quillets::Cli::kExitUsage;
        }
        return InitState(state.path);
    }
    const auto plugins = AutoCliFrontEnd::FindPluginFolder();
    if (!plugins.error.empty()) {
        Print(stderr, plugins.error + "\n");
        return plugins.usageError ? Quillets::Cli::kExitUsage : Quillets::Cli::kExitException;
    }

    // The session comes first: registration reads the host's feature switches.
    try {
        if (host.useLinux) {
            HostLinux::OpenSession();
        } else {
            HostSim::SessionOptions options;
            options.mustExist = state.named;
            options.dryRun = leading.globals.dryRun;
            HostSim::OpenSession(state.path, options);
        }
    } catch (const HostSim::StateFileMissing& e) {
        Print(stderr, std::string(e.what()) + " Create it from the demo host with: autocli --state " +
                          ShellQuoted(state.path) + " --init-state\n");
        return Quillets::Cli::kExitUsage;
    } catch (...) {
        return Fail(Describe(std::current_exception()));
    }
    if (leading.globals.dumpState) {
        Quillets::Cli::Invocation dump;
        dump.action = Quillets::Cli::Invocation::Action::DumpState;
        return Finish(Quillets::Cli::RunInvocation(dump, hooks));
    }

    auto root = Namespace::New();
    tree = root;
    auto storage = Namespace::New();
    storage->SetDescription("Manage storage on the Zephal host.");
    root->RegisterNamespaceNode(storage, "storage");
    const auto load = AutoCliFrontEnd::LoadPlugins(plugins.path, root, storage, Describe);
    for (const auto& warning : load.warnings)
        Print(stderr, warning + "\n");
    if (!load.error.empty())
        return Fail(load.error);

    bool saveAllowed = true;
    auto outcome = RunCommandLine(root, args, hooks, saveAllowed);
    // The command's changes are saved once, whether it succeeded or not; its output follows.
    std::string saveError;
    if (saveAllowed) {
        try {
            HostSim::SaveChanges();
        } catch (...) {
            saveError = Describe(std::current_exception());
        }
    }
    const int code = Finish(outcome);
    if (!saveError.empty())
        return Fail(saveError);
    return code;
}

// With the sanitizers the process ends the ordinary way, so that their leak check sees
// every object torn down.
#if defined(__SANITIZE_ADDRESS__)
constexpr bool kTearDownAtExit = true;
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
constexpr bool kTearDownAtExit = true;
#else
constexpr bool kTearDownAtExit = false;
#endif
#else
constexpr bool kTearDownAtExit = false;
#endif

} // namespace

int main(int argc, char** argv)
{
    std::vector<std::string> args(argv + 1, argv + argc);
    int code = Quillets::Cli::kExitException;
    std::shared_ptr<NamespaceNode> tree;
    try {
        code = Run(args, tree);
    } catch (...) {
        code = Fail(Quillets::Cli::DescribeException(std::current_exception(), Hooks()));
    }
    if (!kTearDownAtExit) {
        // Everything is printed and every change is saved: the tree, the plug-ins' objects and
        // the host state are left to the end of the process rather than taken apart one by one.
        // The kernel releases the state file's lock with the process.
        std::fflush(stdout);
        std::fflush(stderr);
        ::_exit(code);
    }
    try {
        HostSim::CloseSession();
    } catch (...) {
        // Nothing is left to report to: the command's outcome stands.
    }
    return code;
}

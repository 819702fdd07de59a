// autocli: opens the host session, builds the command tree from the plug-ins, then
// parses, runs and prints one command.

#include <dlfcn.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <system_error>
#include <vector>

#include "HostChoice.h"
#include "HostValues.h"
#include "framework/Frontend.h"
#include "host/HostSession.h"
#include "host/linux/LinuxHost.h"
#include "hostctl/HostCtlException.h"
#include "quillets/AutoCli.h"
#include "quillets/QuilletException.h"

namespace {

namespace fs = std::filesystem;
using Quillets::AutoCli::Namespace;
using Quillets::AutoCli::NamespaceNode;
using Quillets::Cli::DispatchHooks;
using RegisterFunction = void (*)(std::shared_ptr<NamespaceNode>);

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

fs::path PluginDirectory()
{
    if (const char* configured = std::getenv("AUTOCLI_PLUGIN_PATH"); configured && *configured) {
        return configured;
    }
    std::error_code error;
    const fs::path self = fs::read_symlink("/proc/self/exe", error);
    if (error) {
        return "lib/autocli/plugins";
    }
    return (self.parent_path() / ".." / "lib" / "autocli" / "plugins").lexically_normal();
}

// Loads every plug-in of the plug-in directory, in name order, and lets it register.
// Returns "" on success, else the message that names what failed.
std::string LoadPlugins(const std::shared_ptr<NamespaceNode>& root, const std::shared_ptr<NamespaceNode>& storage,
                        const DispatchHooks& hooks)
{
    const fs::path directory = PluginDirectory();
    std::vector<fs::path> plugins;
    std::error_code error;
    for (fs::directory_iterator it(directory, error), end; !error && it != end; it.increment(error)) {
        if (it->path().extension() == ".so") {
            plugins.push_back(it->path());
        }
    }
    if (error) {
        return "Cannot read the plug-in folder '" + directory.string() + "': " + error.message();
    }
    std::sort(plugins.begin(), plugins.end());

    for (const auto& plugin : plugins) {
        // Plug-ins stay loaded for the life of the process: the tree holds their objects.
        void* handle = dlopen(plugin.c_str(), RTLD_NOW | RTLD_LOCAL);
        if (handle == nullptr) {
            const char* why = dlerror();
            return "Cannot load plug-in '" + plugin.string() + "': " + (why ? why : "unknown error");
        }
        auto registerStorage = reinterpret_cast<RegisterFunction>(dlsym(handle, "FilesystemNfs_RegisterNamespaces"));
        auto registerRoot = reinterpret_cast<RegisterFunction>(dlsym(handle, "AutoCli_RegisterNamespaces"));
        if (registerStorage == nullptr && registerRoot == nullptr) {
            return "Plug-in '" + plugin.string() + "' has no registration function.";
        }
        try {
            if (registerStorage != nullptr) {
                registerStorage(storage);
            }
            if (registerRoot != nullptr) {
                registerRoot(root);
            }
        } catch (...) {
            return "Plug-in '" + plugin.string() + "' failed to register: " +
                   Quillets::Cli::DescribeException(std::current_exception(), hooks);
        }
    }
    return {};
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

    // The session comes first: registration reads the host's feature switches.
    try {
        if (host.useLinux) {
            HostLinux::OpenSession();
        } else {
            HostSim::OpenSession(leading.globals.statePath ? *leading.globals.statePath : HostSim::DefaultStatePath());
        }
    } catch (...) {
        return Fail(Quillets::Cli::DescribeException(std::current_exception(), hooks));
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
    if (auto problem = LoadPlugins(root, storage, hooks); !problem.empty()) {
        return Fail(problem);
    }
    return Finish(Quillets::Cli::Dispatch(root, args, hooks));
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

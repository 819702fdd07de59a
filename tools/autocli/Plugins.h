#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "quillets/AutoCli.h"

// Where autocli finds its plug-ins and how it loads them. autocli runs as root, so code is
// loaded only from a folder found from the executable's own real path (or named by an
// absolute AUTOCLI_PLUGIN_PATH) and only when nobody but its owner, root or the caller, can
// change it.
namespace AutoCliFrontEnd {

struct PluginFolder {
    std::string path;        // absolute; empty when `error` is set
    std::string error;       // why there is none
    bool usageError = false; // the error is the user's setting (exit 2), not the installation's
};

PluginFolder FindPluginFolder();

struct PluginLoad {
    std::vector<std::string> warnings; // one line each: plug-ins skipped and why
    std::string error;                 // set when no plug-in could be used
};

// Loads every plug-in of `folder`, in name order, and lets each register: the storage
// registration with `storage`, the root registration with `root`. `describe` turns an
// exception a plug-in throws while registering into its message.
PluginLoad LoadPlugins(const std::string& folder, const std::shared_ptr<Quillets::AutoCli::NamespaceNode>& root,
                       const std::shared_ptr<Quillets::AutoCli::NamespaceNode>& storage,
                       std::string (*describe)(const std::exception_ptr&));

} // namespace AutoCliFrontEnd

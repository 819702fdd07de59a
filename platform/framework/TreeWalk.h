#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "quillets/AutoCli.h"

namespace Quillets::Cli {

using CommandPath = std::vector<std::string>;

struct CommandEntry {
    CommandPath path; // names from below the root down to the command, e.g. {"storage", "filesystem", "list"}
    std::shared_ptr<AutoCli::Command> command;
};

// Visits every command under `root`, depth first, children in registration order.
// A node reached twice (shared or cyclic registration) is visited only the first time.
void ForEachCommand(
    const std::shared_ptr<AutoCli::NamespaceNode>& root,
    const std::function<void(const CommandPath& path, const std::shared_ptr<AutoCli::Command>& command)>& visit);

// Visits every node under `root` (the root first, with an empty path), namespaces and commands
// alike, in the same order and with the same rule for nodes reached twice.
void ForEachNode(
    const std::shared_ptr<AutoCli::NamespaceNode>& root,
    const std::function<void(const CommandPath& path, const std::shared_ptr<AutoCli::NamespaceNode>& node)>& visit);

// Every command under `root` with its path, in the order ForEachCommand visits them.
std::vector<CommandEntry> ListCommands(const std::shared_ptr<AutoCli::NamespaceNode>& root);

// The node at `path` below `root` (the root itself for an empty path), or null.
std::shared_ptr<AutoCli::NamespaceNode> FindNode(const std::shared_ptr<AutoCli::NamespaceNode>& root,
                                                 const CommandPath& path);

// "storage filesystem list"
std::string JoinPath(const CommandPath& path);

} // namespace Quillets::Cli

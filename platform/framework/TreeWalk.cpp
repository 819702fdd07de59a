#include "framework/TreeWalk.h"

#include <set>

#include "framework/Text.h"

namespace Quillets::Cli {

using AutoCli::Command;
using AutoCli::NamespaceNode;

namespace {

void Walk(const std::shared_ptr<NamespaceNode>& node, CommandPath& path, std::set<const NamespaceNode*>& seen,
          const std::function<void(const CommandPath&, const std::shared_ptr<NamespaceNode>&)>& visit)
{
    if (!node || !seen.insert(node.get()).second) {
        return;
    }
    visit(path, node);
    for (const auto& [name, child] : node->GetChildren()) {
        path.push_back(name);
        Walk(child, path, seen, visit);
        path.pop_back();
    }
}

} // namespace

void ForEachCommand(const std::shared_ptr<NamespaceNode>& root,
                    const std::function<void(const CommandPath&, const std::shared_ptr<Command>&)>& visit)
{
    ForEachNode(root, [&](const CommandPath& path, const std::shared_ptr<NamespaceNode>& node) {
        if (auto command = std::dynamic_pointer_cast<Command>(node)) {
            visit(path, command);
        }
    });
}

void ForEachNode(const std::shared_ptr<NamespaceNode>& root,
                 const std::function<void(const CommandPath&, const std::shared_ptr<NamespaceNode>&)>& visit)
{
    CommandPath path;
    std::set<const NamespaceNode*> seen;
    Walk(root, path, seen, visit);
}

std::vector<CommandEntry> ListCommands(const std::shared_ptr<NamespaceNode>& root)
{
    std::vector<CommandEntry> entries;
    ForEachCommand(root, [&](const CommandPath& path, const std::shared_ptr<Command>& command) {
        entries.push_back({path, command});
    });
    return entries;
}

std::shared_ptr<NamespaceNode> FindNode(const std::shared_ptr<NamespaceNode>& root, const CommandPath& path)
{
    auto node = root;
    for (const auto& name : path) {
        if (!node) {
            return nullptr;
        }
        node = node->GetNamespaceNode(name);
    }
    return node;
}

std::string JoinPath(const CommandPath& path) { return Text::Join(path, " "); }

} // namespace Quillets::Cli

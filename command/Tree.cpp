#include "command/Tree.h"

namespace OrvaneCli::FileSystem {

NamespacePtr MakeNamespace(const char* description, std::initializer_list<Child> children)
{
    auto ns = Quillets::AutoCli::Namespace::New();
    ns->SetDescription(description);
    for (const Child& child : children) {
        if (child.node) {
            Attach(ns, child.name, child.node);
        }
    }
    return ns;
}

void Attach(const NodePtr& parent, const char* name, NodePtr node)
{
    parent->RegisterNamespaceNode(std::move(node), name);
}

} // namespace OrvaneCli::FileSystem

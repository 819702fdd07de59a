#pragma once

// Building the command tree: each area's manifest makes its namespaces complete, bottom-up,
// and hands them to registration.

#include <initializer_list>
#include <memory>

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

using NodePtr = std::shared_ptr<Quillets::AutoCli::NamespaceNode>;
using NamespacePtr = std::shared_ptr<Quillets::AutoCli::Namespace>;

// A child of a namespace; an empty node (a branch whose switch is off) is left out.
struct Child {
    const char* name;
    NodePtr node;
};

// A namespace holding `children` in the given order.
NamespacePtr MakeNamespace(const char* description, std::initializer_list<Child> children = {});

// Hands the only owning reference of a new node to the framework.
void Attach(const NodePtr& parent, const char* name, NodePtr node);

} // namespace OrvaneCli::FileSystem

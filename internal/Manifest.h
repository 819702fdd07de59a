#pragma once

// storage internal nmp and storage internal clusteredhdsk: the commands of the area and the
// namespaces they form.

#include "command/Tree.h"

namespace OrvaneCli::FileSystem {

NodePtr NewBootRestore();
NodePtr NewClusteredHdskGet();
NodePtr NewClusteredHdskSet();

NamespacePtr NmpNamespace();
NamespacePtr ClusteredHdskNamespace();

} // namespace OrvaneCli::FileSystem

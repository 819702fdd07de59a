#pragma once

// storage filesystem: the commands of the area and the namespace they form.

#include "command/Tree.h"

namespace OrvaneCli::FileSystem {

NodePtr NewVolumeList();
NodePtr NewVolumeRescan();
NodePtr NewVolumeMount();
NodePtr NewVolumeUnmount();
NodePtr NewVolumeAutomount();

NamespacePtr FilesystemNamespace();

} // namespace OrvaneCli::FileSystem

#pragma once

#include <memory>

#include "quillets/AutoCli.h"

// The plug-in's exported entry points. Each takes the parent node it builds under.
#define STORAGECLI_EXPORT __attribute__((visibility("default")))

extern "C" {
STORAGECLI_EXPORT void AutoCli_RegisterNamespaces(std::shared_ptr<Quillets::AutoCli::NamespaceNode> root);
STORAGECLI_EXPORT void Core_RegisterInternalNamespaces(std::shared_ptr<Quillets::AutoCli::NamespaceNode> root);
STORAGECLI_EXPORT void Nmp_RegisterInternalNamespaces(std::shared_ptr<Quillets::AutoCli::NamespaceNode> parent);
STORAGECLI_EXPORT void ClusteredHdsk_RegisterInternalNamespace(
    std::shared_ptr<Quillets::AutoCli::NamespaceNode> parent);
STORAGECLI_EXPORT void FilesystemNfs_RegisterNamespaces(std::shared_ptr<Quillets::AutoCli::NamespaceNode> parent);
}

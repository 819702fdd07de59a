#pragma once

// storage nfs and storage nfs41: the commands of the area and the namespaces they form.

#include <string>

#include "command/Tree.h"

namespace OrvaneCli::FileSystem {

NodePtr NewNFSVolumeAdd();
NodePtr NewNFS41VolumeAdd();
NodePtr NewNFSVolumeRemove();
NodePtr NewNFS41VolumeRemove();
NodePtr NewNFSVolumeList();
NodePtr NewNFS41VolumeList();
NodePtr NewNFSVolumePreunmountEnter();
NodePtr NewNFSVolumePreunmountExit();
NodePtr NewNFSVolumeParamGet();
NodePtr NewNFSVolumeParamSet();
NodePtr NewNFS41VolumeParamGet();
NodePtr NewNFS41VolumeParamSet();
NodePtr NewNFSFirewallAdd();
NodePtr NewNFSFirewallRemove();
NodePtr NewNFSFirewallList();
NodePtr NewNFS41FirewallAdd();
NodePtr NewNFS41FirewallRemove();
NodePtr NewNFS41FirewallList();

NamespacePtr NfsNamespace();
NamespacePtr Nfs41Namespace();

// The texts the NFS lists show for a security flavour and a hardware acceleration state.
const std::string& TranslateSecurity(NetworkFileSystem::SecurityType security);
const char* TranslateQAXI(HostCtl::Storage::QAXIState state);

} // namespace OrvaneCli::FileSystem

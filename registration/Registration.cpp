#include "registration/Registration.h"

#include "command/Command.h"
#include "filesystem/VolumeList.h"
#include "filesystem/VolumeMount.h"
#include "filesystem/VolumeRescan.h"
#include "hlfs/HLFSPBCache.h"
#include "hlfs/HLFSReclaimConfig.h"
#include "hlfs/HLFSSnapshotList.h"
#include "hlfs/HLFSSnapshotMount.h"
#include "hlfs/HLFSVolumeHostList.h"
#include "hlfs/HLFSVolumeLockMode.h"
#include "hlfs/HLFSVolumeUnmap.h"
#include "internal/BootRestore.h"
#include "internal/ClusteredHdsk.h"
#include "nfs/NFS41VolumeAdd.h"
#include "nfs/NFSVolumeAdd.h"
#include "nfs/NFSVolumeList.h"
#include "nfs/NFSVolumeParam.h"
#include "nfs/NasFirewall.h"
#include "nfs/NFSVolumePreunmount.h"
#include "nfs/NFSVolumeRemove.h"
#include "hlfs/HLFSExtentList.h"

using Quillets::AutoCli::Namespace;
using Quillets::AutoCli::NamespaceNode;
using Quillets::QuilletException;
using namespace OrvaneCli::FileSystem;

namespace {

using NodePtr = std::shared_ptr<NamespaceNode>;
using NamespacePtr = std::shared_ptr<Namespace>;

NamespacePtr MakeNamespace(const char* description)
{
    auto ns = Namespace::New();
    ns->SetDescription(description);
    return ns;
}

// Hands the only owning reference of a new node to the framework.
void Attach(const NodePtr& parent, const char* name, NodePtr node)
{
    parent->RegisterNamespaceNode(std::move(node), name);
}

// The namespace `name` under `parent`; anything else there is a broken tree.
NamespacePtr FindNamespace(const NodePtr& parent, const char* name)
{
    auto missing = [&] {
        return QuilletException(HostCtl::Misc::StrPrintf("Unable to find '%s' namespace in namespace '%s'", name,
                                                          parent->GetName().c_str()));
    };
    if (!parent->HasNamespaceNode(name)) {
        throw missing();
    }
    auto ns = std::dynamic_pointer_cast<Namespace>(parent->GetNamespaceNode(name));
    if (!ns) {
        throw missing();
    }
    return ns;
}

// Each Build function makes one namespace complete, bottom-up; the caller attaches it.

NamespacePtr BuildFilesystem()
{
    auto ns = MakeNamespace("Operations pertaining to filesystems, also known as datastores, on the Zephal host.");
    Attach(ns, "list", VolumeList::New());
    Attach(ns, "rescan", VolumeRescan::New());
    Attach(ns, "mount", VolumeMount::New());
    Attach(ns, "unmount", VolumeUnmount::New());
    Attach(ns, "automount", VolumeAutomount::New());
    return ns;
}

NamespacePtr BuildNfsPreunmountState()
{
    auto ns = MakeNamespace("Enter or exit preunmount state.");
    Attach(ns, "enter", NFSVolumePreunmountEnter::New());
    Attach(ns, "exit", NFSVolumePreunmountExit::New());
    return ns;
}

NamespacePtr BuildNfsParam()
{
    auto ns = MakeNamespace("Operations on volume parameters of NAS filesystems.");
    Attach(ns, "get", NFSVolumeParamGet::New());
    Attach(ns, "set", NFSVolumeParamSet::New());
    return ns;
}

NamespacePtr BuildNfsFirewall()
{
    auto ns = MakeNamespace("Operations on IP/Mask of nfsClient firewall ruleset");
    Attach(ns, "add", NFSFirewallAdd::New());
    Attach(ns, "remove", NFSFirewallRemove::New());
    Attach(ns, "list", NFSFirewallList::New());
    return ns;
}

NamespacePtr BuildNfs()
{
    auto ns = MakeNamespace("Operations to create, manage, and remove Network Attached Storage filesystems.");
    Attach(ns, "add", NFSVolumeAdd::New());
    Attach(ns, "remove", NFSVolumeRemove::New());
    Attach(ns, "list", NFSVolumeList::New());
    if (IsFeatureEnabled(Feature::NasPreUnmount)) {
        Attach(ns, "preunmountstate", BuildNfsPreunmountState());
    }
    Attach(ns, "param", BuildNfsParam());
    Attach(ns, "firewall", BuildNfsFirewall());
    return ns;
}

NamespacePtr BuildNfs41Param()
{
    auto ns = MakeNamespace("Operations on volume parameters of NFS v4.1 filesystems.");
    Attach(ns, "get", NFS41VolumeParamGet::New());
    Attach(ns, "set", NFS41VolumeParamSet::New());
    return ns;
}

NamespacePtr BuildNfs41Firewall()
{
    auto ns = MakeNamespace("Operations on IP/Mask of nfs41Client firewall ruleset");
    Attach(ns, "add", NFS41FirewallAdd::New());
    Attach(ns, "remove", NFS41FirewallRemove::New());
    Attach(ns, "list", NFS41FirewallList::New());
    return ns;
}

NamespacePtr BuildNfs41()
{
    auto ns = MakeNamespace("Operations to create, manage, and remove NFS v4.1 filesystems.");
    Attach(ns, "add", NFS41VolumeAdd::New());
    Attach(ns, "remove", NFS41VolumeRemove::New());
    Attach(ns, "list", NFS41VolumeList::New());
    Attach(ns, "param", BuildNfs41Param());
    Attach(ns, "firewall", BuildNfs41Firewall());
    return ns;
}

NamespacePtr BuildHlfsExtent()
{
    auto ns = MakeNamespace("Manage HLFS extents.");
    Attach(ns, "list", HLFSExtentList::New());
    return ns;
}

NamespacePtr BuildHlfsSnapshotExtent()
{
    auto ns = MakeNamespace("Manage HLFS snapshot extents.");
    Attach(ns, "list", HLFSSnapshotExtentList::New());
    return ns;
}

NamespacePtr BuildHlfsSnapshot()
{
    auto ns = MakeNamespace("Manage HLFS snapshots.");
    Attach(ns, "list", HLFSSnapshotList::New());
    Attach(ns, "mount", HLFSSnapshotMount::New());
    Attach(ns, "resignature", HLFSSnapshotResignature::New());
    Attach(ns, "extent", BuildHlfsSnapshotExtent());
    return ns;
}

NamespacePtr BuildHlfsLockMode()
{
    auto ns = MakeNamespace("Manage HLFS array locking mode.");
    Attach(ns, "list", HLFSVolumeLockModeList::New());
    Attach(ns, "set", HLFSVolumeLockModeSet::New());
    return ns;
}

NamespacePtr BuildHlfsHost()
{
    auto ns = MakeNamespace("Manage hosts accessing a HLFS volume.");
    Attach(ns, "list", HLFSVolumeHostList::New());
    return ns;
}

NamespacePtr BuildHlfsPbCache()
{
    auto ns = MakeNamespace("HLFS Pointer Block Cache statistics.");
    Attach(ns, "get", HLFSPBCacheGet::New());
    Attach(ns, "reset", HLFSPBCacheReset::New());
    return ns;
}

NamespacePtr BuildHlfsReclaimConfig()
{
    auto ns = MakeNamespace("HLFS Space Reclamation Configuration Settings");
    Attach(ns, "get", HLFSReclaimConfigGet::New());
    Attach(ns, "set", HLFSReclaimConfigSet::New());
    return ns;
}

NamespacePtr BuildHlfsReclaim()
{
    auto ns = MakeNamespace("Manage HLFS Space Reclamation");
    Attach(ns, "config", BuildHlfsReclaimConfig());
    return ns;
}

NamespacePtr BuildHlfs()
{
    auto ns = MakeNamespace("HLFS operations.");
    Attach(ns, "upgrade", HLFSVolumeUpgrade::New());
    Attach(ns, "unmap", HLFSVolumeUnmap::New());
    Attach(ns, "extent", BuildHlfsExtent());
    Attach(ns, "snapshot", BuildHlfsSnapshot());
    Attach(ns, "lockmode", BuildHlfsLockMode());
    Attach(ns, "host", BuildHlfsHost());
    Attach(ns, "pbcache", BuildHlfsPbCache());
    Attach(ns, "reclaim", BuildHlfsReclaim());
    return ns;
}

NamespacePtr BuildNmpBoot()
{
    auto ns = MakeNamespace("Operations pertaining to the boot time configuration of the NMP plugin.");
    Attach(ns, "restore", OrvaneCli::Nmp::BootRestore::New());
    return ns;
}

NamespacePtr BuildNmp()
{
    auto ns = MakeNamespace("Orvane Native Multipath Plugin (NMP). This is the Orvane default implementation of the "
                            "Pluggable Storage Architecture.");
    Attach(ns, "boot", BuildNmpBoot());
    return ns;
}

NamespacePtr BuildClusteredHdsk()
{
    auto ns = MakeNamespace("Manage clustered HDSK support.");
    Attach(ns, "get", ClusteredHdskGet::New());
    Attach(ns, "set", ClusteredHdskSet::New());
    return ns;
}

} // namespace

extern "C" {

void AutoCli_RegisterNamespaces(std::shared_ptr<NamespaceNode> root)
{
    Core_RegisterInternalNamespaces(root);
}

void Core_RegisterInternalNamespaces(std::shared_ptr<NamespaceNode> root)
{
    const NamespacePtr storage = FindNamespace(root, "storage");
    NamespacePtr internal;
    if (storage->HasNamespaceNode("internal")) {
        internal = FindNamespace(storage, "internal");
    } else {
        internal = MakeNamespace("Orvane internal storage commands.");
        Attach(storage, "internal", internal);
    }
    Attach(internal, "core", MakeNamespace("Orvane core storage commands. No operations are currently internal only."));
    Nmp_RegisterInternalNamespaces(internal);
    ClusteredHdsk_RegisterInternalNamespace(internal);
}

void Nmp_RegisterInternalNamespaces(std::shared_ptr<NamespaceNode> parent)
{
    Attach(parent, "nmp", BuildNmp());
}

void ClusteredHdsk_RegisterInternalNamespace(std::shared_ptr<NamespaceNode> parent)
{
    Attach(parent, "clusteredhdsk", BuildClusteredHdsk());
}

void FilesystemNfs_RegisterNamespaces(std::shared_ptr<NamespaceNode> parent)
{
    Attach(parent, "filesystem", BuildFilesystem());
    Attach(parent, "nfs", BuildNfs());
    Attach(parent, "nfs41", BuildNfs41());
    Attach(parent, "hlfs", BuildHlfs());
}

} // extern "C"

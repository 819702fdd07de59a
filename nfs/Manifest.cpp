#include "nfs/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

// Both versions have a parameter namespace and a firewall namespace of the same shape.
NamespacePtr ParamNamespace(const char* description, NodePtr get, NodePtr set)
{
    return MakeNamespace(description, {{"get", std::move(get)}, {"set", std::move(set)}});
}

NamespacePtr FirewallNamespace(const char* description, NodePtr add, NodePtr remove, NodePtr list)
{
    return MakeNamespace(description,
                         {{"add", std::move(add)}, {"remove", std::move(remove)}, {"list", std::move(list)}});
}

NamespacePtr PreunmountStateNamespace()
{
    if (!IsFeatureEnabled(Feature::NasPreUnmount)) {
        return nullptr;
    }
    return MakeNamespace("Enter or exit preunmount state.",
                         {{"enter", NewNFSVolumePreunmountEnter()}, {"exit", NewNFSVolumePreunmountExit()}});
}

} // namespace

NamespacePtr NfsNamespace()
{
    return MakeNamespace(
        "Operations to create, manage, and remove Network Attached Storage filesystems.",
        {{"add", NewNFSVolumeAdd()},
         {"remove", NewNFSVolumeRemove()},
         {"list", NewNFSVolumeList()},
         {"preunmountstate", PreunmountStateNamespace()},
         {"param", ParamNamespace("Operations on volume parameters of NAS filesystems.", NewNFSVolumeParamGet(),
                                  NewNFSVolumeParamSet())},
         {"firewall", FirewallNamespace("Operations on IP/Mask of nfsClient firewall ruleset", NewNFSFirewallAdd(),
                                        NewNFSFirewallRemove(), NewNFSFirewallList())}});
}

NamespacePtr Nfs41Namespace()
{
    return MakeNamespace(
        "Operations to create, manage, and remove NFS v4.1 filesystems.",
        {{"add", NewNFS41VolumeAdd()},
         {"remove", NewNFS41VolumeRemove()},
         {"list", NewNFS41VolumeList()},
         {"param", ParamNamespace("Operations on volume parameters of NFS v4.1 filesystems.", NewNFS41VolumeParamGet(),
                                  NewNFS41VolumeParamSet())},
         {"firewall", FirewallNamespace("Operations on IP/Mask of nfs41Client firewall ruleset", NewNFS41FirewallAdd(),
                                        NewNFS41FirewallRemove(), NewNFS41FirewallList())}});
}

} // namespace OrvaneCli::FileSystem

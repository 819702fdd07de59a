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

// What storage nfs and storage nfs41 are made of; both versions share one layout.
struct VersionTree {
    const char* description;
    NodePtr add, remove, list;
    NamespacePtr preunmountState; // NAS only; an empty one is left out
    NamespacePtr param, firewall;
};

NamespacePtr VersionNamespace(const VersionTree& tree)
{
    return MakeNamespace(tree.description, {{"add", tree.add},
                                            {"remove", tree.remove},
                                            {"list", tree.list},
                                            {"preunmountstate", tree.preunmountState},
                                            {"param", tree.param},
                                            {"firewall", tree.firewall}});
}

} // namespace

NamespacePtr NfsNamespace()
{
    return VersionNamespace({"Operations to create, manage, and remove Network Attached Storage filesystems.",
                             NewNFSVolumeAdd(), NewNFSVolumeRemove(), NewNFSVolumeList(), PreunmountStateNamespace(),
                             ParamNamespace("Operations on volume parameters of NAS filesystems.",
                                            NewNFSVolumeParamGet(), NewNFSVolumeParamSet()),
                             FirewallNamespace("Operations on IP/Mask of nfsClient firewall ruleset",
                                               NewNFSFirewallAdd(), NewNFSFirewallRemove(), NewNFSFirewallList())});
}

NamespacePtr Nfs41Namespace()
{
    return VersionNamespace(
        {"Operations to create, manage, and remove NFS v4.1 filesystems.", NewNFS41VolumeAdd(), NewNFS41VolumeRemove(),
         NewNFS41VolumeList(), nullptr,
         ParamNamespace("Operations on volume parameters of NFS v4.1 filesystems.", NewNFS41VolumeParamGet(),
                        NewNFS41VolumeParamSet()),
         FirewallNamespace("Operations on IP/Mask of nfs41Client firewall ruleset", NewNFS41FirewallAdd(),
                           NewNFS41FirewallRemove(), NewNFS41FirewallList())});
}

} // namespace OrvaneCli::FileSystem

#include "nfs/Manifest.h"

namespace OrvaneCli::FileSystem {

NamespacePtr NfsNamespace()
{
    auto preunmountState = [] {
        return MakeNamespace("Enter or exit preunmount state.", {
                                                                    {"enter", NewNFSVolumePreunmountEnter()},
                                                                    {"exit", NewNFSVolumePreunmountExit()},
                                                                });
    };
    return MakeNamespace(
        "Operations to create, manage, and remove Network Attached Storage filesystems.",
        {
            {"add", NewNFSVolumeAdd()},
            {"remove", NewNFSVolumeRemove()},
            {"list", NewNFSVolumeList()},
            {"preunmountstate", IsFeatureEnabled(Feature::NasPreUnmount) ? preunmountState() : nullptr},
            {"param", MakeNamespace("Operations on volume parameters of NAS filesystems.",
                                    {{"get", NewNFSVolumeParamGet()}, {"set", NewNFSVolumeParamSet()}})},
            {"firewall", MakeNamespace("Operations on IP/Mask of nfsClient firewall ruleset",
                                       {
                                           {"add", NewNFSFirewallAdd()},
                                           {"remove", NewNFSFirewallRemove()},
                                           {"list", NewNFSFirewallList()},
                                       })},
        });
}

NamespacePtr Nfs41Namespace()
{
    return MakeNamespace(
        "Operations to create, manage, and remove NFS v4.1 filesystems.",
        {
            {"add", NewNFS41VolumeAdd()},
            {"remove", NewNFS41VolumeRemove()},
            {"list", NewNFS41VolumeList()},
            {"param", MakeNamespace("Operations on volume parameters of NFS v4.1 filesystems.",
                                    {{"get", NewNFS41VolumeParamGet()}, {"set", NewNFS41VolumeParamSet()}})},
            {"firewall", MakeNamespace("Operations on IP/Mask of nfs41Client firewall ruleset",
                                       {
                                           {"add", NewNFS41FirewallAdd()},
                                           {"remove", NewNFS41FirewallRemove()},
                                           {"list", NewNFS41FirewallList()},
                                       })},
        });
}

} // namespace OrvaneCli::FileSystem

#include "internal/Manifest.h"

namespace OrvaneCli::FileSystem {

NamespacePtr NmpNamespace()
{
    return MakeNamespace("Orvane Native Multipath Plugin (NMP). This is the Orvane default implementation of the "
                         "Pluggable Storage Architecture.",
                         {{"boot", MakeNamespace("Operations pertaining to the boot time configuration of the NMP "
                                                 "plugin.",
                                                 {{"restore", NewBootRestore()}})}});
}

NamespacePtr ClusteredHdskNamespace()
{
    return MakeNamespace("Manage clustered HDSK support.",
                         {{"get", NewClusteredHdskGet()}, {"set", NewClusteredHdskSet()}});
}

} // namespace OrvaneCli::FileSystem

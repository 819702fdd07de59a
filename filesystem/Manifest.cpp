#include "filesystem/Manifest.h"

namespace OrvaneCli::FileSystem {

NamespacePtr FilesystemNamespace()
{
    return MakeNamespace("Operations pertaining to filesystems, also known as datastores, on the Zephal host.",
                         {
                             {"list", NewVolumeList()},
                             {"rescan", NewVolumeRescan()},
                             {"mount", NewVolumeMount()},
                             {"unmount", NewVolumeUnmount()},
                             {"automount", NewVolumeAutomount()},
                         });
}

} // namespace OrvaneCli::FileSystem

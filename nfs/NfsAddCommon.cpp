#include "nfs/NfsAddCommon.h"

namespace OrvaneCli::FileSystem {

std::string NoNewVolumeMessage(const std::string& volumeName)
{
    return HostCtl::Misc::StrCat("The host did not return the new volume '", volumeName, "'");
}

bool ConfigureAndMount(StorageInfoImpl& storage, NetworkFileSystem& volume, const std::string& volumeName,
                       bool readOnly, bool isPE, unsigned flags, OnMountFailure onFailure, const OutputPtr& out)
{
    volume.SetReadOnly(readOnly);
    volume.SetPE(isPE);
    try {
        volume.Mount(flags);
        return true;
    } catch (const HostCtlException& mountFailure) {
        if (onFailure == OnMountFailure::KeepDefinition) {
            throw;
        }
        // The mount's reason comes first: it is why the user's request failed. A failed
        // clean-up is reported as well, since the definition then stays on the host.
        out->AddErrorMessage(mountFailure.message);
        Guarded(out, [&] { storage.RemoveNetworkFileSystem(volumeName); });
        return false;
    }
}

} // namespace OrvaneCli::FileSystem

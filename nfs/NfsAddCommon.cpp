#include "nfs/NfsAddCommon.h"

namespace OrvaneCli::FileSystem {

ParameterDecl ServerParameter(const char* name, ParameterType type, const char* description, Feature binding)
{
    return {.name = name, .shortName = "H", .type = type, .description = description, .requiredUnless = binding};
}

ParameterDecl ServerKnxnicParameter(ParameterType type, const char* description, Feature binding)
{
    return {.name = kOptionHostKnxnic, .shortName = "I", .type = type, .description = description, .feature = binding};
}

ParameterDecl ShareParameter(const char* kind)
{
    return {NfsAddArg::kShare, "s", ParameterType::String,
            HostCtl::Misc::StrCat("The share name on the remote system to use for this ", kind, " mount point."), true};
}

ParameterDecl VolumeNameParameter(const char* kind, const char* others)
{
    return {kOptionVolumeName, "v", ParameterType::String,
            HostCtl::Misc::StrCat("The volume name to use for the ", kind,
                                  " mount.  This must be a unique volume name and cannot conflict with existing ",
                                  others, " volume names."),
            true};
}

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

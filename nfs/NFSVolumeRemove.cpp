#include <string>

#include "command/StorageCommand.h"
#include "nfs/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

using HostCtl::Storage::NfsVersion;

// storage nfs remove, storage nfs41 remove: removes the volume of that version, telling the
// datastore notification script before, and again when the removal failed (after the
// failure's message).
template <NfsVersion kVersion>
class NfsVolumeRemove final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const std::string volumeName = in->GetParameter(kOptionVolumeName);
        const bool removed = WithStorageInfo(StorageInfoPlacement::OutsideGuard, out, [&](StorageInfoImpl&) {
            NotifyDatastore(kNotifyPreUnmount, volumeName);
            // The version-checked removal is a class operation; it needs no storage object.
            StorageInfoImpl::RemoveNetworkFileSystem(volumeName, kVersion);
            out->SetRootObject(MetaBool::New(true));
        });
        if (!removed) {
            NotifyDatastore(kNotifyFailedUnmount, volumeName);
        }
    }
};

CommandDecl RemoveDecl(const char* description, const char* volumeName)
{
    return {.description = description,
            .parameters = {{kOptionVolumeName, "v", ParameterType::String, volumeName, true}}};
}

} // namespace

NodePtr NewNFSVolumeRemove()
{
    return New<NfsVolumeRemove<HostCtl::Storage::NFS_VERSION_3>>(
        RemoveDecl("Remove an existing NAS volume from the Zephal host.",
                   "The volume name of the NAS volume to remove from the Zephal host."));
}

NodePtr NewNFS41VolumeRemove()
{
    return New<NfsVolumeRemove<HostCtl::Storage::NFS_VERSION_41>>(
        RemoveDecl("Remove an existing NFS v4.1 volume from the Zephal host.",
                   "The volume name of the NFS v4.1 volume to remove from the Zephal host."));
}

} // namespace OrvaneCli::FileSystem

#include <string>

#include "command/StorageCommand.h"
#include "nfs/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

// Removes the volume of one NFS version, telling the datastore notification script before,
// and again when the removal failed (after the failure's message).
class NfsRemoveCommand : public StorageCommand {
protected:
    NfsRemoveCommand(const char* description, const char* volumeName, HostCtl::Storage::NfsVersion version)
        : StorageCommand({.description = description,
                          .parameters = {{kOptionVolumeName, "v", ParameterType::String, volumeName, true}}}),
          version_(version)
    {
    }

private:
    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const std::string volumeName = in->GetParameter(kOptionVolumeName);
        const bool removed = WithStorageInfo(StorageInfoPlacement::OutsideGuard, out, [&](StorageInfoImpl&) {
            NotifyDatastore(kNotifyPreUnmount, volumeName);
            // The version-checked removal is a class operation; it needs no storage object.
            StorageInfoImpl::RemoveNetworkFileSystem(volumeName, version_);
            out->SetRootObject(MetaBool::New(true));
        });
        if (!removed) {
            NotifyDatastore(kNotifyFailedUnmount, volumeName);
        }
    }

    HostCtl::Storage::NfsVersion version_;
};

// storage nfs remove
class NFSVolumeRemove final : public NfsRemoveCommand {
public:
    NFSVolumeRemove()
        : NfsRemoveCommand("Remove an existing NAS volume from the Zephal host.",
                           "The volume name of the NAS volume to remove from the Zephal host.",
                           HostCtl::Storage::NFS_VERSION_3)
    {
    }
};

// storage nfs41 remove
class NFS41VolumeRemove final : public NfsRemoveCommand {
public:
    NFS41VolumeRemove()
        : NfsRemoveCommand("Remove an existing NFS v4.1 volume from the Zephal host.",
                           "The volume name of the NFS v4.1 volume to remove from the Zephal host.",
                           HostCtl::Storage::NFS_VERSION_41)
    {
    }
};

} // namespace

NodePtr NewNFSVolumeRemove() { return New<NFSVolumeRemove>(); }
NodePtr NewNFS41VolumeRemove() { return New<NFS41VolumeRemove>(); }

} // namespace OrvaneCli::FileSystem

#include "nfs/NFSVolumeRemove.h"

#include <string>

#include "hlfs/HlfsVolumeSelection.h"

namespace OrvaneCli::FileSystem {

namespace {

std::shared_ptr<InputSpec> RemoveInputSpec(const char* volumeNameDescription)
{
    auto inputs = InputSpec::New();
    AddParameter(inputs, {kOptionVolumeName, "v", ParameterType::String, volumeNameDescription, true});
    return inputs;
}

// Removes the volume of that name and version, telling the datastore notification script
// before, and again when the removal failed (after the failure's message).
void RemoveVolume(const InputPtr& in, const OutputPtr& out, HostCtl::Storage::NfsVersion version)
{
    const std::string volumeName = in->GetParameter(kOptionVolumeName);
    const bool removed = WithStorageInfo(StorageInfoPlacement::OutsideGuard, out, [&](StorageInfoImpl&) {
        NotifyDatastore("PreUnmount", volumeName);
        // The version-checked removal is a class operation; it needs no storage object.
        StorageInfoImpl::RemoveNetworkFileSystem(volumeName, version);
        out->SetRootObject(MetaBool::New(true));
    });
    if (!removed) {
        NotifyDatastore("FailedUnmount", volumeName);
    }
}

} // namespace

std::shared_ptr<NFSVolumeRemove> NFSVolumeRemove::New()
{
    return std::shared_ptr<NFSVolumeRemove>(new NFSVolumeRemove());
}

NFSVolumeRemove::NFSVolumeRemove() { SetDescription("Remove an existing NAS volume from the Zephal host."); }

NFSVolumeRemove::~NFSVolumeRemove() = default;

std::shared_ptr<InputSpec> NFSVolumeRemove::GetInputSpecInternal()
{
    return RemoveInputSpec("The volume name of the NAS volume to remove from the Zephal host.");
}

std::shared_ptr<OutputSpec> NFSVolumeRemove::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void NFSVolumeRemove::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    RemoveVolume(in, out, HostCtl::Storage::NFS_VERSION_3);
}

std::shared_ptr<NFS41VolumeRemove> NFS41VolumeRemove::New()
{
    return std::shared_ptr<NFS41VolumeRemove>(new NFS41VolumeRemove());
}

NFS41VolumeRemove::NFS41VolumeRemove() { SetDescription("Remove an existing NFS v4.1 volume from the Zephal host."); }

NFS41VolumeRemove::~NFS41VolumeRemove() = default;

std::shared_ptr<InputSpec> NFS41VolumeRemove::GetInputSpecInternal()
{
    return RemoveInputSpec("The volume name of the NFS v4.1 volume to remove from the Zephal host.");
}

std::shared_ptr<OutputSpec> NFS41VolumeRemove::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void NFS41VolumeRemove::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    RemoveVolume(in, out, HostCtl::Storage::NFS_VERSION_41);
}

} // namespace OrvaneCli::FileSystem

#include "filesystem/VolumeMount.h"

#include "hlfs/HlfsVolumeSelection.h"

namespace OrvaneCli::FileSystem {

namespace {

using HostCtl::Storage::FileSystem;
using FileSystemPtr = std::unique_ptr<HostCtl::Storage::FileSystem>;
const char* const kVolumePath = "volume-path";
const char* const kUnmountAllHlfs = "unmount-all-hlfs";

const char* const kPreUnmount = "PreUnmount";
const char* const kFailedUnmount = "FailedUnmount";

// An unmount status of 1: the volume is in use and stayed mounted.
constexpr int kUnmountBusy = 1;

FileSystem::MountOperationOption MountOption(const InputPtr& in)
{
    return in->IsFlagSet(kOptionNoPersist) ? FileSystem::MOUNT_UNTIL_RESTART : FileSystem::MOUNT_PERSISTENT;
}

std::string BusyMessage(const std::string& name) { return "Volume '" + name + "' cannot be unmounted. Reason: Busy"; }

std::string UuidNotFound(const std::string& uuid) { return "No volume with uuid '" + uuid + "' was found"; }

std::string LabelNotFound(const std::string& label) { return "No volume with label '" + label + "' was found"; }

// The volume picked by the single-volume unmount and the name its messages use.
struct Selection {
    FileSystemPtr volume;
    std::string name;
};

// Applies the unmount selection rules; on failure the message is on `out` and no volume is set.
Selection SelectVolumeToUnmount(StorageInfoImpl& storage, const std::string& label, const std::string& path,
                                const std::string& uuid, const OutputPtr& out)
{
    Selection selection;
    if (IsGiven(uuid) && (IsGiven(label) || IsGiven(path))) {
        out->AddErrorMessage("A target volume specified by uuid cannot also be specified by path or label");
    } else if (IsGiven(label) && IsGiven(path)) {
        out->AddErrorMessage("A target volume specified by label cannot also be specified by path");
    } else if (IsGiven(label)) {
        selection.name = label;
        selection.volume = storage.GetFileSystemByLabel(label);
        if (!selection.volume) {
            out->AddErrorMessage(LabelNotFound(label));
        }
    } else if (IsGiven(path)) {
        selection.name = path;
        selection.volume = storage.GetFileSystemByPath(path);
        if (!selection.volume) {
            out->AddErrorMessage("No NAS volume was found mounted on '" + path + "'");
        }
    } else if (IsGiven(uuid)) {
        selection.name = uuid;
        selection.volume = storage.GetFileSystemByUUID(uuid);
        if (!selection.volume) {
            out->AddErrorMessage(UuidNotFound(uuid));
        }
    } else {
        out->AddErrorMessage("A target volume must be specified by either label, by path, or by uuid.");
    }
    return selection;
}

void UnmountOne(StorageInfoImpl& storage, FileSystem& volume, const std::string& name,
                FileSystem::MountOperationOption option, const OutputPtr& out)
{
    try {
        if (!volume.IsMounted()) {
            out->AddErrorMessage("Volume '" + name + "' is not mounted");
            return;
        }
        volume.PrepareUnmount();
        storage.SignalIORM(true);
        NotifyDatastore(kPreUnmount, volume.GetVolumeName());
        if (volume.Unmount(option) == kUnmountBusy) {
            out->AddErrorMessage(BusyMessage(name));
            NotifyDatastore(kFailedUnmount, volume.GetVolumeName());
            return;
        }
        out->SetRootObject(MetaBool::New(true));
    } catch (const HostCtlException& e) {
        const std::string failure = e.message;
        std::string volumeName;
        try {
            volumeName = volume.GetVolumeName();
        } catch (const HostCtlException&) {
            // The volume cannot even be named: keep the first failure, the envelope reports the second.
            out->AddErrorMessage(failure);
            throw;
        }
        NotifyDatastore(kFailedUnmount, volumeName);
        out->AddErrorMessage(failure);
    }
}

void UnmountAllHlfs(StorageInfoImpl& storage, FileSystem::MountOperationOption option, const OutputPtr& out)
{
    std::vector<FileSystemPtr> toUnmount;
    std::string names;
    {
        auto listed = storage.GetHlfsFileSystems(HostCtl::emptyString);
        for (const auto& hlfs : listed) {
            Guarded(out, [&] {
                const std::string volumeName = hlfs->GetVolumeName();
                const std::string uuid = hlfs->GetUuid();
                auto volume = storage.GetFileSystemByUUID(uuid);
                if (!volume) {
                    // Gone since it was listed: nothing to unmount.
                    out->AddErrorMessage(UuidNotFound(uuid));
                    return;
                }
                if (!volume->IsMounted()) {
                    return;
                }
                volume->PrepareUnmount();
                if (!toUnmount.empty()) {
                    names += ",";
                }
                names += volumeName;
                toUnmount.push_back(std::move(volume));
            });
        }
    }

    storage.SignalIORM(true);
    NotifyDatastore(kPreUnmount, names);

    for (const auto& volume : toUnmount) {
        // A volume that cannot even be named after its failure is reported and passed over.
        Guarded(out, [&] {
            try {
                if (volume->Unmount(option) == kUnmountBusy) {
                    out->AddErrorMessage(BusyMessage(volume->GetName()));
                    NotifyDatastore(kFailedUnmount, volume->GetVolumeName());
                }
            } catch (const HostCtlException& e) {
                out->AddErrorMessage(e.message);
                NotifyDatastore(kFailedUnmount, volume->GetVolumeName());
            }
        });
    }
    // Volumes that stayed mounted have their messages beside the result.
    out->SetRootObject(MetaBool::New(true));
}

} // namespace

// ---- storage filesystem mount ----

std::shared_ptr<VolumeMount> VolumeMount::New() { return std::shared_ptr<VolumeMount>(new VolumeMount()); }

VolumeMount::VolumeMount() { SetDescription("Connect to and mount an unmounted volume on the Zephal host."); }

VolumeMount::~VolumeMount() = default;

std::shared_ptr<InputSpec> VolumeMount::GetInputSpecInternal()
{
    auto inputs = InputSpec::New();
    AddParameter(inputs, {kOptionVolumeLabel, "l", ParameterType::String,
                        "The label of the volume to mount. This volume must be unmounted for this operation to "
                        "succeed."});
    AddParameter(inputs, {kOptionVolumeUuid, "u", ParameterType::String,
                        "The UUID of the HLFS filesystem to mount. This volume must be unmounted for this operation "
                        "to succeed."});
    AddParameter(inputs, {kOptionNoPersist, "n", ParameterType::Flag,
                        "Mount the volume non-persistently; the volume will not be mounted after a restart."});
    return inputs;
}

std::shared_ptr<OutputSpec> VolumeMount::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void VolumeMount::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const std::string uuid = in->GetParameter(kOptionVolumeUuid);
    const std::string label = in->GetParameter(kOptionVolumeLabel);
    StorageInfoImpl storage;
    const FileSystem::MountOperationOption option = MountOption(in);

    // The host's own attempt comes first and stands outside the error handling: when it
    // mounts the volume, the selection is not checked at all.
    if (storage.TryMount(option, uuid, label)) {
        out->SetRootObject(MetaBool::New(true));
        return;
    }

    Guarded(out, [&] {
        FileSystemPtr volume;
        std::string name;
        if (IsGiven(uuid) && IsGiven(label)) {
            out->AddErrorMessage("A target volume specified by uuid cannot also be specified by label");
            return;
        }
        if (IsGiven(uuid)) {
            name = uuid;
            volume = storage.GetFileSystemByUUID(uuid);
            if (!volume) {
                out->AddErrorMessage(UuidNotFound(uuid));
                return;
            }
        } else if (!IsGiven(label)) {
            out->AddErrorMessage("A target volume must be specified by volume uuid or volume label");
            return;
        } else {
            name = label;
            volume = storage.GetFileSystemByLabel(label);
            if (!volume) {
                out->AddErrorMessage(LabelNotFound(label));
                return;
            }
        }
        if (volume->IsMounted()) {
            out->AddErrorMessage("Volume '" + name + "' is already mounted");
            return;
        }
        volume->Mount(option);
        out->SetRootObject(MetaBool::New(true));
    });
}

// ---- storage filesystem unmount ----

std::shared_ptr<VolumeUnmount> VolumeUnmount::New() { return std::shared_ptr<VolumeUnmount>(new VolumeUnmount()); }

VolumeUnmount::VolumeUnmount()
{
    SetDescription("Disconnect and unmount and existing HLFS or NAS volume. This will not delete the configuration "
                   "for the volume, but will remove the volume from the list of mounted volumes.");
}

VolumeUnmount::~VolumeUnmount() = default;

std::shared_ptr<InputSpec> VolumeUnmount::GetInputSpecInternal()
{
    auto inputs = InputSpec::New();
    AddParameter(inputs, {kOptionVolumeLabel, "l", ParameterType::String, "The label of the volume to unmount."});
    AddParameter(inputs, {kVolumePath, "p", ParameterType::String, "The path of the volume to unmount."});
    AddParameter(inputs, {kOptionVolumeUuid, "u", ParameterType::String, "The uuid of the volume to unmount."});
    AddParameter(inputs, {kOptionNoPersist, "n", ParameterType::Flag,
                        "Unmount the volume non-persistently; the volume will be automounted after a restart."});
    AddParameter(inputs, {kUnmountAllHlfs, "a", ParameterType::Flag, "Unmount all hlfs volumes."});
    return inputs;
}

std::shared_ptr<OutputSpec> VolumeUnmount::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void VolumeUnmount::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const std::string label = in->GetParameter(kOptionVolumeLabel);
    const std::string path = in->GetParameter(kVolumePath);
    const std::string uuid = in->GetParameter(kOptionVolumeUuid);
    const FileSystem::MountOperationOption option = MountOption(in);
    const bool all = in->IsFlagSet(kUnmountAllHlfs);

    WithStorageInfo(StorageInfoPlacement::OutsideGuard, out, [&](StorageInfoImpl& storage) {
        if (all) {
            // The single-volume selectors play no part here.
            UnmountAllHlfs(storage, option, out);
            return;
        }
        Selection selection = SelectVolumeToUnmount(storage, label, path, uuid, out);
        if (selection.volume) {
            UnmountOne(storage, *selection.volume, selection.name, option, out);
        }
    });
}

} // namespace OrvaneCli::FileSystem

#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "filesystem/Manifest.h"
#include "filesystem/MountCommon.h"

namespace OrvaneCli::FileSystem {

namespace {

using namespace Mounting;
using FileSystem = HostFileSystem;

const char* const kVolumePath = "volume-path";
const char* const kUnmountAllHlfs = "unmount-all-hlfs";

const char* const kPreUnmount = kNotifyPreUnmount;
const char* const kFailedUnmount = kNotifyFailedUnmount;

// An unmount status of 1: the volume is in use and stayed mounted.
constexpr int kUnmountBusy = 1;

std::string BusyMessage(const std::string& name) { return "Volume '" + name + "' cannot be unmounted. Reason: Busy"; }

std::string UuidNotFound(const std::string& uuid) { return HostCtl::Misc::StrPrintf(kUuidNotFound, uuid.c_str()); }

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
    const auto chosen = ExactlyOneOf(
        {
            {IsGiven(uuid), "A target volume specified by uuid cannot also be specified by path or label"},
            {IsGiven(label), "A target volume specified by label cannot also be specified by path"},
            {IsGiven(path), nullptr},
        },
        "A target volume must be specified by either label, by path, or by uuid.", out);
    if (chosen == std::size_t{0}) {
        selection.name = uuid;
        selection.volume = storage.GetFileSystemByUUID(uuid);
        if (!selection.volume) {
            out->AddErrorMessage(UuidNotFound(uuid));
        }
    } else if (chosen == std::size_t{1}) {
        selection.name = label;
        selection.volume = storage.GetFileSystemByLabel(label);
        if (!selection.volume) {
            out->AddErrorMessage(HostCtl::Misc::StrPrintf(kLabelNotFound, label.c_str()));
        }
    } else if (chosen == std::size_t{2}) {
        selection.name = path;
        selection.volume = storage.GetFileSystemByPath(path);
        if (!selection.volume) {
            out->AddErrorMessage("No NAS volume was found mounted on '" + path + "'");
        }
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

const CommandDecl kDecl = {
    .description = "Disconnect and unmount and existing HLFS or NAS volume. This will not delete the configuration "
                   "for the volume, but will remove the volume from the list of mounted volumes.",
    .parameters = {LabelParameter("The label of the volume to unmount."),
                   {kVolumePath, "p", ParameterType::String, "The path of the volume to unmount."},
                   UuidParameter("The uuid of the volume to unmount."),
                   {kOptionNoPersist, "n", ParameterType::Flag,
                    "Unmount the volume non-persistently; the volume will be automounted after a restart."},
                   {kUnmountAllHlfs, "a", ParameterType::Flag, "Unmount all hlfs volumes."}}};

// storage filesystem unmount
class VolumeUnmount final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
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
};

} // namespace

NodePtr NewVolumeUnmount() { return New<VolumeUnmount>(kDecl); }

} // namespace OrvaneCli::FileSystem

#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "filesystem/Manifest.h"
#include "filesystem/MountCommon.h"

namespace OrvaneCli::FileSystem {

namespace {

using namespace Mounting;

const VolumeSelectorTexts kTexts = {
    "A target volume specified by uuid cannot also be specified by label",
    "A target volume must be specified by volume uuid or volume label",
    kLabelNotFound,
    kUuidNotFound,
};

const CommandDecl kDecl = {
    .description = "Connect to and mount an unmounted volume on the Zephal host.",
    .parameters = {
        LabelParameter(
            "The label of the volume to mount. This volume must be unmounted for this operation to succeed."),
        UuidParameter("The UUID of the HLFS filesystem to mount. This volume must be unmounted for this operation "
                      "to succeed."),
        {kOptionNoPersist, "n", ParameterType::Flag,
         "Mount the volume non-persistently; the volume will not be mounted after a restart."}}};

// storage filesystem mount
class VolumeMount final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const std::string uuid = in->GetParameter(kOptionVolumeUuid);
        const std::string label = in->GetParameter(kOptionVolumeLabel);
        WithStorageInfo(StorageInfoPlacement::Unguarded, out, [&](StorageInfoImpl& storage) {
            const HostFileSystem::MountOperationOption option = MountOption(in);
            // The host's own attempt comes first and stands outside the error handling: when it
            // mounts the volume, the selection is not checked at all.
            if (storage.TryMount(option, uuid, label)) {
                out->SetRootObject(MetaBool::New(true));
                return;
            }
            Guarded(out, [&] { MountChosen(storage, option, in, out); });
        });
    }

    static void MountChosen(StorageInfoImpl& storage, HostFileSystem::MountOperationOption option, const InputPtr& in,
                            const OutputPtr& out)
    {
        const auto choice = ChooseVolume(in, kTexts, out);
        if (!choice) {
            return;
        }
        const FileSystemPtr volume = FindVolume(*choice, kTexts, out, [&](const VolumeChoice& c) {
            return c.ByUuid() ? storage.GetFileSystemByUUID(c.value) : storage.GetFileSystemByLabel(c.value);
        });
        if (!volume) {
            return;
        }
        if (volume->IsMounted()) {
            out->AddErrorMessage("Volume '" + choice->value + "' is already mounted");
            return;
        }
        volume->Mount(option);
        out->SetRootObject(MetaBool::New(true));
    }
};

} // namespace

NodePtr NewVolumeMount() { return New<VolumeMount>(kDecl); }

} // namespace OrvaneCli::FileSystem

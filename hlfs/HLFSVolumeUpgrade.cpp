#include "command/StorageCommand.h"
#include "hlfs/ChosenVolume.h"
#include "hlfs/Manifest.h"

namespace OrvaneCli::FileSystem {

const VolumeSelectorTexts kChosenVolumeTexts = {
    "You cannot specify both uuid and volume label as target. Please specify only one of these",
    "A target HLFS volume must be specified either by label or uuid.",
    "Cannot find HLFS volume with label %s",
    "Cannot find HLFS volume with uuid %s",
};

namespace {

const CommandDecl kHLFSVolumeUpgradeDecl = {.description = "Upgrade a HLFS3 volume to HLFS5.",
                                            .parameters = {LabelParameter("The label of the HLFS volume to upgrade."),
                                                           UuidParameter("The uuid of the HLFS volume to upgrade.")}};

// storage hlfs upgrade
class HLFSVolumeUpgrade final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        WithChosenVolume(in, out, [&](HlFileSystemImpl& volume, const std::string&) {
            // What can be converted is the host's decision; it refuses with its own message.
            volume.ConvertToVersion5();
            out->SetRootObject(MetaBool::New(true));
        });
    }
};

} // namespace

NodePtr NewHLFSVolumeUpgrade() { return New<HLFSVolumeUpgrade>(kHLFSVolumeUpgradeDecl); }

} // namespace OrvaneCli::FileSystem

#include "command/StorageCommand.h"
#include "filesystem/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

// storage filesystem automount
class VolumeAutomount final : public HostActionCommand {
    using HostActionCommand::HostActionCommand;

    void Act(StorageInfoImpl& storage) override { storage.AutoFullMountVolumes(); }
};

} // namespace

NodePtr NewVolumeAutomount()
{
    return New<VolumeAutomount>("Request mounting of known datastores not explicitly unmounted.",
                                StorageInfoPlacement::OutsideGuard);
}

} // namespace OrvaneCli::FileSystem

#include "command/StorageCommand.h"
#include "filesystem/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

// storage filesystem rescan
class VolumeRescan final : public HostActionCommand {
    using HostActionCommand::HostActionCommand;

    void Act(StorageInfoImpl& storage) override { storage.RescanHlfs(); }
};

} // namespace

NodePtr NewVolumeRescan()
{
    return New<VolumeRescan>("Scan storage devices for new mountable filesystems.", StorageInfoPlacement::OutsideGuard);
}

} // namespace OrvaneCli::FileSystem

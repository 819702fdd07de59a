#include "command/StorageCommand.h"
#include "filesystem/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

// storage filesystem rescan
class VolumeRescan final : public HostActionCommand {
public:
    VolumeRescan()
        : HostActionCommand(
              "Scan storage devices for new mountable filesystems.",
              [](StorageInfoImpl& storage) { storage.RescanHlfs(); }, StorageInfoPlacement::OutsideGuard)
    {
    }
};

} // namespace

NodePtr NewVolumeRescan() { return New<VolumeRescan>(); }

} // namespace OrvaneCli::FileSystem

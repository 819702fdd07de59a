#include "command/StorageCommand.h"
#include "filesystem/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

// storage filesystem automount
class VolumeAutomount final : public HostActionCommand {
public:
    VolumeAutomount()
        : HostActionCommand(
              "Request mounting of known datastores not explicitly unmounted.",
              [](StorageInfoImpl& storage) { storage.AutoFullMountVolumes(); }, StorageInfoPlacement::OutsideGuard)
    {
    }
};

} // namespace

NodePtr NewVolumeAutomount() { return New<VolumeAutomount>(); }

} // namespace OrvaneCli::FileSystem

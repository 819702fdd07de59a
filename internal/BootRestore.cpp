#include "command/StorageCommand.h"
#include "internal/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

// storage internal nmp boot restore: run while the host boots.
class BootRestore final : public StorageCommand {
public:
    BootRestore() : StorageCommand({"Used to restore configuration state at boot time."}) { SetName("restore"); }

private:
    void Run(const InputPtr&, const OutputPtr& out) override
    {
        WithStorageInfo(StorageInfoPlacement::InsideGuard, out,
                        [](StorageInfoImpl& storage) { storage.RestorePsaConfig(); });
        // Boot goes on whatever the restore did: the result is true even beside a host message.
        out->SetRootObject(MetaBool::New(true));
    }
};

} // namespace

NodePtr NewBootRestore() { return New<BootRestore>(); }

} // namespace OrvaneCli::FileSystem

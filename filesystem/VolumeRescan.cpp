#include "filesystem/VolumeRescan.h"

namespace OrvaneCli::FileSystem {

std::shared_ptr<VolumeRescan> VolumeRescan::New() { return std::shared_ptr<VolumeRescan>(new VolumeRescan()); }

VolumeRescan::VolumeRescan() { SetDescription("Scan storage devices for new mountable filesystems."); }

VolumeRescan::~VolumeRescan() = default;

std::shared_ptr<InputSpec> VolumeRescan::GetInputSpecInternal() { return InputSpec::New(); }

std::shared_ptr<OutputSpec> VolumeRescan::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void VolumeRescan::ExecuteInternal(const InputPtr&, const OutputPtr& out)
{
    WithStorageInfo(StorageInfoPlacement::OutsideGuard, out, [&](StorageInfoImpl& storage) {
        storage.RescanHlfs();
        out->SetRootObject(MetaBool::New(true));
    });
}

std::shared_ptr<VolumeAutomount> VolumeAutomount::New()
{
    return std::shared_ptr<VolumeAutomount>(new VolumeAutomount());
}

VolumeAutomount::VolumeAutomount() { SetDescription("Request mounting of known datastores not explicitly unmounted."); }

VolumeAutomount::~VolumeAutomount() = default;

std::shared_ptr<InputSpec> VolumeAutomount::GetInputSpecInternal() { return InputSpec::New(); }

std::shared_ptr<OutputSpec> VolumeAutomount::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void VolumeAutomount::ExecuteInternal(const InputPtr&, const OutputPtr& out)
{
    WithStorageInfo(StorageInfoPlacement::OutsideGuard, out, [&](StorageInfoImpl& storage) {
        storage.AutoFullMountVolumes();
        out->SetRootObject(MetaBool::New(true));
    });
}

} // namespace OrvaneCli::FileSystem

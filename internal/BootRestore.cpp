#include "internal/BootRestore.h"

namespace OrvaneCli::Nmp {

using FileSystem::BooleanOutputSpec;
using FileSystem::MetaBool;
using FileSystem::StorageInfoImpl;
using FileSystem::StorageInfoPlacement;
using FileSystem::WithStorageInfo;

std::shared_ptr<BootRestore> BootRestore::New() { return std::shared_ptr<BootRestore>(new BootRestore()); }

BootRestore::BootRestore()
{
    SetDescription("Used to restore configuration state at boot time.");
    SetName("restore");
}

BootRestore::~BootRestore() = default;

std::shared_ptr<InputSpec> BootRestore::GetInputSpecInternal() { return InputSpec::New(); }

std::shared_ptr<OutputSpec> BootRestore::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void BootRestore::ExecuteInternal(const InputPtr&, const OutputPtr& out)
{
    WithStorageInfo(StorageInfoPlacement::InsideGuard, out,
                    [](StorageInfoImpl& storage) { storage.RestorePsaConfig(); });
    // Boot goes on whatever the restore did: the result is true even beside a host message.
    out->SetRootObject(MetaBool::New(true));
}

} // namespace OrvaneCli::Nmp

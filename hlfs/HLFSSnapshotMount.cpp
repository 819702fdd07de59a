#include "command/StorageCommand.h"
#include "hlfs/Manifest.h"
#include "hlfs/SnapshotCommon.h"

namespace OrvaneCli::FileSystem {

namespace {

const CommandDecl kHLFSSnapshotMountDecl = {
    .description = "Mount a snapshot/replica of a HLFS volume.",
    .parameters = SnapshotParameters(
        "the snapshot to mount",
        {{kOptionNoPersist, "n", ParameterType::Flag,
          "Mount the volume non-persistently; the volume will not be automounted after a restart."}})};

// storage hlfs snapshot mount
class HLFSSnapshotMount final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const bool persistent = !in->IsFlagSet(kOptionNoPersist);
        // No CanResolve check first: a copy that cannot be mounted fails in the host.
        ResolveMatchingSnapshots(in, out, [&](UnresolvedHlfsVolumeImpl& volume) { volume.Mount(false, persistent); });
    }
};

} // namespace

NodePtr NewHLFSSnapshotMount() { return New<HLFSSnapshotMount>(kHLFSSnapshotMountDecl); }

} // namespace OrvaneCli::FileSystem

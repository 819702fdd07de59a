#include "command/StorageCommand.h"
#include "hlfs/Manifest.h"
#include "hlfs/SnapshotCommon.h"

namespace OrvaneCli::FileSystem {

namespace {

const CommandDecl kHLFSSnapshotResignatureDecl = {.description = "Resignature a snapshot/replica of a HLFS volume.",
                                                  .parameters = SnapshotParameters("the snapshot to resignature")};

// storage hlfs snapshot resignature
class HLFSSnapshotResignature final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        ResolveMatchingSnapshots(in, out, [&](UnresolvedHlfsVolumeImpl& volume) {
            unsigned code = 0;
            if (volume.CanResolve(false, false, &code)) {
                volume.Resignature();
            } else {
                // A refused copy still counts as found; the walk goes on with the next one.
                out->AddErrorMessage(std::string("Target snapshot cannot be resignatured: ") +
                                     TranslateSnapshotReason(code));
            }
        });
    }
};

} // namespace

NodePtr NewHLFSSnapshotResignature() { return New<HLFSSnapshotResignature>(kHLFSSnapshotResignatureDecl); }

} // namespace OrvaneCli::FileSystem

#include "command/StorageCommand.h"
#include "hlfs/Manifest.h"
#include "hlfs/SnapshotCommon.h"

namespace OrvaneCli::FileSystem {

namespace {

// storage hlfs snapshot resignature
class HLFSSnapshotResignature final : public StorageCommand {
public:
    HLFSSnapshotResignature() : StorageCommand({"Resignature a snapshot/replica of a HLFS volume."}) {}

private:
    void DeclareParameters(const std::shared_ptr<InputSpec>& inputs) override
    {
        AddLabelAndUuid(inputs, "The HLFS volume label of the snapshot to resignature.",
                        "The HLFS volume uuid of the snapshot to resignature.");
    }

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

NodePtr NewHLFSSnapshotResignature() { return New<HLFSSnapshotResignature>(); }

} // namespace OrvaneCli::FileSystem

#include "hlfs/HLFSSnapshotMount.h"

#include "hlfs/SnapshotCommon.h"

namespace OrvaneCli::FileSystem {

namespace {

// The frame both commands share: exactly one of label and UUID, then `act` on every
// matching copy (not only the first). Once the arguments are accepted the result is
// true, also beside a not-found message or a host failure.
template <typename Act>
void ResolveMatchingSnapshots(const InputPtr& in, const OutputPtr& out, Act&& act)
{
    const SnapshotSelection selection = SnapshotSelection::FromInput(in);
    StorageInfoImpl storage;

    if (IsGiven(selection.label) && IsGiven(selection.uuid)) {
        out->AddErrorMessage("A target snapshot cannot be specified by both volume label and uuid.");
        return;
    }
    if (!IsGiven(selection.label) && !IsGiven(selection.uuid)) {
        out->AddErrorMessage("A target HLFS volume must be specified by either volume label or uuid but not both.");
        return;
    }

    Guarded(out, [&] {
        int count = 0;
        for (const auto& entry : storage.GetUnresolvedVolumes()) {
            UnresolvedHlfsVolumeImpl* volume = AsSnapshot(entry);
            if (volume == nullptr || !selection.Matches(*volume)) {
                continue;
            }
            act(*volume);
            ++count;
        }
        if (count == 0) {
            out->AddErrorMessage(IsGiven(selection.uuid)
                                     ? "No unresolved HLFS snapshots with volume UUID '" + selection.uuid + "' found."
                                     : "No unresolved HLFS snapshots with volume label '" + selection.label +
                                           "' found.");
        }
    });
    out->SetRootObject(MetaBool::New(true));
}

} // namespace

std::shared_ptr<HLFSSnapshotMount> HLFSSnapshotMount::New()
{
    return std::shared_ptr<HLFSSnapshotMount>(new HLFSSnapshotMount());
}

HLFSSnapshotMount::HLFSSnapshotMount() { SetDescription("Mount a snapshot/replica of a HLFS volume."); }

HLFSSnapshotMount::~HLFSSnapshotMount() = default;

std::shared_ptr<InputSpec> HLFSSnapshotMount::GetInputSpecInternal()
{
    auto inputs = InputSpec::New();
    AddSnapshotSelectionParameters(inputs, "The HLFS volume label of the snapshot to mount.",
                                   "The HLFS volume uuid of the snapshot to mount.");
    AddParameter(inputs, {kOptionNoPersist, "n", ParameterType::Flag,
                        "Mount the volume non-persistently; the volume will not be automounted after a restart."});
    return inputs;
}

std::shared_ptr<OutputSpec> HLFSSnapshotMount::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void HLFSSnapshotMount::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const bool persistent = !in->IsFlagSet(kOptionNoPersist);
    // No CanResolve check first: a copy that cannot be mounted fails in the host.
    ResolveMatchingSnapshots(in, out, [&](UnresolvedHlfsVolumeImpl& volume) { volume.Mount(false, persistent); });
}

std::shared_ptr<HLFSSnapshotResignature> HLFSSnapshotResignature::New()
{
    return std::shared_ptr<HLFSSnapshotResignature>(new HLFSSnapshotResignature());
}

HLFSSnapshotResignature::HLFSSnapshotResignature()
{
    SetDescription("Resignature a snapshot/replica of a HLFS volume.");
}

HLFSSnapshotResignature::~HLFSSnapshotResignature() = default;

std::shared_ptr<InputSpec> HLFSSnapshotResignature::GetInputSpecInternal()
{
    auto inputs = InputSpec::New();
    AddSnapshotSelectionParameters(inputs, "The HLFS volume label of the snapshot to resignature.",
                                   "The HLFS volume uuid of the snapshot to resignature.");
    return inputs;
}

std::shared_ptr<OutputSpec> HLFSSnapshotResignature::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void HLFSSnapshotResignature::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
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

} // namespace OrvaneCli::FileSystem

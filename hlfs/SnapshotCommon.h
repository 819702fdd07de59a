#pragma once

// What the four snapshot commands share: the reason texts of CanResolve codes, the
// label/UUID selection of unresolved copies and the checked downcasts of host entries.

#include <initializer_list>
#include <memory>
#include <string>
#include <vector>

#include "command/Selection.h"
#include "command/StorageCommand.h"

namespace OrvaneCli::FileSystem {

// volume-label and volume-uuid of a snapshot command, then the command's `own` parameters.
// `target` ends both help texts: "The HLFS volume label of <target>.".
std::vector<ParameterDecl> SnapshotParameters(const char* target, std::initializer_list<ParameterDecl> own = {});

// The text shown for a CanResolve reason code; unknown codes give "unknown error".
const char* TranslateSnapshotReason(unsigned code);

// Which unresolved copies a snapshot command acts on. An empty value is no filter.
struct SnapshotSelection {
    std::string label;
    std::string uuid;

    static SnapshotSelection FromInput(const InputPtr& in);

    // Both given filters must match. The UUID is compared first; the name is read only
    // when the UUID matched or was not given.
    bool Matches(UnresolvedHlfsVolumeImpl& volume) const;
};

// The entry as the host's implementation class, or null for an empty entry or another class.
UnresolvedHlfsVolumeImpl* AsSnapshot(const std::unique_ptr<UnresolvedHlfsVolume>& entry);
UnresolvedHlfsExtentImpl* AsSnapshotExtent(const std::unique_ptr<UnresolvedHlfsExtent>& entry);

// The walk of the two snapshot listings: `each(copy)` for every unresolved copy the input's
// label and UUID select, with the host's storage information cached meanwhile. A host
// failure ends the walk with its message; what `each` gathered so far stays.
template <typename Each>
void ForEachSelectedSnapshot(const InputPtr& in, const OutputPtr& out, Each&& each)
{
    const SnapshotSelection selection = SnapshotSelection::FromInput(in);
    StorageInfoScopedCache cache(false);
    WithStorageInfo(StorageInfoPlacement::OutsideGuard, out, [&](StorageInfoImpl& storage) {
        for (const auto& entry : storage.GetUnresolvedVolumes()) {
            UnresolvedHlfsVolumeImpl* volume = AsSnapshot(entry);
            if (volume != nullptr && selection.Matches(*volume)) {
                each(*volume);
            }
        }
    });
}

// The two snapshot listings: `each(copy, list)` adds the rows of every selected copy; the
// list is the result, also when a host failure ended the walk.
template <typename Each>
void ListSelectedSnapshots(const InputPtr& in, const OutputPtr& out, const std::shared_ptr<MetaList>& list, Each&& each)
{
    ForEachSelectedSnapshot(in, out, [&](UnresolvedHlfsVolumeImpl& volume) { each(volume, *list); });
    out->SetRootObject(list);
}

// The frame of the two snapshot listings: their declaration from the parts that differ, and
// a walk that asks AddRows for the rows of every selected copy.
class SnapshotListing : public StorageCommand {
public:
    SnapshotListing(const char* description, const ColumnTable& columns, const char* formatter, const char* target)
        : StorageCommand({.description = description,
                          .result = ListOf(columns),
                          .formatter = formatter,
                          .parameters = SnapshotParameters(target)})
    {
    }

protected:
    // A host failure leaving it ends the walk; the rows gathered so far are still shown.
    virtual void AddRows(UnresolvedHlfsVolumeImpl& volume, const RowShape& shape, MetaList& list,
                         const OutputPtr& out) = 0;

private:
    void Run(const InputPtr& in, const OutputPtr& out) final
    {
        const RowShape shape = Rows();
        ListSelectedSnapshots(in, out, shape.EmptyList(), [&](UnresolvedHlfsVolumeImpl& volume, MetaList& list) {
            AddRows(volume, shape, list, out);
        });
    }
};

// The texts of the snapshot mount and resignature selection.
extern const VolumeSelectorTexts kResolveSnapshotTexts;

// The frame of snapshot mount and resignature: exactly one of label and UUID, then
// `act(copy)` on every matching copy (not only the first). Once the arguments are accepted
// the result is true, also beside a not-found message or a host failure.
template <typename Act>
void ResolveMatchingSnapshots(const InputPtr& in, const OutputPtr& out, Act&& act)
{
    bool accepted = false;
    // The storage information is made before the arguments are looked at.
    WithStorageInfo(StorageInfoPlacement::OutsideGuard, out, [&](StorageInfoImpl& storage) {
        const auto choice = ChooseVolume(in, kResolveSnapshotTexts, out);
        if (!choice) {
            return;
        }
        accepted = true;
        const SnapshotSelection selection = SnapshotSelection::FromInput(in);
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
            out->AddErrorMessage(VolumeNotFound(*choice, kResolveSnapshotTexts));
        }
    });
    if (accepted) {
        out->SetRootObject(MetaBool::New(true));
    }
}

} // namespace OrvaneCli::FileSystem

#pragma once

// What the four snapshot commands share: the reason texts of CanResolve codes, the
// label/UUID selection of unresolved copies and the checked downcasts of host entries.

#include <memory>
#include <string>

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

using HostCtl::Storage::UnresolvedHlfsExtent;
using HostCtl::Storage::UnresolvedHlfsVolume;
using KnxCtl::Storage::StorageInfoScopedCache;
using KnxCtl::Storage::UnresolvedHlfsExtentImpl;
using KnxCtl::Storage::UnresolvedHlfsVolumeImpl;

// The text shown for a CanResolve reason code; unknown codes give "unknown error".
const char* TranslateSnapshotReason(unsigned code);

// Adds `volume-label` then `volume-uuid`, both optional strings, with the command's own wording.
void AddSnapshotSelectionParameters(const std::shared_ptr<InputSpec>& inputs, const char* labelDescription,
                                    const char* uuidDescription);

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

} // namespace OrvaneCli::FileSystem

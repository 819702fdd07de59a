#include "hlfs/SnapshotCommon.h"

#include <array>

namespace OrvaneCli::FileSystem {

const VolumeSelectorTexts kResolveSnapshotTexts = {
    "A target snapshot cannot be specified by both volume label and uuid.",
    "A target HLFS volume must be specified by either volume label or uuid but not both.",
    "No unresolved HLFS snapshots with volume label '%s' found.",
    "No unresolved HLFS snapshots with volume UUID '%s' found.",
};

std::vector<ParameterDecl> SnapshotParameters(const char* target, std::initializer_list<ParameterDecl> own)
{
    std::vector<ParameterDecl> parameters = {LabelParameter(""), UuidParameter("")};
    parameters[0].description = HostCtl::Misc::StrCat("The HLFS volume label of ", target, ".");
    parameters[1].description = HostCtl::Misc::StrCat("The HLFS volume uuid of ", target, ".");
    parameters.insert(parameters.end(), own);
    return parameters;
}

const char* TranslateSnapshotReason(unsigned code)
{
    static constexpr std::array<const char*, 8> reasons = {
        "ok",
        "duplicate extents found",
        "some extents missing",
        "extra extents found",
        "failed to check for existing active volumes",
        "the volume is being actively used",
        "the original volume is still online",
        "the original volume has some extents online",
    };
    return code < reasons.size() ? reasons[code] : "unknown error";
}

SnapshotSelection SnapshotSelection::FromInput(const InputPtr& in)
{
    return {in->GetParameter(kOptionVolumeLabel), in->GetParameter(kOptionVolumeUuid)};
}

bool SnapshotSelection::Matches(UnresolvedHlfsVolumeImpl& volume) const
{
    if (IsGiven(uuid) && volume.GetUuid() != uuid) {
        return false;
    }
    return !IsGiven(label) || volume.GetVolumeName() == label;
}

UnresolvedHlfsVolumeImpl* AsSnapshot(const std::unique_ptr<UnresolvedHlfsVolume>& entry)
{
    return dynamic_cast<UnresolvedHlfsVolumeImpl*>(entry.get());
}

UnresolvedHlfsExtentImpl* AsSnapshotExtent(const std::unique_ptr<UnresolvedHlfsExtent>& entry)
{
    return dynamic_cast<UnresolvedHlfsExtentImpl*>(entry.get());
}

} // namespace OrvaneCli::FileSystem

#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "hlfs/Manifest.h"
#include "hlfs/SnapshotCommon.h"

namespace OrvaneCli::FileSystem {

namespace {

enum Field { kVolumeName, kHlfsUuid, kCanMount, kMountReason, kCanResignature, kResignatureReason, kExtentCount };

const ColumnTable kColumns("HLFSSnapshot",
                           {
                               {kVolumeName, "Volume Name"},
                               {kHlfsUuid, "HLFS UUID"},
                               {kCanMount, "Can mount", ColumnType::Bool},
                               {kMountReason, "Reason for un-mountability"},
                               {kCanResignature, "Can resignature", ColumnType::Bool},
                               {kResignatureReason, "Reason for non-resignaturability"},
                               {kExtentCount, "Unresolved Extent Count", ColumnType::Int},
                           },
                           true, "%HLFS UUID%");

// A passed check shows an empty reason rather than "ok".
std::string ReasonColumn(bool passed, unsigned code)
{
    return passed ? std::string() : std::string(TranslateSnapshotReason(code));
}

// storage hlfs snapshot list
class HLFSSnapshotList final : public SnapshotListing {
    using SnapshotListing::SnapshotListing;

    void AddRows(UnresolvedHlfsVolumeImpl& volume, const RowShape& shape, MetaList& list,
                 const OutputPtr& /*out*/) override
    {
        auto row = shape.NewRow();
        row.Set(kVolumeName, volume.GetVolumeName());
        row.Set(kHlfsUuid, volume.GetUuid());

        unsigned code = 0;
        const bool canMount = volume.CanResolve(false, true, &code);
        row.Set(kCanMount, canMount);
        row.Set(kMountReason, ReasonColumn(canMount, code));

        code = 0;
        const bool canResignature = volume.CanResolve(true, false, &code);
        row.Set(kCanResignature, canResignature);
        row.Set(kResignatureReason, ReasonColumn(canResignature, code));

        row.Set(kExtentCount, static_cast<long>(volume.GetExtents().size()));
        list.Add(row.Structure());
    }
};

} // namespace

NodePtr NewHLFSSnapshotList()
{
    return New<HLFSSnapshotList>("List unresolved snapshots/replicas of HLFS volume.", kColumns, "simple",
                                 "the snapshot to list");
}

} // namespace OrvaneCli::FileSystem

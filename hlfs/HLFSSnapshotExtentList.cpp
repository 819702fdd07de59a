#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "hlfs/Manifest.h"
#include "hlfs/SnapshotCommon.h"

namespace OrvaneCli::FileSystem {

namespace {

enum Field { kVolumeName, kHlfsUuid, kLvmUuid, kExtentNumber, kDeviceName, kPartition, kStart, kEnd };

const ColumnTable kColumns("HLFSSnapshotExtent", {
                                                     {kVolumeName, "Volume Name"},
                                                     {kHlfsUuid, "HLFS UUID"},
                                                     {kLvmUuid, "LVM UUID", ColumnType::String, {.shown = false}},
                                                     {kExtentNumber, "Extent Number", ColumnType::Int},
                                                     {kDeviceName, "Device Name"},
                                                     {kPartition, "Partition", ColumnType::Int},
                                                     {kStart, "Start", ColumnType::Int},
                                                     {kEnd, "End", ColumnType::Int},
                                                 });

// storage hlfs snapshot extent list
class HLFSSnapshotExtentList final : public SnapshotListing {
    using SnapshotListing::SnapshotListing;

    void AddRows(UnresolvedHlfsVolumeImpl& volume, const RowShape& shape, MetaList& list, const OutputPtr& out) override
    {
        const auto extents = volume.GetExtents();
        // Inner scope: a failure on one extent drops the rest of this copy's extents only.
        Guarded(out, [&] {
            // The number is the position in the host's vector, so skipped entries still count.
            for (std::size_t index = 0; index < extents.size(); ++index) {
                UnresolvedHlfsExtentImpl* extent = AsSnapshotExtent(extents[index]);
                if (extent == nullptr) {
                    continue;
                }
                auto row = shape.NewRow();
                row.Set(kVolumeName, volume.GetVolumeName());
                row.Set(kHlfsUuid, volume.GetUuid());
                row.Set(kLvmUuid, volume.GetLvmUuid());
                row.Set(kExtentNumber, static_cast<long>(index));
                row.Set(kDeviceName, extent->GetDeviceName());
                row.Set(kPartition, static_cast<int>(extent->GetPartition()));
                row.Set(kStart, static_cast<long>(extent->GetStart()));
                row.Set(kEnd, static_cast<long>(extent->GetEnd()));
                list.Add(row.Structure());
            }
        });
    }
};

} // namespace

NodePtr NewHLFSSnapshotExtentList()
{
    return New<HLFSSnapshotExtentList>("List extents of unresolved snapshots/replicas of HLFS volume.", kColumns,
                                       "table", "the target snapshot to enumerate");
}

} // namespace OrvaneCli::FileSystem

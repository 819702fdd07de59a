#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "hlfs/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

enum Field { kVolumeName, kHlfsUuid, kLvmUuid, kDeviceName, kPartition, kExtentNumber };

const ColumnTable kColumns("FilesystemHLFSExtents",
                           {
                               {kVolumeName, "Volume Name"},
                               {kHlfsUuid, "HLFS UUID"},
                               {kLvmUuid, "LVM UUID", ColumnType::String, {.shown = false}},
                               {kDeviceName, "Device Name"},
                               {kPartition, "Partition", ColumnType::Int},
                               {kExtentNumber, "Extent Number", ColumnType::Int, {.shownAfter = kHlfsUuid}},
                           });

const CommandDecl kHLFSExtentListDecl = {.description = "List the HLFS extents available on the host.",
                                         .result = ListOf(kColumns),
                                         .formatter = "table",
                                         .parameters = {IgnoreErrorsParameter()}};

// storage hlfs extent list
class HLFSExtentList final : public StorageCommand {
    using StorageCommand::StorageCommand;

    // One row per extent, grouped by volume in the host's order and numbered from 0 within each
    // volume; empty extents are neither shown nor counted. A volume whose reading fails keeps
    // the rows it already gave.
    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        // Asking for the mount point may fail again; that failure ends the walk through the
        // guarded region and leaves no list.
        const SkipReport report{"Error getting data for filesystem on '", &HostCtl::Storage::FileSystem::GetMountPoint,
                                in->IsFlagSet(kOptionIgnoreErrors)};
        WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
            const RowShape shape = Rows();
            auto list = shape.EmptyList();
            auto volumes = storage.GetHlfsFileSystemsList(HostCtl::emptyString);
            ReadEachOrSkip(volumes, report, out, [&](HlFileSystem& volume) {
                const auto extents = volume.GetExtents();
                long extentNumber = 0;
                for (const auto& extent : extents) {
                    if (!extent) {
                        continue;
                    }
                    auto row = shape.NewRow();
                    row.Set(kVolumeName, volume.GetVolumeName());
                    row.Set(kHlfsUuid, volume.GetUuid());
                    row.Set(kLvmUuid, volume.GetLvmUuid());
                    row.Set(kDeviceName, extent->GetDeviceName());
                    row.Set(kPartition, static_cast<long>(extent->GetPartition()));
                    row.Set(kExtentNumber, extentNumber);
                    ++extentNumber;
                    list->Add(row.Structure());
                }
            });
            out->SetRootObject(list);
        });
    }
};

} // namespace

NodePtr NewHLFSExtentList() { return New<HLFSExtentList>(kHLFSExtentListDecl); }

} // namespace OrvaneCli::FileSystem

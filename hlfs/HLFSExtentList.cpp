#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "hlfs/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

const char* const kVolumeName = "Volume Name";
const char* const kHlfsUuid = "HLFS UUID";
const char* const kLvmUuid = "LVM UUID";
const char* const kDeviceName = "Device Name";
const char* const kPartition = "Partition";
const char* const kExtentNumber = "Extent Number";

const ColumnTable kColumns("FilesystemHLFSExtents",
                           {
                               {kVolumeName, ColumnType::String},
                               {kHlfsUuid, ColumnType::String},
                               {.title = kLvmUuid, .type = ColumnType::String, .shown = false},
                               {kDeviceName, ColumnType::String},
                               {kPartition, ColumnType::Int},
                               {.title = kExtentNumber, .type = ColumnType::Int, .shownAfter = kHlfsUuid},
                           });

// storage hlfs extent list
class HLFSExtentList final : public StorageCommand {
public:
    HLFSExtentList()
        : StorageCommand({"List the HLFS extents available on the host.", ListOf(kColumns), "table"})
    {
    }

private:
    void DeclareParameters(const std::shared_ptr<InputSpec>& inputs) override
    {
        inputs->AddParameter(IgnoreErrorInputParameter());
    }

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

NodePtr NewHLFSExtentList() { return New<HLFSExtentList>(); }

} // namespace OrvaneCli::FileSystem

#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "filesystem/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

using HostFileSystem = HostCtl::Storage::FileSystem;

enum Field { kMountPoint, kVolumeName, kUuid, kType, kMounted, kSize, kFree };

const ColumnTable kColumns("FilesystemVolume", {
                                                   {kMountPoint, "Mount Point"},
                                                   {kVolumeName, "Volume Name"},
                                                   {kUuid, "UUID"},
                                                   {kType, "Type"},
                                                   {kMounted, "Mounted", ColumnType::Bool, {.shownAfter = kUuid}},
                                                   {kSize, "Size", ColumnType::Int},
                                                   {kFree, "Free", ColumnType::Int},
                                               });

const char* const kUuidParameter = "uuid";

const CommandDecl kDecl = {
    .description = "List the volumes available to the host. This includes HLFS, NAS, VFAT and UFS partitions.",
    .result = ListOf(kColumns),
    .formatter = "table",
    .parameters = {{kUuidParameter, "u", ParameterType::String,
                    "Only show information for the filesystem with the specified UUID."},
                   IgnoreErrorsParameter()}};

// storage filesystem list
class VolumeList final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        // Asking for the mount point may fail again; that failure ends the walk through the
        // guarded region.
        const SkipReport report{"Error getting data for filesystem on '", &HostFileSystem::GetMountPoint,
                                in->IsFlagSet(kOptionIgnoreErrors)};
        WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
            const RowShape shape = Rows();
            auto list = shape.EmptyList();
            std::vector<std::unique_ptr<HostFileSystem>> fileSystems;
            // A UUID given on the command line is looked up even when empty: asking for one
            // volume never widens to all of them.
            if (in->HasParameter(kUuidParameter)) {
                auto fileSystem = storage.GetFileSystemByUuidEx(in->GetParameter(kUuidParameter));
                if (!fileSystem) {
                    out->AddErrorMessage("Could not find any filesystem with specified UUID.");
                    return;
                }
                fileSystems.push_back(std::move(fileSystem));
            } else {
                fileSystems = storage.GetFileSystems();
            }
            // The list is the result even when single volumes fail to be read; a volume that
            // fails is left out whole.
            out->SetRootObject(list);
            ReadEachOrSkip(fileSystems, report, out,
                           [&](HostFileSystem& fileSystem) { list->Add(FillRow(shape, fileSystem).Structure()); });
        });
    }

    static Row FillRow(const RowShape& shape, HostFileSystem& fileSystem)
    {
        auto row = shape.NewRow();
        std::string type = fileSystem.GetType();
        if (type == HlFileSystem::HLFS_TYPE) {
            // An object that claims the type but is not an HLFS volume shows the host's text.
            if (auto* hlfs = dynamic_cast<HlFileSystem*>(&fileSystem)) {
                type = GetHLFSVersionString(hlfs);
            }
        }
        row.Set(kMountPoint, fileSystem.GetMountPoint());
        row.Set(kVolumeName, fileSystem.GetVolumeName());
        row.Set(kUuid, fileSystem.GetUuid());
        row.Set(kType, type);
        row.Set(kSize, static_cast<long>(fileSystem.GetCapacity()));
        const std::uint64_t capacity = fileSystem.GetCapacity();
        const std::uint64_t used = fileSystem.GetUsedSpace();
        // A host that reports more in use than there is shows no free space, not a wrapped value.
        row.Set(kFree, static_cast<long>(used > capacity ? 0 : capacity - used));
        row.Set(kMounted, fileSystem.IsMounted());
        return row;
    }
};

} // namespace

NodePtr NewVolumeList() { return New<VolumeList>(kDecl); }

} // namespace OrvaneCli::FileSystem

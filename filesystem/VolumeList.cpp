#include "filesystem/VolumeList.h"

#include "hlfs/HlfsVolumeSelection.h"

namespace OrvaneCli::FileSystem {

namespace {

const char* const kStructure = "FilesystemVolume";
const char* const kMountPoint = "Mount Point";
const char* const kVolumeName = "Volume Name";
const char* const kUuid = "UUID";
const char* const kType = "Type";
const char* const kMounted = "Mounted";
const char* const kSize = "Size";
const char* const kFree = "Free";

const char* const kUuidParameter = "uuid";

} // namespace

std::shared_ptr<VolumeList> VolumeList::New() { return std::shared_ptr<VolumeList>(new VolumeList()); }

VolumeList::VolumeList()
{
    SetDescription("List the volumes available to the host. This includes HLFS, NAS, VFAT and UFS partitions.");
    SetDefaultOutputFormatter("table");
    SetDefaultOutputParameter("fields:FilesystemVolume", "Mount Point,Volume Name,UUID,Mounted,Type,Size,Free");
}

VolumeList::~VolumeList() = default;

std::shared_ptr<InputSpec> VolumeList::GetInputSpecInternal()
{
    auto inputs = InputSpec::New();
    AddParameter(inputs, {kUuidParameter, "u", ParameterType::String,
                        "Only show information for the filesystem with the specified UUID."});
    inputs->AddParameter(IgnoreErrorInputParameter());
    return inputs;
}

std::shared_ptr<OutputSpec> VolumeList::GetOutputSpecInternal() { return ListOutputSpec(GetOutputStructure()); }

std::shared_ptr<MetaStruct> VolumeList::GetOutputStructure()
{
    auto row = MetaStruct::New(kStructure);
    row->SetField(kMountPoint, MetaString::New());
    row->SetField(kVolumeName, MetaString::New());
    row->SetField(kUuid, MetaString::New());
    row->SetField(kType, MetaString::New());
    row->SetField(kMounted, MetaBool::New());
    row->SetField(kSize, MetaInt::New());
    row->SetField(kFree, MetaInt::New());
    return row;
}

void VolumeList::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const char ignoreErrors = in->IsFlagSet(kOptionIgnoreErrors) ? 1 : 0;

    WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
        auto list = MetaList::New(MetaType::Struct, GetOutputStructure());
        std::vector<std::unique_ptr<HostCtl::Storage::FileSystem>> fileSystems;
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
        // The list is the result even when single volumes fail to be read.
        out->SetRootObject(list);
        UpdateFileSystemList(fileSystems, list, out, ignoreErrors);
    });
}

void VolumeList::UpdateFileSystemList(const std::vector<std::unique_ptr<HostCtl::Storage::FileSystem>>& fileSystems,
                                      std::shared_ptr<MetaList> list, const OutputPtr& out, char ignoreErrors)
{
    for (const auto& fileSystem : fileSystems) {
        try {
            auto row = GetOutputStructure();
            std::string type = fileSystem->GetType();
            if (type == HlFileSystem::HLFS_TYPE) {
                // An object that claims the type but is not an HLFS volume shows the host's text.
                if (auto* hlfs = dynamic_cast<HlFileSystem*>(fileSystem.get())) {
                    type = GetHLFSVersionString(hlfs);
                }
            }
            row->SetField(kMountPoint, fileSystem->GetMountPoint());
            row->SetField(kVolumeName, fileSystem->GetVolumeName());
            row->SetField(kUuid, fileSystem->GetUuid());
            row->SetField(kType, type);

            row->SetField(kSize, static_cast<long>(fileSystem->GetCapacity()));
            const std::uint64_t capacity = fileSystem->GetCapacity();
            const std::uint64_t used = fileSystem->GetUsedSpace();
            // A host that reports more in use than there is shows no free space, not a wrapped value.
            row->SetField(kFree, static_cast<long>(used > capacity ? 0 : capacity - used));

            row->SetField(kMounted, fileSystem->IsMounted());
            list->Add(row);
        } catch (const HostCtlException& e) {
            if (ignoreErrors == 0) {
                // Asking for the mount point may fail again; that failure ends the walk
                // through the command's envelope.
                out->AddErrorMessage("Error getting data for filesystem on '" + fileSystem->GetMountPoint() +
                                     "': " + e.message + ", skipping.");
            }
        }
    }
}

} // namespace OrvaneCli::FileSystem

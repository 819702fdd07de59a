#include "hlfs/HLFSExtentList.h"

#include "hlfs/HlfsVolumeSelection.h"

namespace OrvaneCli::FileSystem {

namespace {

const char* const kStructure = "FilesystemHLFSExtents";
const char* const kVolumeName = "Volume Name";
const char* const kHlfsUuid = "HLFS UUID";
const char* const kLvmUuid = "LVM UUID";
const char* const kDeviceName = "Device Name";
const char* const kPartition = "Partition";
const char* const kExtentNumber = "Extent Number";

} // namespace

std::shared_ptr<HLFSExtentList> HLFSExtentList::New() { return std::shared_ptr<HLFSExtentList>(new HLFSExtentList()); }

HLFSExtentList::HLFSExtentList()
{
    SetDescription("List the HLFS extents available on the host.");
    SetDefaultOutputFormatter("table");
    SetDefaultOutputParameter("fields:FilesystemHLFSExtents", "Volume Name,HLFS UUID,Extent Number,Device Name,Partition");
}

HLFSExtentList::~HLFSExtentList() = default;

std::shared_ptr<InputSpec> HLFSExtentList::GetInputSpecInternal()
{
    auto inputs = InputSpec::New();
    inputs->AddParameter(IgnoreErrorInputParameter());
    return inputs;
}

std::shared_ptr<OutputSpec> HLFSExtentList::GetOutputSpecInternal() { return ListOutputSpec(GetOutputStructure()); }

std::shared_ptr<MetaStruct> HLFSExtentList::GetOutputStructure()
{
    auto row = MetaStruct::New(kStructure);
    row->SetField(kVolumeName, MetaString::New());
    row->SetField(kHlfsUuid, MetaString::New());
    row->SetField(kLvmUuid, MetaString::New());
    row->SetField(kDeviceName, MetaString::New());
    row->SetField(kPartition, MetaInt::New());
    row->SetField(kExtentNumber, MetaInt::New());
    return row;
}

void HLFSExtentList::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const char ignoreErrors = in->IsFlagSet(kOptionIgnoreErrors) ? 1 : 0;

    WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
        auto list = MetaList::New(MetaType::Struct, GetOutputStructure());
        auto volumes = storage.GetHlfsFileSystemsList(HostCtl::emptyString);
        UpdateExtentList(volumes, list, out, ignoreErrors);
        // The list is the result even when single volumes failed to be read. A failure that
        // ends the walk itself (the mount point unreadable for the message) leaves no list.
        out->SetRootObject(list);
    });
}

void HLFSExtentList::UpdateExtentList(const std::vector<std::unique_ptr<HlFileSystem>>& volumes,
                                      std::shared_ptr<MetaList> list, const OutputPtr& out, char ignoreErrors)
{
    for (const auto& volume : volumes) {
        if (!volume) {
            continue;
        }
        try {
            const auto extents = volume->GetExtents();
            long extentNumber = 0;
            for (const auto& extent : extents) {
                if (!extent) {
                    continue;
                }
                auto row = GetOutputStructure();
                row->SetField(kVolumeName, volume->GetVolumeName());
                row->SetField(kHlfsUuid, volume->GetUuid());
                row->SetField(kLvmUuid, volume->GetLvmUuid());
                row->SetField(kDeviceName, extent->GetDeviceName());
                row->SetField(kPartition, static_cast<long>(extent->GetPartition()));
                row->SetField(kExtentNumber, extentNumber);
                ++extentNumber;
                list->Add(row);
            }
        } catch (const HostCtlException& e) {
            if (ignoreErrors == 0) {
                // Asking for the mount point may fail again; that failure ends the walk
                // through the command's envelope.
                out->AddErrorMessage("Error getting data for filesystem on '" + volume->GetMountPoint() + "': " +
                                     e.message + ", skipping.");
            }
        }
    }
}

} // namespace OrvaneCli::FileSystem

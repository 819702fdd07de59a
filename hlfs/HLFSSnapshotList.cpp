#include "hlfs/HLFSSnapshotList.h"

#include "hlfs/SnapshotCommon.h"

namespace OrvaneCli::FileSystem {

namespace {

// A passed check shows an empty reason rather than "ok".
std::string ReasonColumn(bool passed, unsigned code)
{
    return passed ? std::string() : std::string(TranslateSnapshotReason(code));
}

} // namespace

std::shared_ptr<HLFSSnapshotList> HLFSSnapshotList::New()
{
    return std::shared_ptr<HLFSSnapshotList>(new HLFSSnapshotList());
}

HLFSSnapshotList::HLFSSnapshotList()
{
    SetDescription("List unresolved snapshots/replicas of HLFS volume.");
    SetDefaultOutputFormatter("simple");
    SetDefaultOutputParameter("header:HLFSSnapshot", "%HLFS UUID%");
    SetDefaultOutputParameter("fields:HLFSSnapshot",
                              "Volume Name,HLFS UUID,Can mount,Reason for un-mountability,Can resignature,Reason for "
                              "non-resignaturability,Unresolved Extent Count");
}

HLFSSnapshotList::~HLFSSnapshotList() = default;

std::shared_ptr<InputSpec> HLFSSnapshotList::GetInputSpecInternal()
{
    auto inputs = InputSpec::New();
    AddSnapshotSelectionParameters(inputs, "The HLFS volume label of the snapshot to list.",
                                   "The HLFS volume uuid of the snapshot to list.");
    return inputs;
}

std::shared_ptr<OutputSpec> HLFSSnapshotList::GetOutputSpecInternal() { return ListOutputSpec(GetOutputStructure()); }

std::shared_ptr<MetaStruct> HLFSSnapshotList::GetOutputStructure()
{
    auto row = MetaStruct::New("HLFSSnapshot");
    row->SetField("Volume Name", MetaString::New());
    row->SetField("HLFS UUID", MetaString::New());
    row->SetField("Can mount", MetaBool::New());
    row->SetField("Reason for un-mountability", MetaString::New());
    row->SetField("Can resignature", MetaBool::New());
    row->SetField("Reason for non-resignaturability", MetaString::New());
    row->SetField("Unresolved Extent Count", MetaInt::New());
    return row;
}

void HLFSSnapshotList::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const SnapshotSelection selection = SnapshotSelection::FromInput(in);
    StorageInfoScopedCache cache(false);
    auto list = MetaList::New(MetaType::Struct, GetOutputStructure());

    // A host failure ends the walk; the rows gathered so far are still shown.
    WithStorageInfo(StorageInfoPlacement::OutsideGuard, out, [&](StorageInfoImpl& storage) {
        for (const auto& entry : storage.GetUnresolvedVolumes()) {
            UnresolvedHlfsVolumeImpl* volume = AsSnapshot(entry);
            if (volume == nullptr || !selection.Matches(*volume)) {
                continue;
            }
            auto row = GetOutputStructure();
            row->SetField("Volume Name", volume->GetVolumeName());
            row->SetField("HLFS UUID", volume->GetUuid());

            unsigned code = 0;
            const bool canMount = volume->CanResolve(false, true, &code);
            row->SetField("Can mount", canMount);
            row->SetField("Reason for un-mountability", ReasonColumn(canMount, code));

            code = 0;
            const bool canResignature = volume->CanResolve(true, false, &code);
            row->SetField("Can resignature", canResignature);
            row->SetField("Reason for non-resignaturability", ReasonColumn(canResignature, code));

            row->SetField("Unresolved Extent Count", static_cast<long>(volume->GetExtents().size()));
            list->Add(row);
        }
    });
    out->SetRootObject(list);
}

std::shared_ptr<HLFSSnapshotExtentList> HLFSSnapshotExtentList::New()
{
    return std::shared_ptr<HLFSSnapshotExtentList>(new HLFSSnapshotExtentList());
}

HLFSSnapshotExtentList::HLFSSnapshotExtentList()
{
    SetDescription("List extents of unresolved snapshots/replicas of HLFS volume.");
    SetDefaultOutputFormatter("table");
    SetDefaultOutputParameter("fields:HLFSSnapshotExtent",
                              "Volume Name,HLFS UUID,Extent Number,Device Name,Partition,Start,End");
}

HLFSSnapshotExtentList::~HLFSSnapshotExtentList() = default;

std::shared_ptr<InputSpec> HLFSSnapshotExtentList::GetInputSpecInternal()
{
    auto inputs = InputSpec::New();
    AddSnapshotSelectionParameters(inputs, "The HLFS volume label of the target snapshot to enumerate.",
                                   "The HLFS volume uuid of the target snapshot to enumerate.");
    return inputs;
}

std::shared_ptr<OutputSpec> HLFSSnapshotExtentList::GetOutputSpecInternal()
{
    return ListOutputSpec(GetOutputStructure());
}

std::shared_ptr<MetaStruct> HLFSSnapshotExtentList::GetOutputStructure()
{
    auto row = MetaStruct::New("HLFSSnapshotExtent");
    row->SetField("Volume Name", MetaString::New());
    row->SetField("HLFS UUID", MetaString::New());
    row->SetField("LVM UUID", MetaString::New());
    row->SetField("Extent Number", MetaInt::New());
    row->SetField("Device Name", MetaString::New());
    row->SetField("Partition", MetaInt::New());
    row->SetField("Start", MetaInt::New());
    row->SetField("End", MetaInt::New());
    return row;
}

void HLFSSnapshotExtentList::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const SnapshotSelection selection = SnapshotSelection::FromInput(in);
    StorageInfoScopedCache cache(false);
    auto list = MetaList::New(MetaType::Struct, GetOutputStructure());

    // Outer scope: a failure listing the copies, their extents or the selection ends the walk.
    WithStorageInfo(StorageInfoPlacement::OutsideGuard, out, [&](StorageInfoImpl& storage) {
        for (const auto& entry : storage.GetUnresolvedVolumes()) {
            UnresolvedHlfsVolumeImpl* volume = AsSnapshot(entry);
            if (volume == nullptr || !selection.Matches(*volume)) {
                continue;
            }
            const auto extents = volume->GetExtents();
            // Inner scope: a failure on one extent drops the rest of this copy's extents only.
            Guarded(out, [&] {
                // The number is the position in the host's vector, so skipped entries still count.
                for (std::size_t index = 0; index < extents.size(); ++index) {
                    UnresolvedHlfsExtentImpl* extent = AsSnapshotExtent(extents[index]);
                    if (extent == nullptr) {
                        continue;
                    }
                    auto row = GetOutputStructure();
                    row->SetField("Volume Name", volume->GetVolumeName());
                    row->SetField("HLFS UUID", volume->GetUuid());
                    row->SetField("LVM UUID", volume->GetLvmUuid());
                    row->SetField("Extent Number", static_cast<long>(index));
                    row->SetField("Device Name", extent->GetDeviceName());
                    row->SetField("Partition", static_cast<int>(extent->GetPartition()));
                    row->SetField("Start", static_cast<long>(extent->GetStart()));
                    row->SetField("End", static_cast<long>(extent->GetEnd()));
                    list->Add(row);
                }
            });
        }
    });
    out->SetRootObject(list);
}

} // namespace OrvaneCli::FileSystem

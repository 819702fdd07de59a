#include "hlfs/HLFSVolumeHostList.h"

#include "hlfs/HLFSVolumeLockMode.h"
#include "hlfs/HlfsVolumeSelection.h"

namespace OrvaneCli::FileSystem {

namespace {

constexpr unsigned char kHostAtsOnly = 4;

constexpr const char* kNormal = "Normal";
constexpr const char* kInvalid = "INVALID (needs unmount)";
constexpr const char* kUpgradePending = "ATS Upgrade Pending";
constexpr const char* kDowngradePending = "ATS Downgrade Pending";

} // namespace

std::shared_ptr<HLFSVolumeHostList> HLFSVolumeHostList::New()
{
    return std::shared_ptr<HLFSVolumeHostList>(new HLFSVolumeHostList());
}

HLFSVolumeHostList::HLFSVolumeHostList()
{
    SetDescription("List hosts accessing a particular HLFS Volume.");
    SetDefaultOutputFormatter("table");
    SetDefaultOutputParameter("fields:VolumeLockModeInUse",
                              "Heartbeat UUID,MAC Address,Driver Version,Heartbeat Offset,Locking Mode,Status");
}

HLFSVolumeHostList::~HLFSVolumeHostList() = default;

std::shared_ptr<InputSpec> HLFSVolumeHostList::GetInputSpecInternal()
{
    AddExample("-l datastore1", "List hosts using volume 'datastore1' with default liveness check of 'none'.");
    AddExample("-l datastore1 -v quick", "List hosts using volume 'datastore1' with liveness check of 'quick'.");
    auto inputs = GetSingleHLFSVolumeInputSpec();
    AddParameter(inputs, {"liveness", "v", ParameterType::String,
                        "The type of liveness check to perform on the HLFS volume. Valid values are %ENUM% (default "
                        "is none).",
                        false,
                        StringEnum({{"none", "No liveness check, just scan heartbeats (default)"},
                                    {"quick", "Quick liveness check, wait for one heartbeat interval"}})});
    return inputs;
}

std::shared_ptr<OutputSpec> HLFSVolumeHostList::GetOutputSpecInternal() { return ListOutputSpec(GetOutputStructure()); }

std::shared_ptr<MetaStruct> HLFSVolumeHostList::GetOutputStructure()
{
    auto row = MetaStruct::New("VolumeLockModeInUse");
    row->SetField("Heartbeat UUID", MetaString::New());
    row->SetField("MAC Address", MetaString::New());
    row->SetField("Driver Version", MetaString::New());
    row->SetField("Heartbeat Offset", MetaInt::New());
    row->SetField("Locking Mode", MetaString::New());
    row->SetField("Status", MetaString::New());
    return row;
}

const char* HLFSVolumeHostList::TranslateLockModeInUse(unsigned char hostMode)
{
    return hostMode == kHostAtsOnly ? "ATS-only" : "ATS+SCSI";
}

const char* HLFSVolumeHostList::TranslateStatus(unsigned int volumeMode, unsigned char hostMode)
{
    // Here a host counts as ATS-only by the bit, not by equality as in its "Locking Mode".
    const bool hostAtsOnly = (hostMode & kHostAtsOnly) != 0;
    const bool atsOnly = (volumeMode & LockModeBits::AtsOnly) != 0;
    const bool upgrade = (volumeMode & LockModeBits::UpgradePending) != 0;
    const bool downgrade = (volumeMode & LockModeBits::DowngradePending) != 0;

    if (upgrade && downgrade) {
        return hostAtsOnly ? kDowngradePending : kUpgradePending;
    }
    if (upgrade) {
        return hostAtsOnly ? kNormal : kUpgradePending;
    }
    if (downgrade) {
        if (hostAtsOnly) {
            return kDowngradePending;
        }
        return atsOnly ? kInvalid : kNormal;
    }
    // Not in transition: a host whose mode disagrees with the volume's must unmount.
    return hostAtsOnly == atsOnly ? kNormal : kInvalid;
}

void HLFSVolumeHostList::PopulateHostListSpec(std::shared_ptr<MetaStruct> row, HlFileSystem* volume,
                                              HlfsUserInfo* record)
{
    row->SetField("Heartbeat UUID", record->heartbeatUuid);
    row->SetField("MAC Address", record->macAddress.GetStringAddress());
    row->SetField("Driver Version",
                  std::to_string(record->driverVersionMajor) + "." + std::to_string(record->driverVersionMinor));
    row->SetField("Heartbeat Offset", static_cast<long>(record->heartbeatOffset));
    row->SetField("Locking Mode", TranslateLockModeInUse(record->lockModeInUse));
    row->SetField("Status", TranslateStatus(volume->GetLockMode(), record->lockModeInUse));
}

void HLFSVolumeHostList::UpdateList(HlFileSystem* volume, const std::vector<HlfsUserInfo>& records,
                                    std::shared_ptr<MetaList> list)
{
    for (HlfsUserInfo record : records) {
        auto row = GetOutputStructure();
        PopulateHostListSpec(row, volume, &record);
        list->Add(row);
    }
}

void HLFSVolumeHostList::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const bool quick = in->GetParameter("liveness") == "quick";
    const std::unique_ptr<HlFileSystem> volume = GetSingleHLFSVolume(in, out);
    if (!volume) {
        return;
    }
    Guarded(out, [&] {
        auto list = MetaList::New(MetaType::Struct, GetOutputStructure());
        UpdateList(volume.get(), volume->GetUsers(quick), list);
        out->SetRootObject(list);
    });
}

} // namespace OrvaneCli::FileSystem

#include "hlfs/HLFSVolumeLockMode.h"

#include <optional>

#include "hlfs/HlfsVolumeSelection.h"

namespace OrvaneCli::FileSystem {

namespace {

constexpr const char* kOptionGroup = "HLFS3";
constexpr const char* kOnlineUpgradeOption = "EnableOnlineATSUpgrade";

// Whether the host allows a mounted volume to be upgraded to ATS-only. Empty when the
// option is not an integer (the reason is on `out`); a missing option throws.
std::optional<bool> ReadOnlineUpgradeEnabled(const OutputPtr& out)
{
    auto options = HostCtl::HostFactory::GetHost()->GetAdvancedOptions();
    auto group = options->GetOptionGroup(kOptionGroup);
    auto option = group->GetOption(kOnlineUpgradeOption);
    auto* integer = dynamic_cast<HostCtl::AdvancedIntegerOption*>(option.get());
    if (integer == nullptr) {
        out->AddErrorMessage(HostCtl::Misc::StrCat("Advanced option '", kOptionGroup, "/", kOnlineUpgradeOption,
                                                   "' is not an integer option"));
        return std::nullopt;
    }
    return integer->GetValue() != 0;
}

void SetCompatibility(const std::shared_ptr<MetaStruct>& row, bool compatible, const char* upgradeModes,
                      const char* reason)
{
    row->SetField("ATS Compatible", compatible);
    row->SetField("ATS Upgrade Modes", upgradeModes);
    if (reason == nullptr) {
        row->SetField("ATS Incompatibility Reason", MetaString::New());
    } else {
        row->SetField("ATS Incompatibility Reason", reason);
    }
}

} // namespace

std::shared_ptr<HLFSVolumeLockModeList> HLFSVolumeLockModeList::New()
{
    return std::shared_ptr<HLFSVolumeLockModeList>(new HLFSVolumeLockModeList());
}

HLFSVolumeLockModeList::HLFSVolumeLockModeList()
{
    SetDescription("List the on-disk critical section locking mode for HLFS volumes available on this host.");
    SetDefaultOutputFormatter("table");
    SetDefaultOutputParameter("fields:VolumeLockModeConfiguration",
                              "Volume Name,UUID,Type,Locking Mode,ATS Compatible,ATS Upgrade Modes,ATS "
                              "Incompatibility Reason");
}

HLFSVolumeLockModeList::~HLFSVolumeLockModeList() = default;

std::shared_ptr<InputSpec> HLFSVolumeLockModeList::GetInputSpecInternal()
{
    AddExample("", "Show lockmodes for all HLFS volumes.");
    AddExample("-l datastore1", "Show lockmode for HLFS volume with label 'datastore1'.");
    AddExample("-l datastore1 -l datastore2",
               "Show lockmodes for HLFS volume with label 'datastore1' and HLFS volume with label 'datastore2'.");
    AddExample("-l datastore1 -u 50ac1b12-6b9eebe0-6765-80c16e6d3408",
               "Show lockmodes for HLFS volume with label 'datastore1' and HLFS volume with uuid "
               "'50ac1b12-6b9eebe0-6765-80c16e6d3408'.");
    return GetMultipleHLFSVolumesInputSpec();
}

std::shared_ptr<OutputSpec> HLFSVolumeLockModeList::GetOutputSpecInternal()
{
    return ListOutputSpec(GetOutputStructure());
}

std::shared_ptr<MetaStruct> HLFSVolumeLockModeList::GetOutputStructure()
{
    auto row = MetaStruct::New("VolumeLockModeConfiguration");
    row->SetField("Volume Name", MetaString::New());
    row->SetField("UUID", MetaString::New());
    row->SetField("Type", MetaString::New());
    row->SetField("Locking Mode", MetaString::New());
    row->SetField("ATS Compatible", MetaBool::New());
    row->SetField("ATS Upgrade Modes", MetaString::New());
    row->SetField("ATS Incompatibility Reason", MetaString::New());
    return row;
}

const char* HLFSVolumeLockModeList::TranslateLockMode(unsigned mode)
{
    if ((mode & LockModeBits::AtsOnly) != 0) {
        return "ATS";
    }
    if ((mode & LockModeBits::UpgradePending) != 0) {
        return "ATS UPGRADE PENDING";
    }
    if ((mode & LockModeBits::DowngradePending) != 0) {
        return "ATS DOWNGRADE PENDING";
    }
    return "ATS+SCSI";
}

void HLFSVolumeLockModeList::UpdateATSCompatibility(bool onlineUpgradeEnabled, HlFileSystem* volume,
                                                    std::shared_ptr<MetaStruct> row)
{
    // A volume with only the downgrade-pending bit is judged like an ATS+SCSI one.
    if ((volume->GetLockMode() & (LockModeBits::AtsOnly | LockModeBits::UpgradePending)) != 0) {
        SetCompatibility(row, true, "No upgrade needed", nullptr);
        return;
    }
    if (volume->GetMajorVersion() == 3) {
        SetCompatibility(row, false, "None", "ATS on HLFS-3 not supported");
        return;
    }
    if (volume->GetATSSupport() != 1) {
        SetCompatibility(row, false, "None", "Device does not support ATS");
        return;
    }
    const bool singleExtent = volume->GetExtents().size() <= 1;
    SetCompatibility(row, true, singleExtent && onlineUpgradeEnabled ? "Online/Offline" : "Offline", nullptr);
}

void HLFSVolumeLockModeList::PopulateLockModeQuerySpec(bool onlineUpgradeEnabled, std::shared_ptr<MetaStruct> row,
                                                       HlFileSystem* volume)
{
    row->SetField("Volume Name", volume->GetVolumeName());
    row->SetField("UUID", volume->GetUuid());
    row->SetField("Type", GetHLFSVersionString(volume));
    row->SetField("Locking Mode", TranslateLockMode(volume->GetLockMode()));
    UpdateATSCompatibility(onlineUpgradeEnabled, volume, row);
}

void HLFSVolumeLockModeList::UpdateFilesystemList(const std::vector<std::unique_ptr<HlFileSystem>>& volumes,
                                                  bool ignoreErrors, bool onlineUpgradeEnabled,
                                                  std::shared_ptr<MetaList> list, const OutputPtr& out)
{
    for (const auto& volume : volumes) {
        try {
            auto row = GetOutputStructure();
            PopulateLockModeQuerySpec(onlineUpgradeEnabled, row, volume.get());
            list->Add(row);
        } catch (const HostCtlException& e) {
            if (!ignoreErrors) {
                out->AddErrorMessage("Error getting data for filesystem on '" + volume->GetMountPoint() +
                                     "': " + e.message + ", skipping.");
            }
        }
    }
}

void HLFSVolumeLockModeList::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const bool ignoreErrors = in->IsFlagSet(kOptionIgnoreErrors);
    Guarded(out, [&] {
        const std::optional<bool> onlineUpgradeEnabled = ReadOnlineUpgradeEnabled(out);
        if (!onlineUpgradeEnabled) {
            return;
        }
        auto list = MetaList::New(MetaType::Struct, GetOutputStructure());
        std::vector<std::unique_ptr<HlFileSystem>> volumes;
        if (!GetMultipleHLFSVolumes(in, out, volumes)) {
            return;
        }
        UpdateFilesystemList(volumes, ignoreErrors, *onlineUpgradeEnabled, list, out);
        out->SetRootObject(list);
    });
}

std::shared_ptr<HLFSVolumeLockModeSet> HLFSVolumeLockModeSet::New()
{
    return std::shared_ptr<HLFSVolumeLockModeSet>(new HLFSVolumeLockModeSet());
}

HLFSVolumeLockModeSet::HLFSVolumeLockModeSet()
{
    SetDescription("Update the on-disk critical section locking mode for a particular HLFS Volume.");
}

HLFSVolumeLockModeSet::~HLFSVolumeLockModeSet() = default;

std::shared_ptr<InputSpec> HLFSVolumeLockModeSet::GetInputSpecInternal()
{
    AddExample("-a -l datastore1", "Configure HLFS volume with label 'datastore1'for ATS-only locking.");
    AddExample("-s -u 50ac1b12-6b9eebe0-6765-80c16e6d3408",
               "Configure HLFS volume with uuid '50ac1b12-6b9eebe0-6765-80c16e6d3408' for SCSI locking.");
    auto inputs = GetSingleHLFSVolumeInputSpec();
    AddParameter(inputs, {"ats", "a", ParameterType::Flag, "Enable ATS-only locking."});
    AddParameter(inputs, {"scsi", "s", ParameterType::Flag, "Enable SCSI locking."});
    return inputs;
}

std::shared_ptr<OutputSpec> HLFSVolumeLockModeSet::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void HLFSVolumeLockModeSet::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const bool ats = in->IsFlagSet("ats");
    const bool scsi = in->IsFlagSet("scsi");
    if (ats && scsi) {
        out->AddErrorMessage("You cannot specify both --ats and --scsi.");
        return;
    }
    if (!ats && !scsi) {
        out->AddErrorMessage("The requested lockmode must be specified either by --ats or --scsi.");
        return;
    }
    const std::unique_ptr<HlFileSystem> volume = GetSingleHLFSVolume(in, out);
    if (!volume) {
        return;
    }
    Guarded(out, [&] {
        // Only the ATS-only bit changes; pending bits are carried over as they are.
        const unsigned mode = volume->GetLockMode();
        const bool atsOnly = (mode & LockModeBits::AtsOnly) != 0;
        if (ats && !atsOnly) {
            volume->SetLockMode(mode | LockModeBits::AtsOnly);
        } else if (scsi && atsOnly) {
            volume->SetLockMode(mode & ~LockModeBits::AtsOnly);
        }
        out->SetRootObject(MetaBool::New(true));
    });
}

} // namespace OrvaneCli::FileSystem

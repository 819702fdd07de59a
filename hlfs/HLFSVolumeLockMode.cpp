#include <optional>

#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "hlfs/Manifest.h"

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

const char* const kAts = "ats";
const char* const kScsi = "scsi";

enum Field { kVolumeName, kUuid, kType, kLockingMode, kCompatible, kUpgradeModes, kIncompatibility };

const ColumnTable kColumns("VolumeLockModeConfiguration", {
                                                              {kVolumeName, "Volume Name"},
                                                              {kUuid, "UUID"},
                                                              {kType, "Type"},
                                                              {kLockingMode, "Locking Mode"},
                                                              {kCompatible, "ATS Compatible", ColumnType::Bool},
                                                              {kUpgradeModes, "ATS Upgrade Modes"},
                                                              {kIncompatibility, "ATS Incompatibility Reason"},
                                                          });

// A missing reason leaves the field at its empty value.
void SetCompatibility(Row& row, bool compatible, const char* upgradeModes, const char* reason)
{
    row.Set(kCompatible, compatible);
    row.Set(kUpgradeModes, upgradeModes);
    if (reason != nullptr) {
        row.Set(kIncompatibility, reason);
    }
}

// Fills "ATS Compatible", "ATS Upgrade Modes" and "ATS Incompatibility Reason".
void UpdateATSCompatibility(bool onlineUpgradeEnabled, HlFileSystem& volume, Row& row)
{
    // A volume with only the downgrade-pending bit is judged like an ATS+SCSI one.
    if ((volume.GetLockMode() & (LockModeBits::AtsOnly | LockModeBits::UpgradePending)) != 0) {
        SetCompatibility(row, true, "No upgrade needed", nullptr);
        return;
    }
    if (volume.GetMajorVersion() == 3) {
        SetCompatibility(row, false, "None", "ATS on HLFS-3 not supported");
        return;
    }
    if (volume.GetATSSupport() != 1) {
        SetCompatibility(row, false, "None", "Device does not support ATS");
        return;
    }
    const bool singleExtent = volume.GetExtents().size() <= 1;
    SetCompatibility(row, true, singleExtent && onlineUpgradeEnabled ? "Online/Offline" : "Offline", nullptr);
}

// The volumes named by volume-label and volume-uuid (labels first, every name tried,
// duplicates kept), or every HLFS volume when none is named. True: go on and produce output
// from `volumes`; false: stop without output.
bool GetMultipleHLFSVolumes(const InputPtr& in, const OutputPtr& out,
                            std::vector<std::unique_ptr<HlFileSystem>>& volumes)
{
    std::vector<std::string> labels;
    std::vector<std::string> uuids;
    in->GetParameterList(kOptionVolumeLabel, labels);
    in->GetParameterList(kOptionVolumeUuid, uuids);
    const bool ignore = in->IsFlagSet(kOptionIgnoreErrors);

    bool ok = true;
    const bool completed = Guarded(out, [&] {
        auto storage = OpenHostStorageInfo();
        if (labels.empty() && uuids.empty()) {
            volumes = storage->GetHlfsFileSystems(HostCtl::emptyString);
            return;
        }
        auto collect = [&](const std::vector<std::string>& names, VolumeKey key, const char* kind) {
            for (const auto& name : names) {
                auto volume = key == VolumeKey::Uuid ? storage->GetHlfsFileSystemByUuid(name)
                                                     : storage->GetHlfsFileSystemByLabel(name);
                if (volume) {
                    volumes.push_back(std::move(volume));
                } else if (!ignore) {
                    out->AddErrorMessage(std::string("Error fetching HLFS volume with ") + kind + " '" + name + "'");
                    ok = false;
                }
            }
        };
        collect(labels, VolumeKey::Label, "label");
        collect(uuids, VolumeKey::Uuid, "uuid");
    });
    if (!completed) {
        return ignore;
    }
    return ok || ignore;
}

const CommandDecl kHLFSVolumeLockModeListDecl = {
    .description = "List the on-disk critical section locking mode for HLFS volumes available on this host.",
    .result = ListOf(kColumns),
    .formatter = "table",
    .examples = {{"", "Show lockmodes for all HLFS volumes."},
                 {"-l datastore1", "Show lockmode for HLFS volume with label 'datastore1'."},
                 {"-l datastore1 -l datastore2",
                  "Show lockmodes for HLFS volume with label 'datastore1' and HLFS volume with label 'datastore2'."},
                 {"-l datastore1 -u 50ac1b12-6b9eebe0-6765-80c16e6d3408",
                  "Show lockmodes for HLFS volume with label 'datastore1' and HLFS volume with uuid "
                  "'50ac1b12-6b9eebe0-6765-80c16e6d3408'."}},
    .parameters = {LabelParameter("The label of the target HLFS volume.", ParameterType::StringList),
                   UuidParameter("The uuid of the target HLFS volume.", ParameterType::StringList),
                   IgnoreErrorsParameter()}};

// storage hlfs lockmode list
class HLFSVolumeLockModeList final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const SkipReport report{"Error getting data for filesystem on '", &HostCtl::Storage::FileSystem::GetMountPoint,
                                in->IsFlagSet(kOptionIgnoreErrors)};
        Guarded(out, [&] {
            const std::optional<bool> onlineUpgradeEnabled = ReadOnlineUpgradeEnabled(out);
            if (!onlineUpgradeEnabled) {
                return;
            }
            const RowShape shape = Rows();
            auto list = shape.EmptyList();
            std::vector<std::unique_ptr<HlFileSystem>> volumes;
            if (!GetMultipleHLFSVolumes(in, out, volumes)) {
                return;
            }
            ReadEachOrSkip(volumes, report, out, [&](HlFileSystem& volume) {
                auto row = shape.NewRow();
                row.Set(kVolumeName, volume.GetVolumeName());
                row.Set(kUuid, volume.GetUuid());
                row.Set(kType, GetHLFSVersionString(&volume));
                row.Set(kLockingMode, TranslateLockMode(volume.GetLockMode()));
                UpdateATSCompatibility(*onlineUpgradeEnabled, volume, row);
                list->Add(row.Structure());
            });
            out->SetRootObject(list);
        });
    }
};

const VolumeSelectorTexts kLockModeTexts = {"You cannot specify both --ats and --scsi.",
                                            "The requested lockmode must be specified either by --ats or --scsi.",
                                            nullptr, nullptr};

const CommandDecl kHLFSVolumeLockModeSetDecl = {
    .description = "Update the on-disk critical section locking mode for a particular HLFS Volume.",
    .examples = {{"-a -l datastore1", "Configure HLFS volume with label 'datastore1'for ATS-only locking."},
                 {"-s -u 50ac1b12-6b9eebe0-6765-80c16e6d3408",
                  "Configure HLFS volume with uuid '50ac1b12-6b9eebe0-6765-80c16e6d3408' for SCSI locking."}},
    .parameters = {HlfsLabelParameter(),
                   HlfsUuidParameter(),
                   {kAts, "a", ParameterType::Flag, "Enable ATS-only locking."},
                   {kScsi, "s", ParameterType::Flag, "Enable SCSI locking."}}};

// storage hlfs lockmode set
class HLFSVolumeLockModeSet final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const bool ats = in->IsFlagSet(kAts);
        const bool scsi = in->IsFlagSet(kScsi);
        if (!ExactlyOneOf({{ats, kLockModeTexts.both}, {scsi, kLockModeTexts.both}}, kLockModeTexts.neither, out)) {
            return;
        }
        WithSingleHLFSVolume(in, out, [&](HlFileSystem& volume) {
            // Only the ATS-only bit changes; pending bits are carried over as they are.
            const unsigned mode = volume.GetLockMode();
            const bool atsOnly = (mode & LockModeBits::AtsOnly) != 0;
            if (ats && !atsOnly) {
                volume.SetLockMode(mode | LockModeBits::AtsOnly);
            } else if (scsi && atsOnly) {
                volume.SetLockMode(mode & ~LockModeBits::AtsOnly);
            }
            out->SetRootObject(MetaBool::New(true));
        });
    }
};

} // namespace

const char* TranslateLockMode(unsigned mode)
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

NodePtr NewHLFSVolumeLockModeList() { return New<HLFSVolumeLockModeList>(kHLFSVolumeLockModeListDecl); }
NodePtr NewHLFSVolumeLockModeSet() { return New<HLFSVolumeLockModeSet>(kHLFSVolumeLockModeSetDecl); }

} // namespace OrvaneCli::FileSystem

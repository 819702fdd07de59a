#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "hlfs/Manifest.h"

namespace OrvaneCli::FileSystem {

using HostCtl::Storage::HlfsUserInfo;

namespace {

constexpr unsigned char kHostAtsOnly = 4;

constexpr const char* kNormal = "Normal";
constexpr const char* kInvalid = "INVALID (needs unmount)";
constexpr const char* kUpgradePending = "ATS Upgrade Pending";
constexpr const char* kDowngradePending = "ATS Downgrade Pending";

const char* const kLiveness = "liveness";
enum Field { kHeartbeatUuid, kMacAddress, kDriverVersion, kHeartbeatOffset, kLockingMode, kStatus };

const ColumnTable kColumns("VolumeLockModeInUse", {
                                                      {kHeartbeatUuid, "Heartbeat UUID"},
                                                      {kMacAddress, "MAC Address"},
                                                      {kDriverVersion, "Driver Version"},
                                                      {kHeartbeatOffset, "Heartbeat Offset", ColumnType::Int},
                                                      {kLockingMode, "Locking Mode"},
                                                      {kStatus, "Status"},
                                                  });

const CommandDecl kHLFSVolumeHostListDecl = {
    .description = "List hosts accessing a particular HLFS Volume.",
    .result = ListOf(kColumns),
    .formatter = "table",
    .examples = {{"-l datastore1", "List hosts using volume 'datastore1' with default liveness check of 'none'."},
                 {"-l datastore1 -v quick", "List hosts using volume 'datastore1' with liveness check of 'quick'."}},
    .parameters = {HlfsLabelParameter(),
                   HlfsUuidParameter(),
                   {kLiveness, "v", ParameterType::String,
                    "The type of liveness check to perform on the HLFS volume. Valid values are %ENUM% (default is "
                    "none).",
                    false,
                    StringEnum({{"none", "No liveness check, just scan heartbeats (default)"},
                                {"quick", "Quick liveness check, wait for one heartbeat interval"}})}}};

// storage hlfs host list
class HLFSVolumeHostList final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const bool quick = in->GetParameter(kLiveness) == "quick";
        WithSingleHLFSVolume(in, out, [&](HlFileSystem& volume) {
            const RowShape shape = Rows();
            auto list = shape.EmptyList();
            for (const HlfsUserInfo& record : volume.GetUsers(quick)) {
                auto row = shape.NewRow();
                row.Set(kHeartbeatUuid, record.heartbeatUuid);
                row.Set(kMacAddress, record.macAddress.GetStringAddress());
                row.Set(kDriverVersion,
                        std::to_string(record.driverVersionMajor) + "." + std::to_string(record.driverVersionMinor));
                row.Set(kHeartbeatOffset, static_cast<long>(record.heartbeatOffset));
                row.Set(kLockingMode, TranslateLockModeInUse(record.lockModeInUse));
                row.Set(kStatus, TranslateStatus(volume.GetLockMode(), record.lockModeInUse));
                list->Add(row.Structure());
            }
            out->SetRootObject(list);
        });
    }
};

} // namespace

const char* TranslateLockModeInUse(unsigned char hostMode)
{
    return hostMode == kHostAtsOnly ? "ATS-only" : "ATS+SCSI";
}

const char* TranslateStatus(unsigned int volumeMode, unsigned char hostMode)
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

NodePtr NewHLFSVolumeHostList() { return New<HLFSVolumeHostList>(kHLFSVolumeHostListDecl); }

} // namespace OrvaneCli::FileSystem

#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "nfs/Manifest.h"

namespace OrvaneCli::FileSystem {

using HostCtl::Storage::QAXIState;

const char* TranslateQAXI(QAXIState state)
{
    switch (state) {
    case HostCtl::Storage::QAXI_SUPPORTED:
        return "Supported";
    case HostCtl::Storage::QAXI_NOT_SUPPORTED:
        return "Not Supported";
    default:
        return "Unknown";
    }
}

const std::string& TranslateSecurity(NetworkFileSystem::SecurityType security)
{
    switch (security) {
    case NetworkFileSystem::SEC_NONE:
        return NetworkFileSystem::NFS_AUTH_NONE_STR;
    case NetworkFileSystem::SEC_SYS:
        return NetworkFileSystem::NFS_AUTH_SYS_STR;
    case NetworkFileSystem::SEC_KRB5:
        return NetworkFileSystem::NFS_AUTH_KRB5_STR;
    case NetworkFileSystem::SEC_KRB5I:
        return NetworkFileSystem::NFS_AUTH_KRB5I_STR;
    case NetworkFileSystem::SEC_KRB5P:
        return NetworkFileSystem::NFS_AUTH_KRB5P_STR;
    }
    return NetworkFileSystem::NFS_AUTH_UNKNOWN_STR;
}

namespace {

const char* const kPeOnly = "pe-only";
// The fields of both lists; each version's table holds its own.
enum Field {
    kVolumeName,
    kHost,
    kHosts,
    kShare,
    kKnxnic,
    kKnxnics,
    kConnections,
    kAccessible,
    kMounted,
    kReadOnly,
    kSecurity,
    kIsPE,
    kAcceleration
};

const ColumnTable kV3Columns(
    "NasMount",
    {
        {kVolumeName, "Volume Name"},
        {kHost, "Host"},
        {kShare, "Share"},
        {kKnxnic, "Knxnic", ColumnType::String, {.feature = Feature::NfsKnxnicBinding}},
        {kConnections, "Connections", ColumnType::Int, {.feature = Feature::NfsConnections, .shownAfter = kMounted}},
        {kAccessible, "Accessible", ColumnType::Bool},
        {kMounted, "Mounted", ColumnType::Bool},
        {kReadOnly, "Read-Only", ColumnType::Bool},
        {kIsPE, "isPE", ColumnType::Bool},
        {kAcceleration, "Hardware Acceleration"},
    });

const ColumnTable kV41Columns("NasMount",
                              {
                                  {kVolumeName, "Volume Name"},
                                  {kHosts, "Host(s)"},
                                  {kShare, "Share"},
                                  {kKnxnics, "Knxnics", ColumnType::String, {.feature = Feature::Nfs41KnxnicBinding}},
                                  {kAccessible, "Accessible", ColumnType::Bool},
                                  {kMounted, "Mounted", ColumnType::Bool},
                                  {kReadOnly, "Read-Only", ColumnType::Bool},
                                  {kSecurity, "Security"},
                                  {kIsPE, "isPE", ColumnType::Bool},
                                  {kAcceleration, "Hardware Acceleration"},
                              });

// One row of either list, in the order the host is asked; the row's shape says which
// version's fields it has.
void FillRow(NetworkFileSystem& volume, const RowShape& shape, Row& row)
{
    const bool v41 = shape.Has(kHosts);
    row.Set(kVolumeName, volume.GetVolumeName());
    if (v41) {
        row.Set(kHosts, JoinWithCommas(volume.GetRemoteHosts()));
    } else {
        row.Set(kHost, volume.GetRemoteHost());
    }
    row.Set(kShare, volume.GetRemoteShare());
    row.SetIfPresent(kKnxnic, [&] { return volume.GetKnxnic(); })
        .SetIfPresent(kKnxnics, [&] { return volume.GetKnxnics(); })
        .SetIfPresent(kConnections, [&] { return static_cast<long>(volume.GetConnections()); });
    row.Set(kAccessible, volume.IsAccessible());
    row.Set(kMounted, volume.IsMounted());
    row.Set(kReadOnly, v41 ? volume.GetReadOnlyState() : volume.IsReadOnly());
    if (v41) {
        row.Set(kSecurity, TranslateSecurity(volume.GetSecurityType()));
    }
    row.Set(kIsPE, volume.IsPE());
    row.Set(kAcceleration, TranslateQAXI(volume.GetQAXIState()));
}

const CommandDecl kV3Decl = {
    .description = "List the NAS volumes currently known to the Zephal host.",
    .result = ListOf(kV3Columns),
    .formatter = "table",
    .parameters = {{kPeOnly, "p", ParameterType::Flag, "Filter the output to only show TVol PE volumes"}}};

const CommandDecl kV41Decl = {
    .description = "List the NFS v4.1 volumes currently known to the Zephal host.",
    .result = ListOf(kV41Columns),
    .formatter = "table",
    .parameters = {{kPeOnly, "p", ParameterType::Flag, "Filter the output to only show TVol PE Volumes"}}};

// storage nfs list, storage nfs41 list: one row per volume of that version the filter lets
// through; a volume that cannot be read is reported and left out.
template <HostCtl::Storage::NfsVersion kVersion>
class NfsVolumeList final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const auto filter = in->IsFlagSet(kPeOnly) ? &StorageInfoImpl::IsPE : &StorageInfoImpl::IsNotHidden;
        // The switches as one execution sees them, so that its rows all have one shape.
        const RowShape shape = Rows();
        auto rows = shape.EmptyList();
        const SkipReport report{"Error getting data for mount '", &HostCtl::Storage::FileSystem::GetVolumeName};
        WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
            const auto volumes = kVersion == HostCtl::Storage::NFS_VERSION_41 ? storage.GetV41NetworkFileSystems(filter)
                                                                              : storage.GetV3NetworkFileSystems(filter);
            ReadEachOrSkip(volumes, report, out, [&](NetworkFileSystem& volume) {
                auto row = shape.NewRow();
                FillRow(volume, shape, row);
                rows->Add(row.Structure());
            });
            out->SetRootObject(rows);
        });
    }
};

} // namespace

NodePtr NewNFSVolumeList() { return New<NfsVolumeList<HostCtl::Storage::NFS_VERSION_3>>(kV3Decl); }
NodePtr NewNFS41VolumeList() { return New<NfsVolumeList<HostCtl::Storage::NFS_VERSION_41>>(kV41Decl); }

} // namespace OrvaneCli::FileSystem

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

using VolumeQuery = std::vector<std::unique_ptr<NetworkFileSystem>> (*)(StorageInfoImpl& storage,
                                                                         StorageInfoImpl::NetworkFileSystemFilter filter);

const char* const kPeOnly = "pe-only";
namespace V3 {
enum Field { kVolumeName, kHost, kShare, kKnxnic, kConnections, kAccessible, kMounted, kReadOnly, kIsPE, kAcceleration };
} // namespace V3

const ColumnTable kV3Columns(
    "NasMount",
    {
        {V3::kVolumeName, "Volume Name", ColumnType::String},
        {V3::kHost, "Host", ColumnType::String},
        {V3::kShare, "Share", ColumnType::String},
        {V3::kKnxnic, "Knxnic", ColumnType::String, {.feature = Feature::NfsKnxnicBinding}},
        {V3::kConnections, "Connections", ColumnType::Int,
         {.feature = Feature::NfsConnections, .shownAfter = V3::kMounted}},
        {V3::kAccessible, "Accessible", ColumnType::Bool},
        {V3::kMounted, "Mounted", ColumnType::Bool},
        {V3::kReadOnly, "Read-Only", ColumnType::Bool},
        {V3::kIsPE, "isPE", ColumnType::Bool},
        {V3::kAcceleration, "Hardware Acceleration", ColumnType::String},
    });

namespace V41 {
enum Field { kVolumeName, kHosts, kShare, kKnxnics, kAccessible, kMounted, kReadOnly, kSecurity, kIsPE, kAcceleration };
} // namespace V41

const ColumnTable kV41Columns("NasMount",
                              {
                                  {V41::kVolumeName, "Volume Name", ColumnType::String},
                                  {V41::kHosts, "Host(s)", ColumnType::String},
                                  {V41::kShare, "Share", ColumnType::String},
                                  {V41::kKnxnics, "Knxnics", ColumnType::String,
                                   {.feature = Feature::Nfs41KnxnicBinding}},
                                  {V41::kAccessible, "Accessible", ColumnType::Bool},
                                  {V41::kMounted, "Mounted", ColumnType::Bool},
                                  {V41::kReadOnly, "Read-Only", ColumnType::Bool},
                                  {V41::kSecurity, "Security", ColumnType::String},
                                  {V41::kIsPE, "isPE", ColumnType::Bool},
                                  {V41::kAcceleration, "Hardware Acceleration", ColumnType::String},
                              });

// The list of one NFS version: one row per volume the filter lets through; a volume that
// cannot be read is reported and left out.
class NfsListCommand : public StorageCommand {
protected:
    NfsListCommand(const char* description, const ColumnTable& columns, VolumeQuery query, const char* peOnly)
        : StorageCommand({
              .description = description,
              .result = ListOf(columns),
              .formatter = "table",
              .parameters = {{kPeOnly, "p", ParameterType::Flag, peOnly}},
          }),
          query_(query)
    {
    }

    virtual void FillRow(NetworkFileSystem& volume, const RowShape& shape, Row& row) = 0;

private:
    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const auto filter = in->IsFlagSet(kPeOnly) ? &StorageInfoImpl::IsPE : &StorageInfoImpl::IsNotHidden;
        // The switches as one execution sees them, so that its rows all have one shape.
        const RowShape shape = Rows();
        auto rows = shape.EmptyList();
        const SkipReport report{"Error getting data for mount '", &HostCtl::Storage::FileSystem::GetVolumeName};
        WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
            ReadEachOrSkip(query_(storage, filter), report, out, [&](NetworkFileSystem& volume) {
                auto row = shape.NewRow();
                FillRow(volume, shape, row);
                rows->Add(row.Structure());
            });
            out->SetRootObject(rows);
        });
    }

    VolumeQuery query_;
};

// storage nfs list
class NFSVolumeList final : public NfsListCommand {
public:
    NFSVolumeList()
        : NfsListCommand("List the NAS volumes currently known to the Zephal host.", kV3Columns,
                         [](StorageInfoImpl& storage, StorageInfoImpl::NetworkFileSystemFilter filter) {
                             return storage.GetV3NetworkFileSystems(filter);
                         },
                          "Filter the output to only show TVol PE volumes")
    {
    }

private:
    void FillRow(NetworkFileSystem& volume, const RowShape& shape, Row& row) override
    {
        using namespace V3;
        row.Set(kVolumeName, volume.GetVolumeName());
        row.Set(kHost, volume.GetRemoteHost());
        row.Set(kShare, volume.GetRemoteShare());
        if (shape.Has(kKnxnic)) {
            row.Set(kKnxnic, volume.GetKnxnic());
        }
        if (shape.Has(kConnections)) {
            row.Set(kConnections, static_cast<long>(volume.GetConnections()));
        }
        row.Set(kAccessible, volume.IsAccessible());
        row.Set(kMounted, volume.IsMounted());
        row.Set(kReadOnly, volume.IsReadOnly());
        row.Set(kIsPE, volume.IsPE());
        row.Set(kAcceleration, TranslateQAXI(volume.GetQAXIState()));
    }
};

// storage nfs41 list
class NFS41VolumeList final : public NfsListCommand {
public:
    NFS41VolumeList()
        : NfsListCommand("List the NFS v4.1 volumes currently known to the Zephal host.", kV41Columns,
                         [](StorageInfoImpl& storage, StorageInfoImpl::NetworkFileSystemFilter filter) {
                             return storage.GetV41NetworkFileSystems(filter);
                         },
                          "Filter the output to only show TVol PE Volumes")
    {
    }

private:
    void FillRow(NetworkFileSystem& volume, const RowShape& shape, Row& row) override
    {
        using namespace V41;
        row.Set(kVolumeName, volume.GetVolumeName());
        row.Set(kHosts, JoinWithCommas(volume.GetRemoteHosts()));
        row.Set(kShare, volume.GetRemoteShare());
        if (shape.Has(kKnxnics)) {
            row.Set(kKnxnics, volume.GetKnxnics());
        }
        row.Set(kAccessible, volume.IsAccessible());
        row.Set(kMounted, volume.IsMounted());
        row.Set(kReadOnly, volume.GetReadOnlyState());
        row.Set(kSecurity, TranslateSecurity(volume.GetSecurityType()));
        row.Set(kIsPE, volume.IsPE());
        row.Set(kAcceleration, TranslateQAXI(volume.GetQAXIState()));
    }
};

} // namespace

NodePtr NewNFSVolumeList() { return New<NFSVolumeList>(); }
NodePtr NewNFS41VolumeList() { return New<NFS41VolumeList>(); }

} // namespace OrvaneCli::FileSystem

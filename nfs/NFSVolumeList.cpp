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
const char* const kVolumeName = "Volume Name";
const char* const kHost = "Host";
const char* const kHosts = "Host(s)";
const char* const kShare = "Share";
const char* const kKnxnic = "Knxnic";
const char* const kKnxnics = "Knxnics";
const char* const kConnections = "Connections";
const char* const kAccessible = "Accessible";
const char* const kMounted = "Mounted";
const char* const kReadOnly = "Read-Only";
const char* const kSecurity = "Security";
const char* const kIsPE = "isPE";
const char* const kAcceleration = "Hardware Acceleration";

const ColumnTable kV3Columns("NasMount", {
    {kVolumeName, ColumnType::String},
    {kHost, ColumnType::String},
    {kShare, ColumnType::String},
    {.title = kKnxnic, .type = ColumnType::String, .feature = Feature::NfsKnxnicBinding},
    {.title = kConnections, .type = ColumnType::Int, .feature = Feature::NfsConnections, .shownAfter = kMounted},
    {kAccessible, ColumnType::Bool},
    {kMounted, ColumnType::Bool},
    {kReadOnly, ColumnType::Bool},
    {kIsPE, ColumnType::Bool},
    {kAcceleration, ColumnType::String},
});

const ColumnTable kV41Columns("NasMount", {
    {kVolumeName, ColumnType::String},
    {kHosts, ColumnType::String},
    {kShare, ColumnType::String},
    {.title = kKnxnics, .type = ColumnType::String, .feature = Feature::Nfs41KnxnicBinding},
    {kAccessible, ColumnType::Bool},
    {kMounted, ColumnType::Bool},
    {kReadOnly, ColumnType::Bool},
    {kSecurity, ColumnType::String},
    {kIsPE, ColumnType::Bool},
    {kAcceleration, ColumnType::String},
});

// The list of one NFS version: one row per volume the filter lets through; a volume that
// cannot be read is reported and left out.
class NfsListCommand : public StorageCommand {
protected:
    NfsListCommand(const char* description, const ColumnTable& columns, VolumeQuery query, const char* peOnly)
        : StorageCommand({description, ListOf(columns), "table"}), query_(query), peOnly_(peOnly)
    {
    }

    virtual void FillRow(NetworkFileSystem& volume, const RowShape& shape, Row& row) = 0;

private:
    void DeclareParameters(const std::shared_ptr<InputSpec>& inputs) override
    {
        AddParameter(inputs, {kPeOnly, "p", ParameterType::Flag, peOnly_});
    }

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
    const char* peOnly_;
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

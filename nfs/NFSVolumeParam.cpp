#include <initializer_list>
#include <vector>

#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "nfs/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {
constexpr const char* kMaxQueueDepth = "maxqueuedepth";
constexpr const char* kKnxnic = "knxnic";
constexpr const char* kAllVolumes = "all";

// The non-PE volumes of one NFS version.
using VolumeQuery = std::vector<std::unique_ptr<NetworkFileSystem>> (*)(StorageInfoImpl&);

std::vector<std::unique_ptr<NetworkFileSystem>> NonPEV3Volumes(StorageInfoImpl& storage)
{
    return storage.GetV3NetworkFileSystems(&StorageInfoImpl::IsNotPE);
}

std::vector<std::unique_ptr<NetworkFileSystem>> NonPEV41Volumes(StorageInfoImpl& storage)
{
    return storage.GetV41NetworkFileSystems(&StorageInfoImpl::IsNotPE);
}

// The first four fields are the same in both versions; each adds its own after them.
enum Field {
    kVolumeNameField,
    kMaxQueueDepthField,
    kMaxReadField,
    kMaxWriteField,
    kKnxnicField,
    kKnxnicsField,
    kConnectionsField
};

// The columns of both versions, then `own`, the version's own ones.
std::vector<Column> ParamColumns(std::initializer_list<Column> own)
{
    std::vector<Column> columns = {
        {kVolumeNameField, "Volume Name"},
        {kMaxQueueDepthField, "MaxQueueDepth", ColumnType::Int},
        {kMaxReadField, "MaxReadTransferSize", ColumnType::Int},
        {kMaxWriteField, "MaxWriteTransferSize", ColumnType::Int},
    };
    columns.insert(columns.end(), own);
    return columns;
}

const ColumnTable kV3Columns(
    "NasMountParams",
    ParamColumns({{kKnxnicField, "Knxnic", ColumnType::String, {.feature = Feature::NfsKnxnicBinding}},
                  {kConnectionsField, "Connections", ColumnType::Int, {.feature = Feature::NfsConnections}}}));

const ColumnTable kV41Columns(
    "NasMountParams",
    ParamColumns({{kKnxnicsField, "Knxnics", ColumnType::String, {.feature = Feature::Nfs41KnxnicBinding}}}));

// Rows of the non-PE volumes named `name` (only the first that could be read), or of every
// one for "all". `fillExtras` sets the fields after the sizes. A volume's name is read outside
// the skip region: failing to read it ends the listing.
template <typename FillExtras>
void ListVolumeParams(const std::string& name, VolumeQuery query, const RowShape& shape, const OutputPtr& out,
                      FillExtras&& fillExtras)
{
    const bool all = name == kAllVolumes;
    auto rows = shape.EmptyList();
    const SkipReport report{"Error getting params for mount '", &HostCtl::Storage::FileSystem::GetVolumeName};
    WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
        const auto volumes = query(storage);
        for (const auto& volume : volumes) {
            const std::string volumeName = volume->GetVolumeName();
            if (!all && volumeName != name) {
                continue;
            }
            const bool added = ReadOrSkip(*volume, report, out, [&](NetworkFileSystem& readable) {
                auto row = shape.NewRow();
                row.Set(kVolumeNameField, volumeName);
                row.Set(kMaxQueueDepthField, static_cast<long>(readable.GetMaxQueueDepth()));
                row.Set(kMaxReadField, static_cast<long>(readable.GetMaxReadTransferSize()));
                row.Set(kMaxWriteField, static_cast<long>(readable.GetMaxWriteTransferSize()));
                fillExtras(readable, row);
                rows->Add(row.Structure());
            });
            if (added && !all) {
                break;
            }
        }
        out->SetRootObject(rows);
    });
}

// Applies `apply` to every non-PE volume named `name`. The first failure is reported and ends
// the command without a result (what was applied before it stays applied). Finding no such
// volume is a failure too: nothing was changed, so success would be a false report.
template <typename Apply>
void SetVolumeParams(const std::string& name, VolumeQuery query, const char* kindOfVolume, const OutputPtr& out,
                     Apply&& apply)
{
    WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
        const auto volumes = query(storage);
        bool found = false;
        for (const auto& volume : volumes) {
            if (volume->GetVolumeName() != name) {
                continue;
            }
            found = true;
            try {
                apply(*volume);
            } catch (const HostCtlException& e) {
                out->AddErrorMessage(HostCtl::Misc::StrCat("Error setting params for mount '", name, "': ", e.message));
                return;
            }
        }
        if (!found) {
            out->AddErrorMessage(HostCtl::Misc::StrCat("No ", kindOfVolume, " volume named '", name, "' was found"));
            return;
        }
        out->SetRootObject(MetaBool::New(true));
    });
}

void ApplyMaxQueueDepth(const InputPtr& in, NetworkFileSystem& volume)
{
    if (in->HasParameter(kMaxQueueDepth)) {
        volume.SetMaxQueueDepth(static_cast<std::uint32_t>(in->GetParameterInt(kMaxQueueDepth)), true);
    }
}

ParameterDecl MaxQueueDepthParameter(const char* description)
{
    return {kMaxQueueDepth, "q", ParameterType::Int, description, false, IntRange(1, 4294967295L)};
}

// storage nfs param get, storage nfs41 param get: the row's shape says which fields follow
// the sizes.
template <HostCtl::Storage::NfsVersion kVersion>
class NfsParamGet final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const RowShape shape = Rows();
        const VolumeQuery query = kVersion == HostCtl::Storage::NFS_VERSION_41 ? NonPEV41Volumes : NonPEV3Volumes;
        ListVolumeParams(
            in->GetParameter(kOptionVolumeName), query, shape, out, [&](NetworkFileSystem& volume, Row& row) {
                row.SetIfPresent(kKnxnicField, [&] { return volume.GetKnxnics(); })
                    .SetIfPresent(kKnxnicsField, [&] { return volume.GetKnxnics(); })
                    .SetIfPresent(kConnectionsField, [&] { return static_cast<long>(volume.GetConnectionsParam()); });
            });
    }
};

const CommandDecl kV3GetDecl = {
    .description = "Get the volume parameters of the NAS volumes.",
    .result = ListOf(kV3Columns),
    .formatter = "table",
    .parameters = {{kOptionVolumeName, "v", ParameterType::String, "NAS volume name(\"all\" to list all).", true}}};

const CommandDecl kV41GetDecl = {.description = "Get the volume parameters of the NFS v4.1 volumes.",
                                 .result = ListOf(kV41Columns),
                                 .formatter = "table",
                                 .parameters = {{kOptionVolumeName, "v", ParameterType::String,
                                                 "NFS v4.1 volume name(\"all\" to list all).", true}}};

const CommandDecl kNFSVolumeParamSetDecl = {
    .description = "Set the volume parameters of the NAS volumes.",
    .parameters = {{kOptionVolumeName, "v", ParameterType::String, "The NAS volume name.", true},
                   MaxQueueDepthParameter("The maximum queue depth for the NAS volume."),
                   {kKnxnic, "I", ParameterType::String, "The new knxnic to be configured for the NAS volume.", false,
                    nullptr, Feature::NfsKnxnicBinding},
                   {kOptionConnections, "c", ParameterType::Int,
                    "The number of RPC connections to be established for the NFS datastore. A higher number of "
                    "connections yields better performance on datastores with higher IO load.",
                    false, IntRange(1, 8), Feature::NfsConnections}}};

// storage nfs param set
class NFSVolumeParamSet final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const bool knxnicBinding = IsFeatureEnabled(Feature::NfsKnxnicBinding);
        const bool connections = IsFeatureEnabled(Feature::NfsConnections);
        // Only parameters the switches declared are read.
        const std::string knxnic = knxnicBinding ? in->GetParameter(kKnxnic) : std::string();
        const bool setKnxnic = IsGiven(knxnic);
        const bool setConnections = connections && in->HasParameter(kOptionConnections);
        SetVolumeParams(
            in->GetParameter(kOptionVolumeName), NonPEV3Volumes, "NAS", out, [&](NetworkFileSystem& volume) {
                ApplyMaxQueueDepth(in, volume);
                if (setKnxnic) {
                    volume.SetKnxnics(knxnic);
                }
                if (setConnections) {
                    volume.SetConnectionsParam(static_cast<std::int32_t>(in->GetParameterInt(kOptionConnections)));
                }
            });
    }
};

const CommandDecl kNFS41VolumeParamSetDecl = {
    .description = "Set the volume parameters of the NFS v4.1 volumes.",
    .parameters = {{kOptionVolumeName, "v", ParameterType::String, "The NFS v4.1 volume name.", true},
                   MaxQueueDepthParameter("The maximum queue depth for the NFS v4.1 volume."),
                   {kOptionHostKnxnic, "I", ParameterType::StringList,
                    "The hostname or IP address followed by a colon(:) and knxnic name. This parameter can be "
                    "specified more than once. E.g.: --host-knxnic=host1:knxnic1 --host-knxnic=ip2:knxnic2",
                    false, nullptr, Feature::Nfs41KnxnicBinding}}};

// storage nfs41 param set
class NFS41VolumeParamSet final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        std::vector<std::string> hostKnxnics;
        if (IsFeatureEnabled(Feature::Nfs41KnxnicBinding)) {
            in->GetParameterList(kOptionHostKnxnic, hostKnxnics);
        }
        const std::string knxnics = JoinWithCommas(hostKnxnics);
        SetVolumeParams(in->GetParameter(kOptionVolumeName), NonPEV41Volumes, "NFS v4.1", out,
                        [&](NetworkFileSystem& volume) {
                            ApplyMaxQueueDepth(in, volume);
                            if (!hostKnxnics.empty()) {
                                volume.SetKnxnics(knxnics);
                            }
                        });
    }
};

} // namespace

NodePtr NewNFSVolumeParamGet() { return New<NfsParamGet<HostCtl::Storage::NFS_VERSION_3>>(kV3GetDecl); }
NodePtr NewNFSVolumeParamSet() { return New<NFSVolumeParamSet>(kNFSVolumeParamSetDecl); }
NodePtr NewNFS41VolumeParamGet() { return New<NfsParamGet<HostCtl::Storage::NFS_VERSION_41>>(kV41GetDecl); }
NodePtr NewNFS41VolumeParamSet() { return New<NFS41VolumeParamSet>(kNFS41VolumeParamSetDecl); }

} // namespace OrvaneCli::FileSystem

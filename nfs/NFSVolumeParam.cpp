#include "nfs/NFSVolumeParam.h"

#include <vector>

#include "nfs/NFSVolumeList.h"

namespace OrvaneCli::FileSystem {

namespace {
constexpr const char* kMaxQueueDepth = "maxqueuedepth";
constexpr const char* kKnxnic = "knxnic";
constexpr const char* kConnections = "connections";
constexpr const char* kHostKnxnic = "host-knxnic";
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

struct V3ParamFeatures {
    bool knxnic = IsFeatureEnabled(Feature::NfsKnxnicBinding);
    bool connections = IsFeatureEnabled(Feature::NfsConnections);
};

std::shared_ptr<MetaStruct> MakeV3ParamRow(const V3ParamFeatures& features)
{
    return MakeStructure("NasMountParams", {
                                                {"Volume Name", FieldKind::String},
                                                {"MaxQueueDepth", FieldKind::Int},
                                                {"MaxReadTransferSize", FieldKind::Int},
                                                {"MaxWriteTransferSize", FieldKind::Int},
                                                {"Knxnic", FieldKind::String, features.knxnic},
                                                {"Connections", FieldKind::Int, features.connections},
                                            });
}

std::shared_ptr<MetaStruct> MakeV41ParamRow(bool knxnics)
{
    return MakeStructure("NasMountParams", {
                                                {"Volume Name", FieldKind::String},
                                                {"MaxQueueDepth", FieldKind::Int},
                                                {"MaxReadTransferSize", FieldKind::Int},
                                                {"MaxWriteTransferSize", FieldKind::Int},
                                                {"Knxnics", FieldKind::String, knxnics},
                                            });
}

constexpr const char* kBaseParamFields = "Volume Name, MaxQueueDepth, MaxReadTransferSize, MaxWriteTransferSize";

std::shared_ptr<InputSpec> VolumeNameInputSpec(const char* description)
{
    auto inputs = InputSpec::New();
    AddParameter(inputs, {kOptionVolumeName, "v", ParameterType::String, description, true});
    return inputs;
}

void AddMaxQueueDepthParameter(const std::shared_ptr<InputSpec>& inputs, const char* description)
{
    AddParameter(inputs, {kMaxQueueDepth, "q", ParameterType::Int, description, false, IntRange(1, 4294967295L)});
}

// Rows of the non-PE volumes named `name` (only the first that could be read), or of every
// one for "all". `makeRow` gives an empty row; `fillExtras` sets the fields after the sizes.
template <typename MakeRow, typename FillExtras>
void ListVolumeParams(const std::string& name, VolumeQuery query, const OutputPtr& out, MakeRow&& makeRow,
                      FillExtras&& fillExtras)
{
    const bool all = name == kAllVolumes;
    auto rows = MetaList::New(MetaType::Struct, makeRow());
    WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
        const auto volumes = query(storage);
        for (const auto& volume : volumes) {
            const std::string volumeName = volume->GetVolumeName();
            if (!all && volumeName != name) {
                continue;
            }
            bool added = false;
            ForVolumeOrSkip(*volume, "params", out, [&] {
                auto row = makeRow();
                row->SetField("Volume Name", volumeName);
                row->SetField("MaxQueueDepth", static_cast<long>(volume->GetMaxQueueDepth()));
                row->SetField("MaxReadTransferSize", static_cast<long>(volume->GetMaxReadTransferSize()));
                row->SetField("MaxWriteTransferSize", static_cast<long>(volume->GetMaxWriteTransferSize()));
                fillExtras(*volume, *row);
                rows->Add(row);
                added = true;
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

} // namespace

// ---- storage nfs param get ----

std::shared_ptr<NFSVolumeParamGet> NFSVolumeParamGet::New()
{
    return std::shared_ptr<NFSVolumeParamGet>(new NFSVolumeParamGet());
}

NFSVolumeParamGet::NFSVolumeParamGet()
{
    SetDescription("Get the volume parameters of the NAS volumes.");
    SetDefaultOutputFormatter("table");
    const V3ParamFeatures features;
    std::string fields = kBaseParamFields;
    if (features.knxnic) {
        fields += ", Knxnic";
    }
    if (features.connections) {
        fields += ", Connections";
    }
    SetDefaultOutputParameter("fields:NasMountParams", fields);
}

NFSVolumeParamGet::~NFSVolumeParamGet() = default;

std::shared_ptr<InputSpec> NFSVolumeParamGet::GetInputSpecInternal()
{
    return VolumeNameInputSpec("NAS volume name(\"all\" to list all).");
}

std::shared_ptr<OutputSpec> NFSVolumeParamGet::GetOutputSpecInternal() { return ListOutputSpec(GetOutputStructure()); }

std::shared_ptr<MetaStruct> NFSVolumeParamGet::GetOutputStructure() { return MakeV3ParamRow(V3ParamFeatures{}); }

void NFSVolumeParamGet::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const V3ParamFeatures features;
    ListVolumeParams(
        in->GetParameter(kOptionVolumeName), NonPEV3Volumes, out,
        [&] { return MakeV3ParamRow(features); },
        [&](NetworkFileSystem& volume, MetaStruct& row) {
            if (features.knxnic) {
                row.SetField("Knxnic", volume.GetKnxnics());
            }
            if (features.connections) {
                row.SetField("Connections", static_cast<long>(volume.GetConnectionsParam()));
            }
        });
}

// ---- storage nfs param set ----

std::shared_ptr<NFSVolumeParamSet> NFSVolumeParamSet::New()
{
    return std::shared_ptr<NFSVolumeParamSet>(new NFSVolumeParamSet());
}

NFSVolumeParamSet::NFSVolumeParamSet() { SetDescription("Set the volume parameters of the NAS volumes."); }

NFSVolumeParamSet::~NFSVolumeParamSet() = default;

std::shared_ptr<InputSpec> NFSVolumeParamSet::GetInputSpecInternal()
{
    const V3ParamFeatures features;
    auto inputs = VolumeNameInputSpec("The NAS volume name.");
    AddMaxQueueDepthParameter(inputs, "The maximum queue depth for the NAS volume.");
    if (features.knxnic) {
        AddParameter(inputs,
                     {kKnxnic, "I", ParameterType::String, "The new knxnic to be configured for the NAS volume."});
    }
    if (features.connections) {
        AddParameter(inputs, {kConnections, "c", ParameterType::Int,
                            "The number of RPC connections to be established for the NFS datastore. A higher number "
                            "of connections yields better performance on datastores with higher IO load.",
                            false, IntRange(1, 8)});
    }
    return inputs;
}

std::shared_ptr<OutputSpec> NFSVolumeParamSet::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void NFSVolumeParamSet::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const V3ParamFeatures features;
    // The knxnic parameter exists only while its feature switch is on.
    const std::string knxnic = features.knxnic ? in->GetParameter(kKnxnic) : std::string();
    const bool setKnxnic = IsGiven(knxnic);
    const bool setConnections = features.connections && in->HasParameter(kConnections);
    SetVolumeParams(in->GetParameter(kOptionVolumeName), NonPEV3Volumes, "NAS", out,
                    [&](NetworkFileSystem& volume) {
                        ApplyMaxQueueDepth(in, volume);
                        if (setKnxnic) {
                            volume.SetKnxnics(knxnic);
                        }
                        if (setConnections) {
                            volume.SetConnectionsParam(static_cast<std::int32_t>(in->GetParameterInt(kConnections)));
                        }
                    });
}

// ---- storage nfs41 param get ----

std::shared_ptr<NFS41VolumeParamGet> NFS41VolumeParamGet::New()
{
    return std::shared_ptr<NFS41VolumeParamGet>(new NFS41VolumeParamGet());
}

NFS41VolumeParamGet::NFS41VolumeParamGet()
{
    SetDescription("Get the volume parameters of the NFS v4.1 volumes.");
    SetDefaultOutputFormatter("table");
    std::string fields = kBaseParamFields;
    if (IsFeatureEnabled(Feature::Nfs41KnxnicBinding)) {
        fields += ", Knxnics";
    }
    SetDefaultOutputParameter("fields:NasMountParams", fields);
}

NFS41VolumeParamGet::~NFS41VolumeParamGet() = default;

std::shared_ptr<InputSpec> NFS41VolumeParamGet::GetInputSpecInternal()
{
    return VolumeNameInputSpec("NFS v4.1 volume name(\"all\" to list all).");
}

std::shared_ptr<OutputSpec> NFS41VolumeParamGet::GetOutputSpecInternal()
{
    return ListOutputSpec(GetOutputStructure());
}

std::shared_ptr<MetaStruct> NFS41VolumeParamGet::GetOutputStructure()
{
    return MakeV41ParamRow(IsFeatureEnabled(Feature::Nfs41KnxnicBinding));
}

void NFS41VolumeParamGet::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const bool knxnics = IsFeatureEnabled(Feature::Nfs41KnxnicBinding);
    ListVolumeParams(
        in->GetParameter(kOptionVolumeName), NonPEV41Volumes, out,
        [&] { return MakeV41ParamRow(knxnics); },
        [&](NetworkFileSystem& volume, MetaStruct& row) {
            if (knxnics) {
                row.SetField("Knxnics", volume.GetKnxnics());
            }
        });
}

// ---- storage nfs41 param set ----

std::shared_ptr<NFS41VolumeParamSet> NFS41VolumeParamSet::New()
{
    return std::shared_ptr<NFS41VolumeParamSet>(new NFS41VolumeParamSet());
}

NFS41VolumeParamSet::NFS41VolumeParamSet() { SetDescription("Set the volume parameters of the NFS v4.1 volumes."); }

NFS41VolumeParamSet::~NFS41VolumeParamSet() = default;

std::shared_ptr<InputSpec> NFS41VolumeParamSet::GetInputSpecInternal()
{
    auto inputs = VolumeNameInputSpec("The NFS v4.1 volume name.");
    AddMaxQueueDepthParameter(inputs, "The maximum queue depth for the NFS v4.1 volume.");
    if (IsFeatureEnabled(Feature::Nfs41KnxnicBinding)) {
        AddParameter(inputs, {kHostKnxnic, "I", ParameterType::StringList,
                            "The hostname or IP address followed by a colon(:) and knxnic name. This parameter can be "
                            "specified more than once. E.g.: --host-knxnic=host1:knxnic1 --host-knxnic=ip2:knxnic2"});
    }
    return inputs;
}

std::shared_ptr<OutputSpec> NFS41VolumeParamSet::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void NFS41VolumeParamSet::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    std::vector<std::string> hostKnxnics;
    if (IsFeatureEnabled(Feature::Nfs41KnxnicBinding)) {
        in->GetParameterList(kHostKnxnic, hostKnxnics);
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

} // namespace OrvaneCli::FileSystem

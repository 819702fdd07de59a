#include "nfs/NFSVolumeList.h"

namespace OrvaneCli::FileSystem {

using HostCtl::Storage::QAXIState;

std::shared_ptr<MetaStruct> MakeStructure(const char* name, std::initializer_list<FieldDecl> fields)
{
    auto structure = MetaStruct::New(name);
    for (const FieldDecl& field : fields) {
        if (!field.present) {
            continue;
        }
        switch (field.kind) {
        case FieldKind::String:
            structure->SetField(field.title, MetaString::New());
            break;
        case FieldKind::Int:
            structure->SetField(field.title, MetaInt::New());
            break;
        case FieldKind::Bool:
            structure->SetField(field.title, MetaBool::New());
            break;
        }
    }
    return structure;
}

std::string JoinWithCommas(const std::vector<std::string>& entries)
{
    std::string joined;
    for (std::size_t i = 0; i < entries.size(); ++i) {
        if (i > 0) {
            joined += ',';
        }
        joined += entries[i];
    }
    return joined;
}

namespace {

const char* HardwareAccelerationText(QAXIState state)
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

StorageInfoImpl::NetworkFileSystemFilter ListFilter(const InputPtr& in)
{
    return in->IsFlagSet("pe-only") ? &StorageInfoImpl::IsPE : &StorageInfoImpl::IsNotHidden;
}

// The switches as one execution sees them, so that its rows all have one shape.
struct V3ListFeatures {
    bool knxnic = IsFeatureEnabled(Feature::NfsKnxnicBinding);
    bool connections = IsFeatureEnabled(Feature::NfsConnections);
};

std::shared_ptr<MetaStruct> MakeV3Row(const V3ListFeatures& features)
{
    return MakeStructure("NasMount", {
                                          {"Volume Name", FieldKind::String},
                                          {"Host", FieldKind::String},
                                          {"Share", FieldKind::String},
                                          {"Knxnic", FieldKind::String, features.knxnic},
                                          {"Connections", FieldKind::Int, features.connections},
                                          {"Accessible", FieldKind::Bool},
                                          {"Mounted", FieldKind::Bool},
                                          {"Read-Only", FieldKind::Bool},
                                          {"isPE", FieldKind::Bool},
                                          {"Hardware Acceleration", FieldKind::String},
                                      });
}

std::shared_ptr<MetaStruct> MakeV41Row(bool knxnics)
{
    return MakeStructure("NasMount", {
                                          {"Volume Name", FieldKind::String},
                                          {"Host(s)", FieldKind::String},
                                          {"Share", FieldKind::String},
                                          {"Knxnics", FieldKind::String, knxnics},
                                          {"Accessible", FieldKind::Bool},
                                          {"Mounted", FieldKind::Bool},
                                          {"Read-Only", FieldKind::Bool},
                                          {"Security", FieldKind::String},
                                          {"isPE", FieldKind::Bool},
                                          {"Hardware Acceleration", FieldKind::String},
                                      });
}

std::shared_ptr<InputSpec> PeOnlyInputSpec(const char* description)
{
    auto inputs = InputSpec::New();
    AddParameter(inputs, {"pe-only", "p", ParameterType::Flag, description});
    return inputs;
}

} // namespace

// ---- storage nfs list ----

std::shared_ptr<NFSVolumeList> NFSVolumeList::New() { return std::shared_ptr<NFSVolumeList>(new NFSVolumeList()); }

NFSVolumeList::NFSVolumeList()
{
    SetDescription("List the NAS volumes currently known to the Zephal host.");
    SetDefaultOutputFormatter("table");
    const V3ListFeatures features;
    const char* fields = "Volume Name,Host,Share,Accessible,Mounted,Read-Only,isPE,Hardware Acceleration";
    if (features.knxnic && features.connections) {
        fields = "Volume Name,Host,Share,Knxnic,Accessible,Mounted,Connections,Read-Only,isPE,Hardware Acceleration";
    } else if (features.knxnic) {
        fields = "Volume Name,Host,Share,Knxnic,Accessible,Mounted,Read-Only,isPE,Hardware Acceleration";
    } else if (features.connections) {
        fields = "Volume Name,Host,Share,Accessible,Mounted,Connections,Read-Only,isPE,Hardware Acceleration";
    }
    SetDefaultOutputParameter("fields:NasMount", fields);
}

NFSVolumeList::~NFSVolumeList() = default;

std::shared_ptr<InputSpec> NFSVolumeList::GetInputSpecInternal()
{
    return PeOnlyInputSpec("Filter the output to only show TVol PE volumes");
}

std::shared_ptr<OutputSpec> NFSVolumeList::GetOutputSpecInternal() { return ListOutputSpec(GetOutputStructure()); }

std::shared_ptr<MetaStruct> NFSVolumeList::GetOutputStructure() { return MakeV3Row(V3ListFeatures{}); }

void NFSVolumeList::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const auto filter = ListFilter(in);
    const V3ListFeatures features;
    auto rows = MetaList::New(MetaType::Struct, MakeV3Row(features));
    WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
        const auto volumes = storage.GetV3NetworkFileSystems(filter);
        for (const auto& volume : volumes) {
            ForVolumeOrSkip(*volume, "data", out, [&] {
                auto row = MakeV3Row(features);
                row->SetField("Hardware Acceleration", "Unknown");
                row->SetField("Volume Name", volume->GetVolumeName());
                row->SetField("Host", volume->GetRemoteHost());
                row->SetField("Share", volume->GetRemoteShare());
                if (features.knxnic) {
                    row->SetField("Knxnic", volume->GetKnxnic());
                }
                if (features.connections) {
                    row->SetField("Connections", static_cast<long>(volume->GetConnections()));
                }
                row->SetField("Accessible", volume->IsAccessible());
                row->SetField("Mounted", volume->IsMounted());
                row->SetField("Read-Only", volume->IsReadOnly());
                row->SetField("isPE", volume->IsPE());
                row->SetField("Hardware Acceleration", HardwareAccelerationText(volume->GetQAXIState()));
                rows->Add(row);
            });
        }
        out->SetRootObject(rows);
    });
}

// ---- storage nfs41 list ----

std::shared_ptr<NFS41VolumeList> NFS41VolumeList::New()
{
    return std::shared_ptr<NFS41VolumeList>(new NFS41VolumeList());
}

NFS41VolumeList::NFS41VolumeList()
{
    SetDescription("List the NFS v4.1 volumes currently known to the Zephal host.");
    SetDefaultOutputFormatter("table");
    SetDefaultOutputParameter(
        "fields:NasMount",
        IsFeatureEnabled(Feature::Nfs41KnxnicBinding)
            ? "Volume Name,Host(s),Share,Knxnics,Accessible,Mounted,Read-Only,Security,isPE,Hardware Acceleration"
            : "Volume Name,Host(s),Share,Accessible,Mounted,Read-Only,Security,isPE,Hardware Acceleration");
}

NFS41VolumeList::~NFS41VolumeList() = default;

std::shared_ptr<InputSpec> NFS41VolumeList::GetInputSpecInternal()
{
    return PeOnlyInputSpec("Filter the output to only show TVol PE Volumes");
}

std::shared_ptr<OutputSpec> NFS41VolumeList::GetOutputSpecInternal() { return ListOutputSpec(GetOutputStructure()); }

std::shared_ptr<MetaStruct> NFS41VolumeList::GetOutputStructure()
{
    return MakeV41Row(IsFeatureEnabled(Feature::Nfs41KnxnicBinding));
}

const std::string& NFS41VolumeList::TranslateSecurity(NetworkFileSystem::SecurityType security)
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

const char* NFS41VolumeList::TranslateQAXI(QAXIState state) { return HardwareAccelerationText(state); }

void NFS41VolumeList::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const auto filter = ListFilter(in);
    const bool knxnics = IsFeatureEnabled(Feature::Nfs41KnxnicBinding);
    auto rows = MetaList::New(MetaType::Struct, MakeV41Row(knxnics));
    WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
        const auto volumes = storage.GetV41NetworkFileSystems(filter);
        for (const auto& volume : volumes) {
            ForVolumeOrSkip(*volume, "data", out, [&] {
                auto row = MakeV41Row(knxnics);
                row->SetField("Volume Name", volume->GetVolumeName());
                row->SetField("Host(s)", JoinWithCommas(volume->GetRemoteHosts()));
                row->SetField("Share", volume->GetRemoteShare());
                if (knxnics) {
                    row->SetField("Knxnics", volume->GetKnxnics());
                }
                row->SetField("Accessible", volume->IsAccessible());
                row->SetField("Mounted", volume->IsMounted());
                row->SetField("Read-Only", volume->GetReadOnlyState());
                row->SetField("Security", TranslateSecurity(volume->GetSecurityType()));
                row->SetField("isPE", volume->IsPE());
                row->SetField("Hardware Acceleration", TranslateQAXI(volume->GetQAXIState()));
                rows->Add(row);
            });
        }
        out->SetRootObject(rows);
    });
}

} // namespace OrvaneCli::FileSystem

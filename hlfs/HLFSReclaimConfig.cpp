#include "hlfs/HLFSReclaimConfig.h"

#include <limits>

#include "hlfs/HlfsVolumeSelection.h"

namespace OrvaneCli::FileSystem {

using HostCtl::Storage::HlfsVolumeUnmapProperty;

namespace {

constexpr const char* kStructureName = "HlfsReclaim";
constexpr const char* kGranularityField = "Reclaim Granularity";
constexpr const char* kPriorityField = "Reclaim Priority";
constexpr const char* kMethodField = "Reclaim Method";
constexpr const char* kBandwidthField = "Reclaim Bandwidth";

constexpr const char* kGranularityParameter = "reclaim-granularity";
constexpr const char* kPriorityParameter = "reclaim-priority";
constexpr const char* kMethodParameter = "reclaim-method";
constexpr const char* kBandwidthParameter = "reclaim-bandwidth";

constexpr const char* kMethodPriority = "priority";
constexpr const char* kMethodFixed = "fixed";

// The host keeps the granularity in an unsigned and the bandwidth in a signed 32-bit value.
constexpr std::int64_t kMaxGranularity = std::numeric_limits<std::uint32_t>::max();
constexpr std::int64_t kMinBandwidth = std::numeric_limits<std::int32_t>::min();
constexpr std::int64_t kMaxBandwidth = std::numeric_limits<std::int32_t>::max();

std::shared_ptr<MetaStruct> EmptyReclaimStructure()
{
    auto structure = MetaStruct::New(kStructureName);
    structure->SetField(kGranularityField, MetaInt::New());
    structure->SetField(kPriorityField, MetaString::New());
    structure->SetField(kMethodField, MetaString::New());
    structure->SetField(kBandwidthField, MetaInt::New());
    return structure;
}

} // namespace

std::shared_ptr<HLFSReclaimConfigGet> HLFSReclaimConfigGet::New()
{
    return std::shared_ptr<HLFSReclaimConfigGet>(new HLFSReclaimConfigGet());
}

HLFSReclaimConfigGet::HLFSReclaimConfigGet()
{
    SetDescription("Get space reclamation configuration parameters");
    SetDefaultOutputFormatter("simple");
    SetDefaultOutputParameter("fields:HlfsReclaim",
                              "Reclaim Granularity,Reclaim Priority,Reclaim Method,Reclaim Bandwidth");
    SetDefaultOutputParameter("units:HlfsReclaim.Reclaim Bandwidth", "MB/s");
    SetDefaultOutputParameter("units:HlfsReclaim.Reclaim Granularity", "Bytes");
}

HLFSReclaimConfigGet::~HLFSReclaimConfigGet() = default;

std::shared_ptr<InputSpec> HLFSReclaimConfigGet::GetInputSpecInternal() { return GetSingleHLFSVolumeInputSpec(); }

std::shared_ptr<OutputSpec> HLFSReclaimConfigGet::GetOutputSpecInternal()
{
    return StructOutputSpec(EmptyReclaimStructure());
}

void HLFSReclaimConfigGet::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const std::unique_ptr<HlFileSystem> volume = GetSingleHLFSVolume(in, out);
    if (!volume) {
        return;
    }
    Guarded(out, [&] {
        const HlfsVolumeUnmapProperty property = volume->GetUnmapProperty();
        auto structure = EmptyReclaimStructure();
        structure->SetField(kGranularityField, static_cast<long>(property.granularity));
        structure->SetField(kPriorityField, property.priority);
        structure->SetField(kMethodField, property.method);
        structure->SetField(kBandwidthField, static_cast<int>(property.bandwidth));
        out->SetRootObject(structure);
    });
}

std::shared_ptr<HLFSReclaimConfigSet> HLFSReclaimConfigSet::New()
{
    return std::shared_ptr<HLFSReclaimConfigSet>(new HLFSReclaimConfigSet());
}

HLFSReclaimConfigSet::HLFSReclaimConfigSet() { SetDescription("Set space reclamation configuration parameters"); }

HLFSReclaimConfigSet::~HLFSReclaimConfigSet() = default;

std::shared_ptr<InputSpec> HLFSReclaimConfigSet::GetInputSpecInternal()
{
    auto inputs = GetSingleHLFSVolumeInputSpec();
    AddParameter(inputs, {kGranularityParameter, "g", ParameterType::Int,
                        "Minimum granularity of automatic space reclamation in bytes"});
    AddParameter(inputs, {kPriorityParameter, "p", ParameterType::String,
                        "Priority of automatic space reclamation. Supported options are %ENUM%.", false,
                        StringEnum({{"none", ""}, {"low", ""}, {"medium", ""}, {"high", ""}})});
    AddParameter(inputs, {kMethodParameter, "m", ParameterType::String,
                        "Method of automatic space reclamation.  Supported options are %ENUM%.", false,
                        StringEnum({{kMethodPriority, ""}, {kMethodFixed, ""}})});
    AddParameter(inputs, {kBandwidthParameter, "b", ParameterType::Int, "Space reclamation fixed bandwidth (MB/s)"});
    return inputs;
}

std::shared_ptr<OutputSpec> HLFSReclaimConfigSet::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void HLFSReclaimConfigSet::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    // The volume comes first: a selection error hides any parameter error.
    const std::unique_ptr<HlFileSystem> volume = GetSingleHLFSVolume(in, out);
    if (!volume) {
        return;
    }
    Guarded(out, [&] {
        const bool granularityGiven = in->HasParameter(kGranularityParameter);
        const std::string priority = in->GetParameter(kPriorityParameter);
        const std::string method = in->GetParameter(kMethodParameter);
        if (!granularityGiven && !IsGiven(priority) && !IsGiven(method)) {
            out->AddErrorMessage(
                "You have to specify at least one of - reclaim-granularity, reclaim-priority, reclaim-method");
            return;
        }

        std::int64_t granularity = 0;
        if (granularityGiven) {
            granularity = in->GetParameterInt(kGranularityParameter);
            if (granularity < 0) {
                out->AddErrorMessage("reclaim-granularity must be greater than or equal to zero");
                return;
            }
            // Larger values would be cut to 32 bits in the record.
            if (granularity > kMaxGranularity) {
                out->AddErrorMessage("reclaim-granularity must not be greater than 4294967295");
                return;
            }
        }

        // Every call writes the whole record; what is not given is written empty, not kept.
        HlfsVolumeUnmapProperty property;
        property.granularity = static_cast<std::uint32_t>(granularity);
        property.priority = priority;
        property.bandwidth = 0;
        property.reserved = 0;
        if (!IsGiven(method)) {
            property.method = kMethodPriority;
        } else if (method == kMethodPriority) {
            if (!IsGiven(priority)) {
                out->AddErrorMessage("reclaim-priority should be specified");
                return;
            }
            property.method = kMethodPriority;
        } else if (method == kMethodFixed) {
            if (!in->HasParameter(kBandwidthParameter)) {
                out->AddErrorMessage("reclaim-bandwidth should be specified");
                return;
            }
            const std::int64_t bandwidth = in->GetParameterInt(kBandwidthParameter);
            if (bandwidth < kMinBandwidth || bandwidth > kMaxBandwidth) {
                out->AddErrorMessage("reclaim-bandwidth must be between -2147483648 and 2147483647");
                return;
            }
            property.bandwidth = static_cast<std::int32_t>(bandwidth);
            property.method = kMethodFixed;
        } else {
            out->AddErrorMessage("Unsupported unmap method");
            return;
        }

        volume->SetUnmapProperty(property);
        out->SetRootObject(MetaBool::New(true));
    });
}

} // namespace OrvaneCli::FileSystem

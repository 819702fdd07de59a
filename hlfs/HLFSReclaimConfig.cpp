#include <limits>

#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "hlfs/Manifest.h"

namespace OrvaneCli::FileSystem {

using HostCtl::Storage::HlfsVolumeUnmapProperty;

namespace {

enum Field { kGranularityField, kPriorityField, kMethodField, kBandwidthField };

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

const ColumnTable kColumns("HlfsReclaim",
                           {
                               {kGranularityField, "Reclaim Granularity", ColumnType::Int, {.unit = "Bytes"}},
                               {kPriorityField, "Reclaim Priority"},
                               {kMethodField, "Reclaim Method"},
                               {kBandwidthField, "Reclaim Bandwidth", ColumnType::Int, {.unit = "MB/s"}},
                           });

// storage hlfs reclaim config get
class HLFSReclaimConfigGet final : public HlfsVolumeReport {
    using HlfsVolumeReport::HlfsVolumeReport;

    void Fill(HlFileSystem& volume, Row& row) override;
};

const CommandDecl kHLFSReclaimConfigSetDecl = {
    .description = "Set space reclamation configuration parameters",
    .parameters = {
        HlfsLabelParameter(),
        HlfsUuidParameter(),
        {kGranularityParameter, "g", ParameterType::Int, "Minimum granularity of automatic space reclamation in bytes"},
        {kPriorityParameter, "p", ParameterType::String,
         "Priority of automatic space reclamation. Supported options are %ENUM%.", false,
         StringEnum({{"none", ""}, {"low", ""}, {"medium", ""}, {"high", ""}})},
        {kMethodParameter, "m", ParameterType::String,
         "Method of automatic space reclamation.  Supported options are %ENUM%.", false,
         StringEnum({{kMethodPriority, ""}, {kMethodFixed, ""}})},
        {kBandwidthParameter, "b", ParameterType::Int, "Space reclamation fixed bandwidth (MB/s)"}}};

// storage hlfs reclaim config set
class HLFSReclaimConfigSet final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace

void HLFSReclaimConfigGet::Fill(HlFileSystem& volume, Row& row)
{
    const HlfsVolumeUnmapProperty property = volume.GetUnmapProperty();
    row.Set(kGranularityField, static_cast<long>(property.granularity));
    row.Set(kPriorityField, property.priority);
    row.Set(kMethodField, property.method);
    row.Set(kBandwidthField, static_cast<int>(property.bandwidth));
}

void HLFSReclaimConfigSet::Run(const InputPtr& in, const OutputPtr& out)
{
    // The volume comes first: a selection error hides any parameter error.
    WithSingleHLFSVolume(in, out, [&](HlFileSystem& volume) {
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

        volume.SetUnmapProperty(property);
        out->SetRootObject(MetaBool::New(true));
    });
}

NodePtr NewHLFSReclaimConfigGet()
{
    return New<HLFSReclaimConfigGet>("Get space reclamation configuration parameters", kColumns);
}
NodePtr NewHLFSReclaimConfigSet() { return New<HLFSReclaimConfigSet>(kHLFSReclaimConfigSetDecl); }

} // namespace OrvaneCli::FileSystem

#include "hlfs/HLFSVolumeUnmap.h"

#include <limits>

namespace OrvaneCli::FileSystem {

using HostCtl::Misc::StrCat;
using KnxCtl::Storage::HlFileSystemImpl;

namespace {
constexpr const char* kReclaimUnitParameter = "reclaim-unit";

constexpr std::int64_t kDefaultReclaimUnit = 200;
// The host counts blocks per iteration in an unsigned 32-bit value.
constexpr std::int64_t kMaxReclaimUnit = std::numeric_limits<std::uint32_t>::max();

std::shared_ptr<InputSpec> VolumeChoiceInputSpec(const char* labelDescription, const char* uuidDescription)
{
    auto inputs = InputSpec::New();
    AddParameter(inputs, {kOptionVolumeLabel, "l", ParameterType::String, labelDescription});
    AddParameter(inputs, {kOptionVolumeUuid, "u", ParameterType::String, uuidDescription});
    return inputs;
}

// The identifier (label or UUID, as typed) of the volume the user chose, after checking
// that the host knows it; empty when the reason is already on `out`. Host failures pass
// on to the caller's guarded region.
std::string ChooseVolume(const std::string& label, const std::string& uuid, const OutputPtr& out)
{
    if (IsGiven(uuid) && IsGiven(label)) {
        out->AddErrorMessage("You cannot specify both uuid and volume label as target. Please specify only one of these");
        return {};
    }
    if (IsGiven(uuid)) {
        if (!HlFileSystemImpl::GetHLFSFileSystemByUUID(uuid)) {
            out->AddErrorMessage(StrCat("Cannot find HLFS volume with uuid ", uuid));
            return {};
        }
        return uuid;
    }
    if (!IsGiven(label)) {
        out->AddErrorMessage("A target HLFS volume must be specified either by label or uuid.");
        return {};
    }
    if (!HlFileSystemImpl::GetHLFSFileSystemByLabel(label)) {
        out->AddErrorMessage(StrCat("Cannot find HLFS volume with label ", label));
        return {};
    }
    return label;
}

// Runs `body(volume, identifier)` in the guarded region on the volume the user chose, opened
// through its path under /hlfs/volumes/; nothing runs when the choice is refused.
template <typename Body>
void WithChosenVolume(const InputPtr& in, const OutputPtr& out, Body&& body)
{
    const std::string label = in->GetParameter(kOptionVolumeLabel);
    const std::string uuid = in->GetParameter(kOptionVolumeUuid);
    Guarded(out, [&] {
        const std::string identifier = ChooseVolume(label, uuid, out);
        if (identifier.empty()) {
            return;
        }
        HlFileSystemImpl volume(StrCat("/hlfs/volumes/", identifier));
        body(volume, identifier);
    });
}

} // namespace

std::shared_ptr<HLFSVolumeUpgrade> HLFSVolumeUpgrade::New()
{
    return std::shared_ptr<HLFSVolumeUpgrade>(new HLFSVolumeUpgrade());
}

HLFSVolumeUpgrade::HLFSVolumeUpgrade() { SetDescription("Upgrade a HLFS3 volume to HLFS5."); }

HLFSVolumeUpgrade::~HLFSVolumeUpgrade() = default;

std::shared_ptr<InputSpec> HLFSVolumeUpgrade::GetInputSpecInternal()
{
    return VolumeChoiceInputSpec("The label of the HLFS volume to upgrade.", "The uuid of the HLFS volume to upgrade.");
}

std::shared_ptr<OutputSpec> HLFSVolumeUpgrade::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void HLFSVolumeUpgrade::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    WithChosenVolume(in, out, [&](HlFileSystemImpl& volume, const std::string&) {
        // What can be converted is the host's decision; it refuses with its own message.
        volume.ConvertToVersion5();
        out->SetRootObject(MetaBool::New(true));
    });
}

std::shared_ptr<HLFSVolumeUnmap> HLFSVolumeUnmap::New() { return std::shared_ptr<HLFSVolumeUnmap>(new HLFSVolumeUnmap()); }

HLFSVolumeUnmap::HLFSVolumeUnmap() { SetDescription("Reclaim the space by unmapping free blocks from HLFS Volume"); }

HLFSVolumeUnmap::~HLFSVolumeUnmap() = default;

std::shared_ptr<InputSpec> HLFSVolumeUnmap::GetInputSpecInternal()
{
    auto inputs = VolumeChoiceInputSpec("The label of the HLFS volume to unmap the free blocks.",
                                      "The uuid of the HLFS volume to unmap the free blocks.");
    AddParameter(inputs, {kReclaimUnitParameter, "n", ParameterType::Int,
                        "Number of HLFS blocks that should be unmapped per iteration."});
    return inputs;
}

std::shared_ptr<OutputSpec> HLFSVolumeUnmap::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void HLFSVolumeUnmap::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    WithChosenVolume(in, out, [&](HlFileSystemImpl& volume, const std::string& identifier) {
        if (!volume.IsMounted()) {
            out->AddErrorMessage(StrCat("Volume(", identifier, ") is unmounted"));
            return;
        }
        if (!volume.IsAccessible()) {
            out->AddErrorMessage(StrCat("Volume(", identifier, ") is inaccessible"));
            return;
        }
        std::int64_t reclaimUnit = kDefaultReclaimUnit;
        if (in->HasParameter(kReclaimUnitParameter)) {
            reclaimUnit = in->GetParameterInt(kReclaimUnitParameter);
            if (reclaimUnit <= 0) {
                out->AddErrorMessage("reclaimUnit must be greater than zero");
                return;
            }
            // Larger counts would be cut to 32 bits on the way to the host.
            if (reclaimUnit > kMaxReclaimUnit) {
                out->AddErrorMessage("reclaimUnit must not be greater than 4294967295");
                return;
            }
        }
        volume.UnmapVolume(static_cast<unsigned>(reclaimUnit), nullptr);
        out->SetRootObject(MetaBool::New(true));
    });
}

} // namespace OrvaneCli::FileSystem

#include <limits>

#include "command/StorageCommand.h"
#include "hlfs/ChosenVolume.h"
#include "hlfs/Manifest.h"

namespace OrvaneCli::FileSystem {

using HostCtl::Misc::StrCat;

namespace {
constexpr const char* kReclaimUnitParameter = "reclaim-unit";

constexpr std::int64_t kDefaultReclaimUnit = 200;
// The host counts blocks per iteration in an unsigned 32-bit value.
constexpr std::int64_t kMaxReclaimUnit = std::numeric_limits<std::uint32_t>::max();

const CommandDecl kHLFSVolumeUnmapDecl = {
    .description = "Reclaim the space by unmapping free blocks from HLFS Volume",
    .parameters = {LabelParameter("The label of the HLFS volume to unmap the free blocks."),
                   UuidParameter("The uuid of the HLFS volume to unmap the free blocks."),
                   {kReclaimUnitParameter, "n", ParameterType::Int,
                    "Number of HLFS blocks that should be unmapped per iteration."}}};

// storage hlfs unmap
class HLFSVolumeUnmap final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace

void HLFSVolumeUnmap::Run(const InputPtr& in, const OutputPtr& out)
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

NodePtr NewHLFSVolumeUnmap() { return New<HLFSVolumeUnmap>(kHLFSVolumeUnmapDecl); }

} // namespace OrvaneCli::FileSystem

#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "internal/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

constexpr const char* kEnabledParameter = "enabled";

enum Field { kEnabledField };
const ColumnTable kColumns("ClusteredHdskInfo", {{kEnabledField, "Enabled", ColumnType::Bool}}, false);

// storage internal clusteredhdsk get
class ClusteredHdskGet final : public HlfsVolumeReport {
    using HlfsVolumeReport::HlfsVolumeReport;

    void Fill(HlFileSystem& volume, Row& row) override { row.Set(kEnabledField, volume.IsClusteredHdskEnabled()); }
};

const CommandDecl kClusteredHdskSetDecl = {
    .description = "Enable or disable clustered HDSK support.",
    .parameters = {
        HlfsLabelParameter(),
        HlfsUuidParameter(),
        {kEnabledParameter, "e", ParameterType::Bool, "The new enabled state of the clustered HDSK support.", true}}};

// storage internal clusteredhdsk set
class ClusteredHdskSet final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        WithSingleHLFSVolume(in, out, [&](HlFileSystem& volume) {
            volume.SetClusteredHdskEnabled(in->GetParameterBool(kEnabledParameter));
            // Set only once the host has taken the change: a failure leaves no result.
            out->SetRootObject(MetaBool::New(true));
        });
    }
};

} // namespace

NodePtr NewClusteredHdskGet()
{
    return New<ClusteredHdskGet>("Get information about clustered HDSK support.", kColumns);
}
NodePtr NewClusteredHdskSet() { return New<ClusteredHdskSet>(kClusteredHdskSetDecl); }

} // namespace OrvaneCli::FileSystem

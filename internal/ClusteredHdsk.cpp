#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "internal/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

constexpr const char* kEnabledParameter = "enabled";

enum Field { kEnabledField };
const ColumnTable kColumns("ClusteredHdskInfo", {{kEnabledField, "Enabled", ColumnType::Bool}}, false);

// storage internal clusteredhdsk get
class ClusteredHdskGet final : public StorageCommand {
public:
    ClusteredHdskGet()
        : StorageCommand({
              .description = "Get information about clustered HDSK support.",
              .result = One(kColumns),
              .formatter = "simple",
              .parameters = {HlfsLabelParameter(), HlfsUuidParameter()},
          })
    {
    }

private:
    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const std::unique_ptr<HlFileSystem> volume = GetSingleHLFSVolume(in, out);
        if (!volume) {
            return;
        }
        Guarded(out, [&] {
            const RowShape shape = Rows();
            auto structure = shape.NewRow();
            structure.Set(kEnabledField, volume->IsClusteredHdskEnabled());
            out->SetRootObject(structure.Structure());
        });
    }
};

// storage internal clusteredhdsk set
class ClusteredHdskSet final : public StorageCommand {
public:
    ClusteredHdskSet()
        : StorageCommand({
              .description = "Enable or disable clustered HDSK support.",
              .parameters =
                  {
                      HlfsLabelParameter(),
                      HlfsUuidParameter(),
                      {kEnabledParameter, "e", ParameterType::Bool, "The new enabled state of the clustered HDSK support.",
                       true},
                  },
          })
    {
    }

private:
    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const std::unique_ptr<HlFileSystem> volume = GetSingleHLFSVolume(in, out);
        if (!volume) {
            return;
        }
        Guarded(out, [&] {
            volume->SetClusteredHdskEnabled(in->GetParameterBool(kEnabledParameter));
            // Set only once the host has taken the change: a failure leaves no result.
            out->SetRootObject(MetaBool::New(true));
        });
    }
};

} // namespace

NodePtr NewClusteredHdskGet() { return New<ClusteredHdskGet>(); }
NodePtr NewClusteredHdskSet() { return New<ClusteredHdskSet>(); }

} // namespace OrvaneCli::FileSystem

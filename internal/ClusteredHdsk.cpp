#include "internal/ClusteredHdsk.h"

#include "hlfs/HlfsVolumeSelection.h"

namespace OrvaneCli::FileSystem {

namespace {

constexpr const char* kStructureName = "ClusteredHdskInfo";
constexpr const char* kEnabledField = "Enabled";
constexpr const char* kEnabledParameter = "enabled";

} // namespace

std::shared_ptr<ClusteredHdskGet> ClusteredHdskGet::New() { return std::make_shared<ClusteredHdskGet>(); }

ClusteredHdskGet::ClusteredHdskGet()
{
    SetDescription("Get information about clustered HDSK support.");
    SetDefaultOutputFormatter("simple");
}

ClusteredHdskGet::~ClusteredHdskGet() = default;

std::shared_ptr<InputSpec> ClusteredHdskGet::GetInputSpecInternal() { return GetSingleHLFSVolumeInputSpec(); }

std::shared_ptr<OutputSpec> ClusteredHdskGet::GetOutputSpecInternal()
{
    auto structure = MetaStruct::New(kStructureName);
    structure->SetField(kEnabledField, MetaBool::New());
    return StructOutputSpec(structure);
}

void ClusteredHdskGet::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const std::unique_ptr<HlFileSystem> volume = GetSingleHLFSVolume(in, out);
    if (!volume) {
        return;
    }
    Guarded(out, [&] {
        auto structure = MetaStruct::New(kStructureName);
        structure->SetField(kEnabledField, volume->IsClusteredHdskEnabled());
        out->SetRootObject(structure);
    });
}

std::shared_ptr<ClusteredHdskSet> ClusteredHdskSet::New() { return std::make_shared<ClusteredHdskSet>(); }

ClusteredHdskSet::ClusteredHdskSet() { SetDescription("Enable or disable clustered HDSK support."); }

ClusteredHdskSet::~ClusteredHdskSet() = default;

std::shared_ptr<InputSpec> ClusteredHdskSet::GetInputSpecInternal()
{
    auto inputs = GetSingleHLFSVolumeInputSpec();
    AddParameter(inputs, {kEnabledParameter, "e", ParameterType::Bool,
                        "The new enabled state of the clustered HDSK support.", true});
    return inputs;
}

std::shared_ptr<OutputSpec> ClusteredHdskSet::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void ClusteredHdskSet::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const std::unique_ptr<HlFileSystem> volume = GetSingleHLFSVolume(in, out);
    if (!volume) {
        return;
    }
    Guarded(out, [&] {
        const bool enabled = in->GetParameterBool(kEnabledParameter);
        volume->SetClusteredHdskEnabled(enabled);
        out->SetRootObject(MetaBool::New(true));
    });
}

} // namespace OrvaneCli::FileSystem

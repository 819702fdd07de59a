#include "command/StorageCommand.h"

#include "command/Selection.h"

namespace OrvaneCli::FileSystem {

StorageCommand::StorageCommand(CommandDecl decl) : decl_(std::move(decl))
{
    SetDescription(decl_.description);
    if (decl_.formatter != nullptr) {
        SetDefaultOutputFormatter(decl_.formatter);
    }
    if (decl_.result.table != nullptr) {
        decl_.result.table->DeclareHints(*this);
    }
}

std::shared_ptr<InputSpec> StorageCommand::GetInputSpecInternal()
{
    for (const Example& example : decl_.examples) {
        AddExample(example.arguments, example.description);
    }
    // Parameters tied to a feature switch are decided afresh at every call.
    auto inputs = InputSpec::New();
    for (const ParameterDecl& parameter : decl_.parameters) {
        AddParameter(inputs, parameter);
    }
    return inputs;
}

std::shared_ptr<OutputSpec> StorageCommand::GetOutputSpecInternal()
{
    switch (decl_.result.kind) {
    case ResultDecl::List:
        return ListOutputSpec(Rows().Empty());
    case ResultDecl::Single:
        return StructOutputSpec(Rows().Empty());
    case ResultDecl::Boolean:
        break;
    }
    return BooleanOutputSpec();
}

void StorageCommand::ExecuteInternal(const InputPtr& in, const OutputPtr& out) { Run(in, out); }

HostActionCommand::HostActionCommand(const char* description, StorageInfoPlacement placement)
    : StorageCommand({description}), placement_(placement)
{
}

void HostActionCommand::Run(const InputPtr&, const OutputPtr& out)
{
    WithStorageInfo(placement_, out, [&](StorageInfoImpl& storage) {
        Act(storage);
        out->SetRootObject(MetaBool::New(true));
    });
}

HlfsVolumeReport::HlfsVolumeReport(const char* description, const ColumnTable& columns)
    : StorageCommand({.description = description,
                      .result = One(columns),
                      .formatter = "simple",
                      .parameters = {HlfsLabelParameter(), HlfsUuidParameter()}})
{
}

void HlfsVolumeReport::Run(const InputPtr& in, const OutputPtr& out)
{
    WithSingleHLFSVolume(in, out, [&](HlFileSystem& volume) {
        const RowShape shape = Rows();
        auto row = shape.NewRow();
        Fill(volume, row);
        out->SetRootObject(row.Structure());
    });
}

} // namespace OrvaneCli::FileSystem

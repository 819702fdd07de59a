#include "command/Command.h"

namespace OrvaneCli::FileSystem {

namespace {
const char* const kNotifyScript = "/usr/lib/orvane/tallowd/bin/notifyDatastore.py";
} // namespace

bool IsFeatureEnabled(Feature feature)
{
    const unsigned char* flag = FeatureList[static_cast<int>(feature)];
    return flag != nullptr && *flag != 0;
}

std::shared_ptr<ParameterSpec> MakeParameter(const ParameterDecl& decl)
{
    auto parameter = ParameterSpec::New(decl.name, decl.type);
    if (decl.shortName[0] != '\0') {
        parameter->SetShortName(decl.shortName);
    }
    if (decl.description[0] != '\0') {
        parameter->SetDescription(decl.description);
    }
    if (decl.constraint) {
        parameter->SetConstraint(decl.constraint);
    }
    parameter->SetRequired(decl.required || (decl.requiredUnless && !IsFeatureEnabled(*decl.requiredUnless)));
    return parameter;
}

void AddParameter(const std::shared_ptr<InputSpec>& inputs, const ParameterDecl& decl)
{
    if (!decl.feature || IsFeatureEnabled(*decl.feature)) {
        inputs->AddParameter(MakeParameter(decl));
    }
}

std::shared_ptr<ParameterConstraint> IntRange(long min, long max)
{
    auto constraint = ParameterConstraint::New(ParameterConstraintType::IntRange);
    constraint->SetIntRange(min, max);
    return constraint;
}

std::shared_ptr<ParameterConstraint> StringEnum(std::initializer_list<std::pair<const char*, const char*>> values)
{
    auto constraint = ParameterConstraint::New(ParameterConstraintType::StringEnum);
    for (const auto& [value, description] : values) {
        if (description[0] == '\0') {
            constraint->AddStringEnum(value);
        } else {
            constraint->AddStringEnum(value, description);
        }
    }
    return constraint;
}

std::shared_ptr<OutputSpec> BooleanOutputSpec()
{
    auto outputs = OutputSpec::New();
    outputs->SetRootObject(MetaBool::New());
    return outputs;
}

std::shared_ptr<OutputSpec> ListOutputSpec(std::shared_ptr<MetaStruct> prototype)
{
    auto outputs = OutputSpec::New();
    outputs->SetRootObject(MetaList::New(MetaType::Struct, std::move(prototype)));
    return outputs;
}

std::unique_ptr<HostCtl::Storage::StorageInfo> OpenHostStorageInfo()
{
    return HostCtl::HostFactory::GetHost()->GetStorageInfo();
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

const char* GetHLFSVersionString(HlFileSystem* volume)
{
    if (volume->GetType() != HlFileSystem::HLFS_TYPE) {
        return "Non-HLFS";
    }
    switch (volume->GetMajorVersion()) {
    case 2:
        return "HLFS-2";
    case 3:
        return "HLFS-3";
    case 5:
        return "HLFS-5";
    case 6:
        return "HLFS-6";
    default:
        return "HLFS-unknown version";
    }
}

void NotifyDatastore(const std::string& event, const std::string& data)
{
    const std::string command = std::string(kNotifyScript) + " -t " + event + " -i " + "stdin";
    std::string output;
    // The script's outcome does not change what the caller does next.
    (void)Quillets::AutoCli::AutoCli_ShellCmd(command, output, data);
}

std::shared_ptr<OutputSpec> StructOutputSpec(std::shared_ptr<MetaStruct> structure)
{
    auto outputs = OutputSpec::New();
    outputs->SetRootObject(std::move(structure));
    return outputs;
}

} // namespace OrvaneCli::FileSystem

// Fuzzes the command line: every argument vector gets a result or one usage message,
// never a crash, a leak or undefined behaviour. The input is split at NUL bytes into
// arguments; the tree offers every parameter kind and constraint.

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include "framework/Frontend.h"
#include "quillets/AutoCli.h"
#include "quillets/CallSpec.h"
#include "quillets/MetaObj.h"

namespace {

using namespace Quillets::CallSpec;
using namespace Quillets::MetaObj;
using Quillets::AutoCli::Namespace;
using Quillets::AutoCli::NamespaceNode;

std::shared_ptr<MetaStruct> Row()
{
    auto row = MetaStruct::New("Row");
    row->SetField("Name", MetaString::New());
    row->SetField("Count", MetaInt::New());
    row->SetField("On", MetaBool::New());
    return row;
}

// Echoes its input back as rows, so every parsed value also goes through the renderers.
class EchoCommand : public virtual Quillets::AutoCli::Command {
protected:
    std::shared_ptr<InputSpec> GetInputSpecInternal() override
    {
        auto inputs = InputSpec::New();
        auto add = [&](const char* name, const char* shortName, ParameterType type, bool required,
                       std::shared_ptr<ParameterConstraint> constraint) {
            auto parameter = ParameterSpec::New(name, type);
            parameter->SetShortName(shortName);
            parameter->SetDescription("Values: %ENUM%.");
            parameter->SetRequired(required);
            parameter->SetConstraint(std::move(constraint));
            inputs->AddParameter(parameter);
        };
        auto range = ParameterConstraint::New(ParameterConstraintType::IntRange);
        range->SetIntRange(1, 4294967295L);
        auto levels = ParameterConstraint::New(ParameterConstraintType::StringEnum);
        levels->AddStringEnum("low", "Low");
        levels->AddStringEnum("high");
        add("name", "n", ParameterType::String, true, nullptr);
        add("depth", "q", ParameterType::Int, false, range);
        add("count", "c", ParameterType::Int, false, nullptr);
        add("on", "o", ParameterType::Bool, false, nullptr);
        add("force", "f", ParameterType::Flag, false, nullptr);
        add("hosts", "H", ParameterType::StringList, false, nullptr);
        add("level", "l", ParameterType::String, false, levels);
        add("levels", "L", ParameterType::StringList, false, levels);
        add("help-me", "h", ParameterType::String, false, nullptr);
        AddExample("-n x", "Example.");
        return inputs;
    }
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override
    {
        auto outputs = OutputSpec::New();
        outputs->SetRootObject(MetaList::New(MetaType::Struct, Row()));
        return outputs;
    }
    void ExecuteInternal(const std::shared_ptr<Input>& in, const std::shared_ptr<Output>& out) override
    {
        auto list = MetaList::New(MetaType::Struct, Row());
        std::vector<std::string> hosts;
        in->GetParameterList("hosts", hosts);
        hosts.push_back(in->GetParameter("name"));
        for (const auto& host : hosts) {
            auto row = Row();
            row->SetField("Name", host);
            row->SetField("Count", static_cast<long>(in->GetParameterInt("count")));
            row->SetField("On", in->GetParameterBool("on") || in->IsFlagSet("force"));
            list->Add(row);
        }
        out->SetRootObject(list);
        if (in->HasParameter("level")) {
            out->AddErrorMessage(in->GetParameter("level"));
        }
    }
};

class StructCommand : public virtual Quillets::AutoCli::Command {
protected:
    std::shared_ptr<InputSpec> GetInputSpecInternal() override { return InputSpec::New(); }
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override
    {
        auto outputs = OutputSpec::New();
        outputs->SetRootObject(Row());
        return outputs;
    }
    void ExecuteInternal(const std::shared_ptr<Input>&, const std::shared_ptr<Output>& out) override
    {
        auto row = Row();
        row->SetField("Name", "a,\"b\"\n\x01");
        out->SetRootObject(row);
    }
};

std::shared_ptr<NamespaceNode> BuildTree()
{
    auto root = Namespace::New();
    auto storage = Namespace::New();
    auto area = Namespace::New();
    auto echo = std::make_shared<EchoCommand>();
    echo->SetDefaultOutputFormatter("table");
    echo->SetDefaultOutputParameter("fields:Row", "On, Name,Missing");
    echo->SetDefaultOutputParameter("header:Row", "%Name% %On% %");
    echo->SetDefaultOutputParameter("units:Row.Count", "MiB");
    area->RegisterNamespaceNode(echo, "echo");
    area->RegisterNamespaceNode(std::make_shared<StructCommand>(), "one");
    storage->RegisterNamespaceNode(area, "area");
    root->RegisterNamespaceNode(storage, "storage");
    return root;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    static const auto root = BuildTree();
    std::vector<std::string> args(1);
    for (std::size_t i = 0; i < size; ++i) {
        if (data[i] == 0) {
            args.emplace_back();
        } else {
            args.back() += static_cast<char>(data[i]);
        }
    }
    if (size == 0) {
        args.clear();
    }
    const auto outcome = Quillets::Cli::Dispatch(root, args);
    switch (outcome.exitCode) {
    case Quillets::Cli::kExitOk:
    case Quillets::Cli::kExitErrors:
        break;
    case Quillets::Cli::kExitUsage:
        // One message on one line, nothing on standard output.
        if (!outcome.out.empty() || outcome.err.empty() || outcome.err.find('\n') != outcome.err.size() - 1) {
            std::abort();
        }
        break;
    default:
        // Nothing here throws, so no other outcome is possible. (--dump-state has no
        // host in this tree and reports that as an error message.)
        std::abort();
    }
    return 0;
}

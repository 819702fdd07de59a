#pragma once

// A command whose description and behaviour a test sets from outside.

#include <functional>
#include <memory>
#include <string>
#include <utility>

#include "quillets/AutoCli.h"
#include "quillets/CallSpec.h"
#include "quillets/MetaObj.h"

namespace FrameworkTest {

using namespace Quillets::CallSpec;
using namespace Quillets::MetaObj;

class FakeCommand : public virtual Quillets::AutoCli::Command {
public:
    std::function<void(InputSpec&, FakeCommand&)> describe;
    std::function<std::shared_ptr<MetaObject>()> shape = [] { return MetaBool::New(); };
    std::function<void(const Input&, Output&)> run = [](const Input&, Output& out) {
        out.SetRootObject(MetaBool::New(true));
    };
    int executions = 0;
    std::shared_ptr<Input> lastInput;

    static std::shared_ptr<FakeCommand> New(const std::string& description = "A test command.")
    {
        auto command = std::make_shared<FakeCommand>();
        command->SetDescription(description);
        return command;
    }

    using CommandSpec::AddExample;

protected:
    std::shared_ptr<InputSpec> GetInputSpecInternal() override
    {
        auto inputs = InputSpec::New();
        if (describe) {
            describe(*inputs, *this);
        }
        return inputs;
    }
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override
    {
        auto outputs = OutputSpec::New();
        outputs->SetRootObject(shape());
        return outputs;
    }
    void ExecuteInternal(const std::shared_ptr<Input>& in, const std::shared_ptr<Output>& out) override
    {
        ++executions;
        lastInput = in;
        run(*in, *out);
    }
};

inline std::shared_ptr<ParameterSpec> Param(const std::string& name, const std::string& shortName, ParameterType type,
                                            bool required = false,
                                            std::shared_ptr<ParameterConstraint> constraint = nullptr)
{
    auto parameter = ParameterSpec::New(name, type);
    parameter->SetShortName(shortName);
    parameter->SetDescription("The " + name + ".");
    parameter->SetRequired(required);
    parameter->SetConstraint(std::move(constraint));
    return parameter;
}

// A "Volume" row as list commands build them.
inline std::shared_ptr<MetaStruct> VolumeShape()
{
    auto row = MetaStruct::New("Volume");
    row->SetField("Name", MetaString::New());
    row->SetField("Size", MetaInt::New());
    row->SetField("Mounted", MetaBool::New());
    return row;
}

inline std::shared_ptr<MetaStruct> Volume(const std::string& name, long size, bool mounted)
{
    auto row = VolumeShape();
    row->SetField("Name", name);
    row->SetField("Size", size);
    row->SetField("Mounted", mounted);
    return row;
}

} // namespace FrameworkTest

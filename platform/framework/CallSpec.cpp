#include "quillets/CallSpec.h"

#include "framework/Words.h"
#include "quillets/QuilletException.h"

namespace Quillets::CallSpec {

std::shared_ptr<ParameterConstraint> ParameterConstraint::New(ParameterConstraintType type)
{
    auto constraint = std::make_shared<ParameterConstraint>();
    constraint->type_ = type;
    return constraint;
}

void ParameterConstraint::AddStringEnum(const std::string& value) { enum_.emplace_back(value, std::string()); }

void ParameterConstraint::AddStringEnum(const std::string& value, const std::string& description)
{
    enum_.emplace_back(value, description);
}

void ParameterConstraint::SetIntRange(long min, long max)
{
    min_ = min;
    max_ = max;
}

std::shared_ptr<ParameterSpec> ParameterSpec::New(const std::string& name, ParameterType type)
{
    auto inputs = std::make_shared<ParameterSpec>();
    inputs->name_ = name;
    inputs->type_ = type;
    return inputs;
}

void ParameterSpec::SetShortName(const std::string& shortName) { shortName_ = shortName; }
void ParameterSpec::SetDescription(const std::string& description) { description_ = description; }
void ParameterSpec::SetRequired(bool required) { required_ = required; }
void ParameterSpec::SetConstraint(std::shared_ptr<ParameterConstraint> constraint)
{
    constraint_ = std::move(constraint);
}

std::shared_ptr<InputSpec> InputSpec::New() { return std::make_shared<InputSpec>(); }

void InputSpec::AddParameter(std::shared_ptr<ParameterSpec> parameter)
{
    if (!parameter) {
        throw QuilletException("A parameter description must not be empty");
    }
    parameters_.push_back(std::move(parameter));
}

std::shared_ptr<OutputSpec> OutputSpec::New() { return std::make_shared<OutputSpec>(); }

void OutputSpec::SetRootObject(std::shared_ptr<MetaObj::MetaObject> root) { root_ = std::move(root); }

std::shared_ptr<Input> Input::New() { return std::make_shared<Input>(); }

namespace {
const std::string kEmpty;

template <typename Map>
auto Lookup(const Map& map, const std::string& name, const typename Map::mapped_type& fallback) -> decltype(fallback)
{
    auto found = map.find(name);
    return found == map.end() ? fallback : found->second;
}
} // namespace

void Input::Declare(std::shared_ptr<const InputSpec> inputs, const std::string& command)
{
    if (!inputs) {
        throw QuilletException("An input must be declared with a parameter description");
    }
    declared_ = std::move(inputs);
    command_ = command;
}

namespace {

constexpr unsigned Bit(ParameterType type) { return 1U << static_cast<unsigned>(type); }
constexpr unsigned kAnyType = ~0U;

const char* TypeName(ParameterType type) { return Cli::WordsFor(type).described; }

} // namespace

void Input::CheckRead(const std::string& name, unsigned types, const char* readAs) const
{
    if (!declared_) {
        return;
    }
    const std::string who = command_.empty() ? std::string("A command") : "Command '" + command_ + "'";
    for (const auto& parameter : declared_->GetParameters()) {
        if (!parameter || parameter->GetName() != name) {
            continue;
        }
        if ((types & Bit(parameter->GetType())) == 0) {
            throw QuilletException(who + " reads parameter '" + name + "' as " + readAs + ", but declares it as " +
                                   TypeName(parameter->GetType()) + ".");
        }
        return;
    }
    throw QuilletException(who + " reads parameter '" + name + "', which it does not declare.");
}

bool Input::HasParameter(const std::string& name) const
{
    CheckRead(name, kAnyType, "");
    return strings_.count(name) != 0 || ints_.count(name) != 0 || bools_.count(name) != 0 || lists_.count(name) != 0;
}

const std::string& Input::GetParameter(const std::string& name) const
{
    CheckRead(name, Bit(ParameterType::String), TypeName(ParameterType::String));
    return Lookup(strings_, name, kEmpty);
}

std::int64_t Input::GetParameterInt(const std::string& name) const
{
    CheckRead(name, Bit(ParameterType::Int), TypeName(ParameterType::Int));
    auto found = ints_.find(name);
    return found == ints_.end() ? 0 : found->second;
}

bool Input::GetParameterBool(const std::string& name) const
{
    CheckRead(name, Bit(ParameterType::Bool) | Bit(ParameterType::Flag), TypeName(ParameterType::Bool));
    return ReadBool(name);
}

bool Input::ReadBool(const std::string& name) const
{
    auto found = bools_.find(name);
    return found != bools_.end() && found->second;
}

// Flags are kept with the booleans: a flag is a boolean that is only ever set to true.
bool Input::IsFlagSet(const std::string& name) const
{
    CheckRead(name, Bit(ParameterType::Flag), TypeName(ParameterType::Flag));
    return ReadBool(name);
}

void Input::GetParameterList(const std::string& name, std::vector<std::string>& values) const
{
    CheckRead(name, Bit(ParameterType::StringList), TypeName(ParameterType::StringList));
    values.clear();
    auto found = lists_.find(name);
    if (found != lists_.end()) {
        values = found->second;
    }
}

void Input::SetParameter(const std::string& name, const std::string& value) { strings_[name] = value; }
void Input::SetParameterInt(const std::string& name, std::int64_t value) { ints_[name] = value; }
void Input::SetParameterBool(const std::string& name, bool value) { bools_[name] = value; }
void Input::SetFlag(const std::string& name) { bools_[name] = true; }
void Input::AddParameterListValue(const std::string& name, const std::string& value) { lists_[name].push_back(value); }

std::shared_ptr<Output> Output::New() { return std::make_shared<Output>(); }

void Output::AddErrorMessage(const std::string& message) { errors_.push_back(message); }

void Output::SetRootObject(std::shared_ptr<MetaObj::MetaObject> root) { root_ = std::move(root); }

} // namespace Quillets::CallSpec

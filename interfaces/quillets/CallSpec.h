#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "MetaObj.h"

namespace Quillets::CallSpec {

enum class ParameterType { String = 0, Int = 1, Bool = 2, Flag = 3, StringList = 4 };

enum class ParameterConstraintType { None = 0, IntRange = 1, StringEnum = 3 };

class ParameterConstraint {
public:
    static std::shared_ptr<ParameterConstraint> New(ParameterConstraintType type);

    void AddStringEnum(const std::string& value);
    void AddStringEnum(const std::string& value, const std::string& description);
    void SetIntRange(long min, long max);

    ParameterConstraintType GetType() const { return type_; }
    // Allowed values with their descriptions (empty when none was given), in the order added.
    const std::vector<std::pair<std::string, std::string>>& GetStringEnum() const { return enum_; }
    long GetMin() const { return min_; }
    long GetMax() const { return max_; }

private:
    ParameterConstraintType type_ = ParameterConstraintType::None;
    std::vector<std::pair<std::string, std::string>> enum_;
    long min_ = 0;
    long max_ = 0;
};

class ParameterSpec {
public:
    static std::shared_ptr<ParameterSpec> New(const std::string& name, ParameterType type);

    void SetShortName(const std::string& shortName);
    void SetDescription(const std::string& description);
    void SetRequired(bool required);
    void SetConstraint(std::shared_ptr<ParameterConstraint> constraint);

    const std::string& GetName() const { return name_; }
    ParameterType GetType() const { return type_; }
    const std::string& GetShortName() const { return shortName_; }
    const std::string& GetDescription() const { return description_; }
    bool IsRequired() const { return required_; }
    const std::shared_ptr<ParameterConstraint>& GetConstraint() const { return constraint_; }

private:
    std::string name_;
    ParameterType type_ = ParameterType::String;
    std::string shortName_;
    std::string description_;
    bool required_ = false;
    std::shared_ptr<ParameterConstraint> constraint_;
};

class InputSpec {
public:
    static std::shared_ptr<InputSpec> New();
    void AddParameter(std::shared_ptr<ParameterSpec> parameter);
    const std::vector<std::shared_ptr<ParameterSpec>>& GetParameters() const { return parameters_; }

private:
    std::vector<std::shared_ptr<ParameterSpec>> parameters_;
};

class OutputSpec {
public:
    static std::shared_ptr<OutputSpec> New();
    void SetRootObject(std::shared_ptr<MetaObj::MetaObject> root);
    const std::shared_ptr<MetaObj::MetaObject>& GetRootObject() const { return root_; }

private:
    std::shared_ptr<MetaObj::MetaObject> root_;
};

// The parsed arguments of one call. A declared parameter that was not given reads as
// the empty string, 0, false or an empty list. Once the input knows what its command
// declared (Declare), reading a name the command did not declare, or reading a parameter
// as another type than declared, throws QuilletException: a misspelt name is a fault in
// the command, never an absent value.
class Input {
public:
    static std::shared_ptr<Input> New();

    // `command` names the command in messages. The framework declares every input it parses.
    void Declare(std::shared_ptr<const InputSpec> inputs, const std::string& command);
    bool IsDeclared() const { return declared_ != nullptr; }

    bool HasParameter(const std::string& name) const;
    const std::string& GetParameter(const std::string& name) const;
    std::int64_t GetParameterInt(const std::string& name) const;
    bool GetParameterBool(const std::string& name) const;
    bool IsFlagSet(const std::string& name) const;
    void GetParameterList(const std::string& name, std::vector<std::string>& values) const;

    // Filled by the framework's parser (and by tests).
    void SetParameter(const std::string& name, const std::string& value);
    void SetParameterInt(const std::string& name, std::int64_t value);
    void SetParameterBool(const std::string& name, bool value);
    void SetFlag(const std::string& name);
    void AddParameterListValue(const std::string& name, const std::string& value);

private:
    // Throws unless `name` is declared with one of the types in `types` (a bit per ParameterType).
    void CheckRead(const std::string& name, unsigned types, const char* readAs) const;
    bool ReadBool(const std::string& name) const;

    std::shared_ptr<const InputSpec> declared_;
    std::string command_;
    std::map<std::string, std::string> strings_;
    std::map<std::string, std::int64_t> ints_;
    std::map<std::string, bool> bools_;
    std::map<std::string, std::vector<std::string>> lists_;
};

// What a command hands back: error messages in the order added, and at most one root object.
class Output {
public:
    static std::shared_ptr<Output> New();

    void AddErrorMessage(const std::string& message);
    void SetRootObject(std::shared_ptr<MetaObj::MetaObject> root);

    const std::vector<std::string>& GetErrorMessages() const { return errors_; }
    const std::shared_ptr<MetaObj::MetaObject>& GetRootObject() const { return root_; }

private:
    std::vector<std::string> errors_;
    std::shared_ptr<MetaObj::MetaObject> root_;
};

} // namespace Quillets::CallSpec

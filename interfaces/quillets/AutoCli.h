#pragma once

#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "CallSpec.h"

namespace Quillets::AutoCli {

// A node of the command tree. The node keeps a weak reference to itself, filled
// when it is first owned by a std::shared_ptr, so nodes must be created under one.
class NamespaceNode : public std::enable_shared_from_this<NamespaceNode> {
public:
    virtual ~NamespaceNode();

    void SetDescription(const std::string& description);
    const std::string& GetDescription() const { return description_; }
    void SetName(const std::string& name);
    const std::string& GetName() const { return name_; }

    virtual bool HasNamespaceNode(const std::string& name) const;
    virtual std::shared_ptr<NamespaceNode> GetNamespaceNode(const std::string& name) const;
    // Attaches and keeps the child under `name`; a name already used throws QuilletException.
    virtual void RegisterNamespaceNode(std::shared_ptr<NamespaceNode> node, const char* name);

    // Children in registration order.
    const std::vector<std::pair<std::string, std::shared_ptr<NamespaceNode>>>& GetChildren() const { return children_; }

private:
    std::string description_;
    std::string name_;
    std::vector<std::pair<std::string, std::shared_ptr<NamespaceNode>>> children_;
};

class Namespace : public NamespaceNode {
public:
    static std::shared_ptr<Namespace> New();
    ~Namespace() override;
};

// What a command declares about its presentation: formatter, output hints, examples.
class CommandSpec : public NamespaceNode {
public:
    ~CommandSpec() override;

    void SetDefaultOutputFormatter(const std::string& formatter);
    // Keeps the last value set for a key.
    void SetDefaultOutputParameter(const std::string& key, const std::string& value);
    void AddExample(const std::string& arguments, const std::string& description);

    const std::string& GetDefaultOutputFormatter() const { return formatter_; }
    const std::map<std::string, std::string>& GetDefaultOutputParameters() const { return outputParameters_; }
    const std::vector<std::pair<std::string, std::string>>& GetExamples() const { return examples_; }

protected:
    void ClearExamples() { examples_.clear(); }

private:
    std::string formatter_;
    std::map<std::string, std::string> outputParameters_;
    std::vector<std::pair<std::string, std::string>> examples_;
};

// Base of every command. The public operations call the command's own ...Internal ones.
class Command : public CommandSpec {
public:
    ~Command() override;

    // Commands may add examples while describing their input; they are rebuilt on every call.
    std::shared_ptr<CallSpec::InputSpec> GetInputSpec();
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpec();
    void Execute(const std::shared_ptr<CallSpec::Input>& in, const std::shared_ptr<CallSpec::Output>& out);

protected:
    virtual std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() = 0;
    virtual std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() = 0;
    virtual void ExecuteInternal(const std::shared_ptr<CallSpec::Input>& in,
                                 const std::shared_ptr<CallSpec::Output>& out) = 0;
};

// Runs `/bin/sh -c command` with `input` on its standard input and collects what it
// writes to standard output and standard error into `output`. Returns the exit status
// (-1 when it could not be started).
int AutoCli_ShellCmd(const std::string& command, std::string& output, const std::string& input);

} // namespace Quillets::AutoCli

#include "quillets/AutoCli.h"

#include <algorithm>

#include "quillets/QuilletException.h"

namespace Quillets::AutoCli {

NamespaceNode::~NamespaceNode() = default;

void NamespaceNode::SetDescription(const std::string& description) { description_ = description; }

void NamespaceNode::SetName(const std::string& name) { name_ = name; }

bool NamespaceNode::HasNamespaceNode(const std::string& name) const
{
    return std::any_of(children_.begin(), children_.end(), [&](const auto& child) { return child.first == name; });
}

std::shared_ptr<NamespaceNode> NamespaceNode::GetNamespaceNode(const std::string& name) const
{
    for (const auto& child : children_) {
        if (child.first == name) {
            return child.second;
        }
    }
    return nullptr;
}

void NamespaceNode::RegisterNamespaceNode(std::shared_ptr<NamespaceNode> node, const char* name)
{
    const std::string where = name_.empty() ? std::string("the root namespace") : "namespace '" + name_ + "'";
    if (name == nullptr || *name == '\0') {
        throw QuilletException("Cannot register a node without a name in " + where);
    }
    if (!node) {
        throw QuilletException(std::string("Cannot register an empty node as '") + name + "' in " + where);
    }
    if (node.get() == this) {
        throw QuilletException(std::string("Cannot register a namespace under itself as '") + name + "'");
    }
    if (HasNamespaceNode(name)) {
        throw QuilletException(std::string("A node named '") + name + "' is already registered in " + where);
    }
    // The name the user types is the node's name from now on.
    node->SetName(name);
    children_.emplace_back(name, std::move(node));
}

std::shared_ptr<Namespace> Namespace::New() { return std::make_shared<Namespace>(); }

Namespace::~Namespace() = default;

CommandSpec::~CommandSpec() = default;

void CommandSpec::SetDefaultOutputFormatter(const std::string& formatter) { formatter_ = formatter; }

void CommandSpec::SetDefaultOutputParameter(const std::string& key, const std::string& value)
{
    outputParameters_[key] = value;
}

void CommandSpec::AddExample(const std::string& arguments, const std::string& description)
{
    examples_.emplace_back(arguments, description);
}

Command::~Command() = default;

std::shared_ptr<CallSpec::InputSpec> Command::GetInputSpec()
{
    // Commands add their examples while describing their input; start afresh so
    // that repeated calls do not pile them up.
    ClearExamples();
    auto inputs = GetInputSpecInternal();
    return inputs ? inputs : CallSpec::InputSpec::New();
}

std::shared_ptr<CallSpec::OutputSpec> Command::GetOutputSpec()
{
    auto outputs = GetOutputSpecInternal();
    return outputs ? outputs : CallSpec::OutputSpec::New();
}

void Command::Execute(const std::shared_ptr<CallSpec::Input>& in, const std::shared_ptr<CallSpec::Output>& out)
{
    ExecuteInternal(in, out);
}

} // namespace Quillets::AutoCli

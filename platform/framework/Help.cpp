#include "framework/Help.h"

#include <algorithm>

#include "framework/GlobalOptions.h"
#include "framework/Text.h"
#include "framework/Words.h"

namespace Quillets::Cli {

using AutoCli::Command;
using AutoCli::NamespaceNode;
using CallSpec::ParameterConstraintType;
using CallSpec::ParameterSpec;
using CallSpec::ParameterType;
using MetaObj::MetaType;

namespace {

// Lines of "  left  right" with the left parts padded to one width.
std::string TwoColumns(const std::vector<std::pair<std::string, std::string>>& rows, const std::string& indent)
{
    std::size_t width = 0;
    for (const auto& row : rows) {
        width = std::max(width, Text::DisplayWidth(row.first));
    }
    std::string out;
    for (const auto& [left, right] : rows) {
        std::string line = indent + left;
        if (!right.empty()) {
            line.append(width - Text::DisplayWidth(left) + 2, ' ');
            line += right;
        }
        out += line + "\n";
    }
    return out;
}

// A field's declared kind as result help names it.
const char* TypeName(MetaType type)
{
    static constexpr Spelling<MetaType> kNames[] = {{MetaType::Bool, "boolean"}, {MetaType::Int, "integer"}};
    return WordFor(kNames, type, "string");
}

std::string GlobalOptionsHelp()
{
    std::vector<std::pair<std::string, std::string>> rows;
    for (const auto& option : GlobalOptionTable()) {
        std::string names = option.shortName.empty() ? option.longName : option.shortName + ", " + option.longName;
        rows.emplace_back(option.value.empty() ? names : names + " " + option.value, option.description);
    }
    return "Global options:\n" + TwoColumns(rows, "  ");
}

std::string ResultHelp(Command& command)
{
    const auto outputs = command.GetOutputSpec();
    const auto& root = outputs->GetRootObject();
    if (!root) {
        return {};
    }
    if (root->GetType() == MetaType::Bool) {
        return "\nResult: a boolean (true on success).\n";
    }
    std::shared_ptr<MetaObj::MetaStruct> shape;
    std::string what;
    if (auto list = std::dynamic_pointer_cast<MetaObj::MetaList>(root)) {
        shape = list->GetPrototype();
        what = "a list of ";
    } else if (auto single = std::dynamic_pointer_cast<MetaObj::MetaStruct>(root)) {
        shape = single;
        what = "one ";
    }
    if (!shape) {
        return {};
    }
    std::string out = "\nResult: " + what + shape->GetName() + ", with the fields:\n";
    std::vector<std::pair<std::string, std::string>> rows;
    for (const auto& [title, value] : shape->GetFields()) {
        rows.emplace_back(title, value ? TypeName(value->GetType()) : "string");
    }
    return out + TwoColumns(rows, "  ");
}

} // namespace

std::string ExpandEnum(const ParameterSpec& parameter)
{
    std::string text = parameter.GetDescription();
    const auto& constraint = parameter.GetConstraint();
    std::vector<std::string> values;
    if (constraint && constraint->GetType() == ParameterConstraintType::StringEnum) {
        for (const auto& entry : constraint->GetStringEnum()) {
            values.push_back(entry.first);
        }
    }
    const std::string marker = "%ENUM%";
    const std::string replacement = Text::Join(values, ", ");
    for (auto pos = text.find(marker); pos != std::string::npos; pos = text.find(marker, pos + replacement.size())) {
        text.replace(pos, marker.size(), replacement);
    }
    return text;
}

std::string ParameterDetails(const ParameterSpec& parameter)
{
    std::string details = ExpandEnum(parameter);
    std::vector<std::string> notes{parameter.IsRequired() ? "required" : "optional"};
    const auto& constraint = parameter.GetConstraint();
    if (constraint && constraint->GetType() == ParameterConstraintType::IntRange) {
        notes.push_back("from " + std::to_string(constraint->GetMin()) + " to " + std::to_string(constraint->GetMax()));
    }
    if (parameter.GetType() == ParameterType::StringList) {
        notes.emplace_back("repeatable");
    }
    return details + (details.empty() ? "(" : " (") + Text::Join(notes, ", ") + ")";
}

std::string NamespaceHelp(const CommandPath& path, const NamespaceNode& node)
{
    const std::string prefix = path.empty() ? std::string() : JoinPath(path) + " ";
    std::string out = "Usage: autocli [GLOBAL OPTIONS] " + prefix + "{NAMESPACE|COMMAND} ... [PARAMETERS]\n";
    if (!node.GetDescription().empty()) {
        out += "\n" + node.GetDescription() + "\n";
    }
    // One list in registration order; a namespace is marked by the "..." that goes on after it.
    std::vector<std::pair<std::string, std::string>> children;
    for (const auto& [name, child] : node.GetChildren()) {
        const bool isCommand = std::dynamic_pointer_cast<Command>(child) != nullptr;
        children.emplace_back(isCommand ? name : name + " ...", child ? child->GetDescription() : std::string());
    }
    if (children.empty()) {
        out += "\nThis namespace has no commands.\n";
    } else {
        out += "\nAvailable commands and namespaces:\n" + TwoColumns(children, "  ");
    }
    if (path.empty()) {
        out += "\n" + GlobalOptionsHelp();
    }
    return out;
}

std::string CommandHelp(const CommandPath& path, Command& command)
{
    // Describing the input also rebuilds the command's examples.
    const auto input = command.GetInputSpec();
    std::string out = "Usage: autocli [GLOBAL OPTIONS] " + JoinPath(path);
    out += input->GetParameters().empty() ? "\n" : " [PARAMETERS]\n";
    if (!command.GetDescription().empty()) {
        out += "\n" + command.GetDescription() + "\n";
    }

    if (!input->GetParameters().empty()) {
        out += "\nParameters:\n";
        std::vector<std::pair<std::string, std::string>> rows;
        for (const auto& parameter : input->GetParameters()) {
            std::string synopsis = parameter->GetShortName().empty() ? "" : "-" + parameter->GetShortName() + "|";
            synopsis += "--" + parameter->GetName() + WordsFor(parameter->GetType()).synopsis;
            rows.emplace_back(synopsis, ParameterDetails(*parameter));
            const auto& constraint = parameter->GetConstraint();
            if (constraint && constraint->GetType() == ParameterConstraintType::StringEnum) {
                for (const auto& [value, description] : constraint->GetStringEnum()) {
                    rows.emplace_back("", "  " + value + (description.empty() ? "" : ": " + description));
                }
            }
        }
        // Enumeration lines sit under their parameter's description.
        std::size_t width = 0;
        for (const auto& row : rows) {
            width = std::max(width, Text::DisplayWidth(row.first));
        }
        for (const auto& [left, right] : rows) {
            std::string line = "  " + left;
            line.append(width - Text::DisplayWidth(left) + 2, ' ');
            out += line + right + "\n";
        }
    }

    if (!command.GetExamples().empty()) {
        out += "\nExamples:\n";
        for (const auto& [arguments, description] : command.GetExamples()) {
            out += "  autocli " + JoinPath(path) + (arguments.empty() ? "" : " " + arguments) + "\n";
            if (!description.empty()) {
                out += "      " + description + "\n";
            }
        }
    }
    out += ResultHelp(command);
    return out;
}

std::string HelpText(const CommandPath& path, const std::shared_ptr<NamespaceNode>& node)
{
    if (auto command = std::dynamic_pointer_cast<Command>(node)) {
        return CommandHelp(path, *command);
    }
    return node ? NamespaceHelp(path, *node) : std::string();
}

} // namespace Quillets::Cli

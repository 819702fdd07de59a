// Walks every command definition of the registered tree, with every feature switch on
// and with every switch off, and checks what must hold for all of them.

#include <regex>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "quillets/QuilletException.h"
#include "registration/Registration.h"
#include "support/HostFixture.h"

using Quillets::AutoCli::Command;
using Quillets::AutoCli::Namespace;
using Quillets::AutoCli::NamespaceNode;
using Quillets::CallSpec::ParameterConstraintType;
using Quillets::MetaObj::MetaList;
using Quillets::MetaObj::MetaObject;
using Quillets::MetaObj::MetaStruct;

namespace {

struct Definition {
    std::string path;
    std::shared_ptr<NamespaceNode> node;
};

void Collect(const std::shared_ptr<NamespaceNode>& node, const std::string& path, std::vector<Definition>& out)
{
    out.push_back({path, node});
    for (const auto& [name, child] : node->GetChildren()) {
        Collect(child, path + " " + name, out);
    }
}

std::vector<Definition> RegisteredTree()
{
    auto root = Namespace::New();
    root->SetName("root");
    auto storage = Namespace::New();
    storage->SetDescription("Manage storage.");
    root->RegisterNamespaceNode(storage, "storage");
    FilesystemNfs_RegisterNamespaces(storage);
    AutoCli_RegisterNamespaces(root);
    std::vector<Definition> all;
    Collect(storage, "storage", all);
    return all;
}

std::vector<std::string> SplitFields(const std::string& list)
{
    std::vector<std::string> fields;
    std::stringstream in(list);
    for (std::string field; std::getline(in, field, ',');) {
        const auto first = field.find_first_not_of(' ');
        fields.push_back(first == std::string::npos ? "" : field.substr(first));
    }
    return fields;
}

// The structure a command's result is made of, or null for a boolean result.
std::shared_ptr<MetaStruct> ResultStructure(const std::shared_ptr<MetaObject>& root)
{
    if (auto list = std::dynamic_pointer_cast<MetaList>(root)) {
        return list->GetPrototype();
    }
    return std::dynamic_pointer_cast<MetaStruct>(root);
}

// Everything wrong with one command's definition.
std::vector<std::string> Problems(Command& command)
{
    std::vector<std::string> problems;
    if (command.GetDescription().empty()) {
        problems.push_back("no description");
    }
    static const std::regex parameterName("[a-z0-9]+(-[a-z0-9]+)*");
    std::set<std::string> longNames;
    std::set<std::string> shortNames;
    const auto input = command.GetInputSpec();
    for (const auto& parameter : input->GetParameters()) {
        const std::string& name = parameter->GetName();
        if (!std::regex_match(name, parameterName)) {
            problems.push_back("parameter name '" + name + "' is not lower-case words joined by hyphens");
        }
        if (!longNames.insert(name).second) {
            problems.push_back("parameter '" + name + "' declared twice");
        }
        const std::string& shortName = parameter->GetShortName();
        if (!shortName.empty() && (shortName.size() != 1 || !shortNames.insert(shortName).second)) {
            problems.push_back("short name '" + shortName + "' of '" + name + "' is not one unique character");
        }
        if (const auto& constraint = parameter->GetConstraint()) {
            if (constraint->GetType() == ParameterConstraintType::StringEnum && constraint->GetStringEnum().empty()) {
                problems.push_back("'" + name + "' has an empty enumeration");
            }
            if (constraint->GetType() == ParameterConstraintType::IntRange && constraint->GetMin() > constraint->GetMax()) {
                problems.push_back("'" + name + "' has an empty integer range");
            }
        }
    }

    const auto outputs = command.GetOutputSpec();
    if (!outputs || !outputs->GetRootObject()) {
        problems.push_back("no result declared");
        return problems;
    }
    const auto structure = ResultStructure(outputs->GetRootObject());
    std::set<std::string> fields;
    if (structure) {
        for (const auto& [field, value] : structure->GetFields()) {
            if (!fields.insert(field).second) {
                problems.push_back("field '" + field + "' declared twice");
            }
        }
    }
    for (const auto& [key, value] : command.GetDefaultOutputParameters()) {
        if (!structure) {
            problems.push_back("output hint '" + key + "' on a command without structured result");
            continue;
        }
        const std::string prefix = key.substr(0, key.find(':') + 1);
        const std::string target = key.substr(prefix.size());
        if (prefix == "fields:" || prefix == "header:") {
            if (target != structure->GetName()) {
                problems.push_back("hint '" + key + "' names another structure than '" + structure->GetName() + "'");
            }
        }
        if (prefix == "fields:") {
            for (const auto& field : SplitFields(value)) {
                if (!fields.count(field)) {
                    problems.push_back("default fields name unknown field '" + field + "'");
                }
            }
        } else if (prefix == "units:") {
            const std::string expected = structure->GetName() + ".";
            if (target.rfind(expected, 0) != 0 || !fields.count(target.substr(expected.size()))) {
                problems.push_back("units hint '" + key + "' names no field of the result");
            }
        } else if (prefix == "header:") {
            static const std::regex placeholder("%([^%]+)%");
            for (std::sregex_iterator it(value.begin(), value.end(), placeholder), end; it != end; ++it) {
                if (!fields.count((*it)[1].str())) {
                    problems.push_back("header names unknown field '" + (*it)[1].str() + "'");
                }
            }
        } else {
            problems.push_back("unknown output hint '" + key + "'");
        }
    }
    const std::string& formatter = command.GetDefaultOutputFormatter();
    if (!formatter.empty() && formatter != "table" && formatter != "simple") {
        problems.push_back("unknown default formatter '" + formatter + "'");
    }
    return problems;
}

TEST(DefinitionSelfTest, EveryCommandDefinitionIsWellFormed)
{
    for (const bool on : {true, false}) {
        const std::string value = on ? "true" : "false";
        TestSupport::ScopedHost host(R"({"features": {"102": )" + value + R"(, "103": )" + value + R"(, "104": )" +
                                     value + R"(, "270": )" + value + "}}");
        int commands = 0;
        for (const auto& [path, node] : RegisteredTree()) {
            SCOPED_TRACE((on ? "switches on: " : "switches off: ") + path);
            if (auto command = std::dynamic_pointer_cast<Command>(node)) {
                ++commands;
                EXPECT_TRUE(command->GetChildren().empty());
                EXPECT_EQ(Problems(*command), std::vector<std::string>{});
                // Describing a command twice must give the same, independent answer.
                EXPECT_EQ(command->GetInputSpec()->GetParameters().size(),
                          command->GetInputSpec()->GetParameters().size());
                EXPECT_NE(command->GetOutputSpec()->GetRootObject(), command->GetOutputSpec()->GetRootObject());
            } else {
                EXPECT_FALSE(node->GetDescription().empty()) << "namespace without description";
            }
        }
        EXPECT_EQ(commands, on ? 40 : 38);
    }
}

} // namespace

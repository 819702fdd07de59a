// Walks every command definition of the registered tree, with every feature switch on, with
// every switch off and with each switch off on its own, and checks what must hold for all of
// them: well-formed definitions, one place for each command, switches that only take away.

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "framework/TreeWalk.h"
#include "host/HostState.h"
#include "quillets/QuilletException.h"
#include "registration/Registration.h"
#include "support/FixtureCase.h"
#include "support/HostFixture.h"

namespace fs = std::filesystem;

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

std::vector<Definition> RegisteredTree(std::shared_ptr<NamespaceNode>& root)
{
    root = Namespace::New();
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
            if (constraint->GetType() == ParameterConstraintType::IntRange &&
                constraint->GetMin() > constraint->GetMax()) {
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

// The host state with every feature switch the simulated host knows set to `on`, or only
// `off` set to false when it is given.
std::string SwitchState(bool on, const std::string& off = "")
{
    nlohmann::json features = nlohmann::json::object();
    for (const char* key : HostSim::Model::kFeatureKeys) {
        features[key] = off.empty() ? on : key != off;
    }
    return nlohmann::json{{"features", features}}.dump();
}

// The command paths of the tree registered under `state`, checking each definition and the
// tree's shape on the way.
std::set<std::string> CommandPaths(const std::string& state)
{
    TestSupport::ScopedHost host(state);
    std::set<std::string> paths;
    std::set<const NamespaceNode*> nodes;
    std::shared_ptr<NamespaceNode> root;
    for (const auto& [path, node] : RegisteredTree(root)) {
        SCOPED_TRACE(state + ": " + path);
        EXPECT_TRUE(nodes.insert(node.get()).second) << "one node object registered at two places";
        if (auto command = std::dynamic_pointer_cast<Command>(node)) {
            EXPECT_TRUE(paths.insert(path).second) << "command path registered twice";
            EXPECT_TRUE(command->GetChildren().empty());
            EXPECT_EQ(Problems(*command), std::vector<std::string>{});
            // Describing a command twice must give the same, independent answer.
            EXPECT_EQ(command->GetInputSpec()->GetParameters().size(), command->GetInputSpec()->GetParameters().size());
            EXPECT_NE(command->GetOutputSpec()->GetRootObject(), command->GetOutputSpec()->GetRootObject());
        } else {
            EXPECT_FALSE(node->GetDescription().empty()) << "namespace without description";
        }
    }
    // The list the front end shows (--help, the command list) holds the same commands.
    std::set<std::string> listed;
    for (const auto& entry : Quillets::Cli::ListCommands(root)) {
        listed.insert(Quillets::Cli::JoinPath(entry.path));
    }
    EXPECT_EQ(listed, paths) << state;
    return paths;
}

std::vector<std::string> Missing(const std::set<std::string>& from, const std::set<std::string>& in)
{
    std::vector<std::string> missing;
    std::set_difference(from.begin(), from.end(), in.begin(), in.end(), std::back_inserter(missing));
    return missing;
}

TEST(DefinitionSelfTest, EveryCommandDefinitionIsWellFormed)
{
    const auto all = CommandPaths(SwitchState(true));
    const auto none = CommandPaths(SwitchState(false));
    ASSERT_FALSE(all.empty());
    // A switch only ever takes commands away, and each switch on its own: the commands missing
    // with every switch off are exactly those that some single switch takes away.
    EXPECT_EQ(Missing(none, all), std::vector<std::string>{}) << "commands that exist only with switches off";
    std::set<std::string> takenAway;
    for (const char* key : HostSim::Model::kFeatureKeys) {
        const auto without = CommandPaths(SwitchState(true, key));
        EXPECT_EQ(Missing(without, all), std::vector<std::string>{}) << "switch " << key;
        for (const auto& path : Missing(all, without)) {
            takenAway.insert(path);
        }
    }
    EXPECT_EQ(Missing(all, none), std::vector<std::string>(takenAway.begin(), takenAway.end()));
}

// Words of every run of every fixture case.
std::vector<std::vector<std::string>> FixtureRuns()
{
    std::vector<std::vector<std::string>> runs;
    for (const auto& entry : fs::recursive_directory_iterator(STORAGECLI_CASES_DIR)) {
        if (!entry.is_regular_file() || entry.path().extension() != ".case") {
            continue;
        }
        std::ifstream in(entry.path(), std::ios::binary);
        std::ostringstream text;
        text << in.rdbuf();
        for (auto& step : TestSupport::ParseFixtureCase(text.str()).steps) {
            runs.push_back(std::move(step.args));
        }
    }
    return runs;
}

// The count of commands is whatever registration makes it; what keeps it honest is that every
// registered command is run by a fixture case, so a command that drops out of the tree fails
// its cases, and a new command cannot come without one.
TEST(DefinitionSelfTest, EveryRegisteredCommandHasAFixtureCase)
{
    const auto runs = FixtureRuns();
    ASSERT_FALSE(runs.empty());
    std::vector<std::string> uncovered;
    for (const auto& path : CommandPaths(SwitchState(true))) {
        std::vector<std::string> words;
        std::istringstream split(path);
        for (std::string word; split >> word;) {
            words.push_back(word);
        }
        const bool run = std::any_of(runs.begin(), runs.end(), [&](const std::vector<std::string>& args) {
            return std::search(args.begin(), args.end(), words.begin(), words.end()) != args.end();
        });
        if (!run) {
            uncovered.push_back(path);
        }
    }
    EXPECT_EQ(uncovered, std::vector<std::string>{});
}

} // namespace

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>

#include <nlohmann/json.hpp>

#include "FakeCommand.h"
#include "framework/Text.h"
#include "framework/TreeWalk.h"
#include "quillets/QuilletException.h"

using namespace FrameworkTest;
using Quillets::QuilletException;
using Quillets::AutoCli::AutoCli_ShellCmd;
using Quillets::AutoCli::Namespace;

namespace {

TEST(Tree, KeepsRegistrationOrderAndRefusesRepeatedNames)
{
    auto root = Namespace::New();
    auto storage = Namespace::New();
    root->RegisterNamespaceNode(storage, "storage");
    storage->RegisterNamespaceNode(FakeCommand::New(), "list");
    auto inner = Namespace::New();
    storage->RegisterNamespaceNode(inner, "inner");
    inner->RegisterNamespaceNode(FakeCommand::New(), "get");
    storage->RegisterNamespaceNode(FakeCommand::New(), "add");

    EXPECT_THROW(storage->RegisterNamespaceNode(FakeCommand::New(), "list"), QuilletException);
    EXPECT_THROW(storage->RegisterNamespaceNode(nullptr, "other"), QuilletException);
    EXPECT_EQ(storage->GetChildren().size(), 3u);
    EXPECT_EQ(inner->GetName(), "inner");

    std::vector<std::string> paths;
    for (const auto& entry : Quillets::Cli::ListCommands(root)) {
        paths.push_back(Quillets::Cli::JoinPath(entry.path));
    }
    EXPECT_EQ(paths, (std::vector<std::string>{"storage list", "storage inner get", "storage add"}));
    EXPECT_EQ(Quillets::Cli::FindNode(root, {"storage", "inner", "get"}), inner->GetNamespaceNode("get"));
    EXPECT_EQ(Quillets::Cli::FindNode(root, {"storage", "nope"}), nullptr);
}

TEST(Values, StructKeepsFirstOrderAndReplacesInPlace)
{
    auto row = MetaStruct::New("Row");
    row->SetField("B", 1);
    row->SetField("A", "text");
    row->SetField("B", true);
    ASSERT_EQ(row->GetFields().size(), 2u);
    EXPECT_EQ(row->GetFields()[0].first, "B");
    EXPECT_EQ(row->GetField("B")->GetType(), MetaType::Bool);
    EXPECT_EQ(row->GetField("C"), nullptr);
}

TEST(Values, FieldObjectsFollowChangesAndKeepGivenObjects)
{
    auto row = MetaStruct::New("Row");
    const auto given = MetaString::New("kept");
    row->SetField("A", given);
    row->SetField("B", 5);
    EXPECT_EQ(row->GetField("A"), given);
    EXPECT_EQ(std::static_pointer_cast<MetaInt>(row->GetFields()[1].second)->GetValue(), 5);
    row->SetField("B", "five");
    row->SetField("C", std::shared_ptr<MetaInt>());
    ASSERT_EQ(row->GetFields().size(), 3u);
    EXPECT_EQ(std::static_pointer_cast<MetaString>(row->GetField("B"))->GetValue(), "five");
    EXPECT_EQ(row->GetFields()[2].second->GetType(), MetaType::Int);
    const auto ref = row->GetFieldRef(row->FindField("A", 2));
    ASSERT_NE(ref.text, nullptr);
    EXPECT_EQ(*ref.text, "kept");
    EXPECT_EQ(row->FindField("D"), MetaStruct::npos);
}

TEST(Text, EscapedWidthIsTheWidthOfTheEscapedText)
{
    for (const std::string& text : {std::string(), std::string("plain"), std::string("a\tb\n"),
                                    std::string("\x01\x7f", 2), std::string("\xc3\xa9t\xc3\xa9\r")}) {
        EXPECT_EQ(Quillets::Cli::Text::EscapedWidth(text),
                  Quillets::Cli::Text::DisplayWidth(Quillets::Cli::Text::EscapeControl(text)))
            << text;
    }
}

TEST(Values, OutputAndHintsKeepWhatTheCommandSaidLast)
{
    auto out = Output::New();
    out->AddErrorMessage("first");
    out->AddErrorMessage("");
    out->SetRootObject(MetaBool::New(false));
    out->SetRootObject(MetaBool::New(true));
    EXPECT_EQ(out->GetErrorMessages(), (std::vector<std::string>{"first", ""}));
    EXPECT_TRUE(std::static_pointer_cast<MetaBool>(out->GetRootObject())->GetValue());

    auto command = FakeCommand::New();
    command->SetDefaultOutputParameter("fields:S", "A");
    command->SetDefaultOutputParameter("fields:S", "B");
    EXPECT_EQ(command->GetDefaultOutputParameters().at("fields:S"), "B");
}

class ShellCmd : public ::testing::Test {
protected:
    void SetUp() override
    {
        dir_ = std::filesystem::temp_directory_path() / ("fw-shell-" + std::to_string(::getpid()));
        std::filesystem::create_directories(dir_);
        journal_ = (dir_ / "journal").string();
        ::setenv("AUTOCLI_JOURNAL", journal_.c_str(), 1);
    }
    void TearDown() override
    {
        ::unsetenv("AUTOCLI_JOURNAL");
        std::filesystem::remove_all(dir_);
    }
    std::vector<nlohmann::json> Journal() const
    {
        std::vector<nlohmann::json> lines;
        std::ifstream in(journal_);
        for (std::string line; std::getline(in, line);) {
            lines.push_back(nlohmann::json::parse(line));
        }
        return lines;
    }
    std::filesystem::path dir_;
    std::string journal_;
};

TEST_F(ShellCmd, FeedsInputCollectsBothStreamsAndJournals)
{
    std::string output;
    EXPECT_EQ(AutoCli_ShellCmd("tr a-z A-Z; echo oops >&2; exit 3", output, "vol1\nvol2\n"), 3);
    EXPECT_EQ(output, "VOL1\nVOL2\noops\n");
    const auto lines = Journal();
    ASSERT_EQ(lines.size(), 1u);
    EXPECT_EQ(
        lines[0],
        nlohmann::json::parse(
            R"({"call":"AutoCli_ShellCmd","target":"","args":["tr a-z A-Z; echo oops >&2; exit 3","vol1\nvol2\n"]})"));
}

TEST_F(ShellCmd, LargeInputAndOutputDoNotDeadlock)
{
    const std::string input(4 << 20, 'x');
    std::string output;
    EXPECT_EQ(AutoCli_ShellCmd("cat; cat /dev/null", output, input), 0);
    EXPECT_EQ(output, input);
}

TEST_F(ShellCmd, ChildThatIgnoresInputDoesNotKillCaller)
{
    std::string output = "stale";
    EXPECT_EQ(AutoCli_ShellCmd("exec 0<&-; echo done", output, std::string(1 << 20, 'y')), 0);
    EXPECT_EQ(output, "done\n");
}

} // namespace

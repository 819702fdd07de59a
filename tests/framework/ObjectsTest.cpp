#include <gtest/gtest.h>

#include <cstdlib>

#include <nlohmann/json.hpp>

#include "FakeCommand.h"
#include "quillets/QuilletException.h"
#include "support/Files.h"
#include "support/TempFolder.h"

using namespace FrameworkTest;
using Quillets::QuilletException;
using Quillets::AutoCli::AutoCli_ShellCmd;
using Quillets::AutoCli::Namespace;

namespace {

TEST(Tree, RefusesRepeatedNamesAndEmptyNodes)
{
    auto storage = Namespace::New();
    auto inner = Namespace::New();
    storage->RegisterNamespaceNode(FakeCommand::New(), "list");
    storage->RegisterNamespaceNode(inner, "inner");
    EXPECT_THROW(storage->RegisterNamespaceNode(FakeCommand::New(), "list"), QuilletException);
    EXPECT_THROW(storage->RegisterNamespaceNode(nullptr, "other"), QuilletException);
    EXPECT_EQ(storage->GetChildren().size(), 2u);
    EXPECT_EQ(inner->GetName(), "inner");
}

TEST(Values, StructKeepsFirstOrderReplacesInPlaceAndKeepsGivenObjects)
{
    auto row = MetaStruct::New("Row");
    const auto given = MetaString::New("kept");
    row->SetField("B", 5);
    row->SetField("A", given);
    row->SetField("B", "five");
    row->SetField("C", std::shared_ptr<MetaInt>());
    ASSERT_EQ(row->GetFields().size(), 3u);
    EXPECT_EQ(row->GetFields()[0].first, "B");
    EXPECT_EQ(row->GetField("A"), given);
    EXPECT_EQ(std::static_pointer_cast<MetaString>(row->GetField("B"))->GetValue(), "five");
    EXPECT_EQ(row->GetFields()[2].second->GetType(), MetaType::Int);
    EXPECT_EQ(row->GetField("D"), nullptr);
    const auto ref = row->GetFieldRef(row->FindField("A", 2));
    ASSERT_NE(ref.text, nullptr);
    EXPECT_EQ(*ref.text, "kept");
    EXPECT_EQ(row->FindField("D"), MetaStruct::npos);
}

class ShellCmd : public ::testing::Test {
protected:
    void SetUp() override { ::setenv("AUTOCLI_JOURNAL", journal_.c_str(), 1); }
    void TearDown() override { ::unsetenv("AUTOCLI_JOURNAL"); }
    const TestSupport::TempFolder dir_;
    const std::string journal_ = dir_ / "journal";
};

TEST_F(ShellCmd, FeedsInputCollectsBothStreamsAndJournals)
{
    std::string output;
    EXPECT_EQ(AutoCli_ShellCmd("tr a-z A-Z; echo oops >&2; exit 3", output, "vol1\nvol2\n"), 3);
    EXPECT_EQ(output, "VOL1\nVOL2\noops\n");
    // One journal line, naming the call and what it was given.
    EXPECT_EQ(
        nlohmann::json::parse(TestSupport::ReadFile(journal_)),
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

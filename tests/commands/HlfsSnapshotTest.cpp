// storage hlfs snapshot list / extent list in process: the selection rule, the two checks
// and their reasons, and the failure scopes. Mount and resignature are covered by the
// hlfs-snapshot fixture cases.

#include <functional>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "RegisteredCommand.h"
#include "command/Command.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;
using nlohmann::json;

namespace {

std::shared_ptr<Input> Args(const std::string& label, const std::string& uuid)
{
    auto in = Input::New();
    if (!label.empty()) {
        in->SetParameter("volume-label", label);
    }
    if (!uuid.empty()) {
        in->SetParameter("volume-uuid", uuid);
    }
    return in;
}

std::vector<std::shared_ptr<MetaStruct>> Rows(const TestSupport::CommandResult& result)
{
    auto list = std::dynamic_pointer_cast<MetaList>(result.root);
    EXPECT_TRUE(list) << "no list set";
    return list ? list->GetElements() : std::vector<std::shared_ptr<MetaStruct>>{};
}

std::string Str(const std::shared_ptr<MetaStruct>& row, const std::string& field)
{
    auto value = std::dynamic_pointer_cast<MetaString>(row->GetField(field));
    return value ? value->GetValue() : "<not a string>";
}

bool Bool(const std::shared_ptr<MetaStruct>& row, const std::string& field)
{
    auto value = std::dynamic_pointer_cast<MetaBool>(row->GetField(field));
    EXPECT_TRUE(value) << field;
    return value && value->GetValue();
}

json Copy(const std::string& name, const std::string& uuid, long mountReason = 0, long resignatureReason = 0)
{
    return {{"volumeName", name},
            {"uuid", uuid},
            {"lvmUuid", "lvm-" + uuid},
            {"mountReason", mountReason},
            {"resignatureReason", resignatureReason},
            {"extents", json::array({{{"deviceName", "dev-" + uuid}, {"partition", 1}, {"start", 0}, {"end", 99}}})}};
}

std::string State(const json& unresolved, const json& faults = json::array())
{
    return json{{"unresolvedVolumes", unresolved}, {"faults", faults}}.dump();
}

// Two copies share the label "ds1"; one entry is empty and one of another class.
json SelectionCopies()
{
    json other = Copy("ds1", "u-other");
    other["impl"] = false;
    return json::array({Copy("ds1", "u-a"), nullptr, Copy("ds2", "u-b"), other, Copy("ds1", "u-c")});
}

std::vector<std::string> ListedUuids(const std::string& label, const std::string& uuid)
{
    auto command = TestSupport::RegisteredCommand("storage hlfs snapshot list");
    std::vector<std::string> uuids;
    for (const auto& row : Rows(TestSupport::Execute(*command, Args(label, uuid)))) {
        uuids.push_back(Str(row, "HLFS UUID"));
    }
    return uuids;
}

TEST(HlfsSnapshotTest, SelectionNeedsEveryGivenFilterToMatch)
{
    struct Case {
        std::string label, uuid;
        std::vector<std::string> expected;
    };
    const std::vector<Case> cases = {
        {"", "", {"u-a", "u-b", "u-c"}},
        {"ds1", "", {"u-a", "u-c"}},
        {"ds1", "u-c", {"u-c"}},
        {"DS1", "", {}}, // exact comparison
        {"", "u-other", {}},
    };
    TestSupport::ScopedHost host(State(SelectionCopies()));
    for (const auto& c : cases) {
        SCOPED_TRACE("label '" + c.label + "' uuid '" + c.uuid + "'");
        EXPECT_EQ(ListedUuids(c.label, c.uuid), c.expected);
    }
}

TEST(HlfsSnapshotTest, NameIsNotReadWhenTheUuidDiffers)
{
    const json faults = json::array(
        {{{"call", "UnresolvedHlfsVolumeImpl.GetVolumeName"}, {"target", "u-a"}, {"message", "name unreadable"}}});
    TestSupport::ScopedHost host(State(SelectionCopies(), faults));
    auto command = TestSupport::RegisteredCommand("storage hlfs snapshot list");
    const auto result = TestSupport::Execute(*command, Args("ds1", "u-c"));
    EXPECT_TRUE(result.errors.empty());
    ASSERT_EQ(Rows(result).size(), 1u);
}

TEST(HlfsSnapshotTest, ReasonColumnsFollowTheirOwnCheck)
{
    struct Case {
        long mountReason, resignatureReason;
        std::string mountText, resignatureText;
    };
    const std::vector<Case> cases = {
        {0, 0, "", ""},
        {0, 5, "", "the volume is being actively used"},
        {1, 2, "duplicate extents found", "some extents missing"},
        {3, 4, "extra extents found", "failed to check for existing active volumes"},
        {7, 8, "the original volume has some extents online", "unknown error"},
        {9, 4294967295, "unknown error", "unknown error"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::to_string(c.mountReason) + "/" + std::to_string(c.resignatureReason));
        TestSupport::ScopedHost host(State(json::array({Copy("ds1", "u-a", c.mountReason, c.resignatureReason)})));
        auto command = TestSupport::RegisteredCommand("storage hlfs snapshot list");
        const auto rows = Rows(TestSupport::Execute(*command, Args("", "")));
        ASSERT_EQ(rows.size(), 1u);
        EXPECT_EQ(Bool(rows[0], "Can mount"), c.mountReason == 0);
        EXPECT_EQ(Str(rows[0], "Reason for un-mountability"), c.mountText);
        EXPECT_EQ(Bool(rows[0], "Can resignature"), c.resignatureReason == 0);
        EXPECT_EQ(Str(rows[0], "Reason for non-resignaturability"), c.resignatureText);
    }
}

// Extents: impl, other class, impl, empty, impl.
json MixedExtentCopy(const std::string& name, const std::string& uuid)
{
    json copy = Copy(name, uuid);
    copy["extents"] = json::array({{{"deviceName", uuid + "-0"}},
                                   {{"deviceName", "other"}, {"impl", false}},
                                   {{"deviceName", uuid + "-2"}},
                                   nullptr,
                                   {{"deviceName", uuid + "-4"}}});
    return copy;
}

TEST(HlfsSnapshotTest, HostFailuresKeepTheRowsGatheredSoFar)
{
    struct Case {
        std::string name;
        std::function<std::shared_ptr<Command>()> make;
        json fault;
        std::string label;
        std::vector<std::string> devices; // rows shown (extent list) or copies (snapshot list)
    };
    auto fault = [](const std::string& call, const std::string& target) {
        return json{{"call", call}, {"target", target}, {"message", "boom"}};
    };
    const auto extentList = [] { return TestSupport::RegisteredCommand("storage hlfs snapshot extent list"); };
    const auto snapshotList = [] { return TestSupport::RegisteredCommand("storage hlfs snapshot list"); };
    const std::vector<Case> cases = {
        {"volume in row",
         extentList,
         fault("UnresolvedHlfsVolumeImpl.GetLvmUuid", "u-b"),
         "",
         {"u-a-0", "u-a-2", "u-a-4", "u-c-0", "u-c-2", "u-c-4"}},
        {"selection",
         extentList,
         fault("UnresolvedHlfsVolumeImpl.GetVolumeName", "u-b"),
         "ds",
         {"u-a-0", "u-a-2", "u-a-4"}},
        {"check", snapshotList, fault("UnresolvedHlfsVolumeImpl.CanResolve", "u-b"), "", {"u-a"}},
        {"count", snapshotList, fault("UnresolvedHlfsVolumeImpl.GetExtents", "u-c"), "", {"u-a", "u-b"}},
    };
    const json copies =
        json::array({MixedExtentCopy("ds", "u-a"), MixedExtentCopy("ds", "u-b"), MixedExtentCopy("ds", "u-c")});
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        TestSupport::ScopedHost host(State(copies, json::array({c.fault})));
        const auto result = TestSupport::Execute(*c.make(), Args(c.label, ""));
        EXPECT_EQ(result.errors, std::vector<std::string>{"boom"});
        std::vector<std::string> shown;
        for (const auto& row : Rows(result)) {
            shown.push_back(row->HasField("Device Name") ? Str(row, "Device Name") : Str(row, "HLFS UUID"));
        }
        EXPECT_EQ(shown, c.devices);
    }
}

} // namespace

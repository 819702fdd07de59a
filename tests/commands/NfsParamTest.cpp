// storage nfs param / nfs41 param: which volumes get and set reach, the "all" keyword,
// the order of the setters and the stop at the first failure.

#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "nfs/NFSVolumeParam.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;
using nlohmann::json;

namespace {

const char* const kState = R"({"features": {"102": true, "103": true, "104": true}, "fileSystems": [
    {"type": "NFS", "volumeName": "nas1", "maxQueueDepth": 64, "knxnics": "knx0", "connectionsParam": 2},
    {"type": "NFS", "volumeName": "pe1", "isPE": true},
    {"type": "NFS", "volumeName": "nas2", "maxReadTransferSize": 65536},
    {"type": "NFS41", "volumeName": "v41a", "knxnics": "knx1"},
    {"type": "NFS41", "volumeName": "nas2"}]})";

std::vector<std::string> Names(const TestSupport::CommandResult& result)
{
    std::vector<std::string> names;
    if (auto list = std::dynamic_pointer_cast<MetaList>(result.root)) {
        for (const auto& row : list->GetElements()) {
            names.push_back(std::dynamic_pointer_cast<MetaString>(row->GetField("Volume Name"))->GetValue());
        }
    }
    return names;
}

TEST(NfsParamTest, GetSelectsByExactNameOrAllAndNeverShowsPEVolumes)
{
    const struct {
        bool v41;
        const char* name;
        std::vector<std::string> expected;
    } cases[] = {
        {false, "all", {"nas1", "nas2"}}, {false, "nas2", {"nas2"}}, {false, "All", {}},
        {false, "pe1", {}},               {false, "v41a", {}},       {true, "all", {"v41a", "nas2"}},
        {true, "nas2", {"nas2"}},         {true, "nas1", {}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::Message() << (c.v41 ? "v4.1 " : "v3 ") << c.name);
        TestSupport::ScopedHost host(kState);
        auto in = Input::New();
        in->SetParameter("volume-name", c.name);
        const auto result = c.v41 ? TestSupport::Execute(*NFS41VolumeParamGet::New(), in)
                                  : TestSupport::Execute(*NFSVolumeParamGet::New(), in);
        EXPECT_TRUE(result.errors.empty());
        ASSERT_NE(result.root, nullptr);
        EXPECT_EQ(Names(result), c.expected);
    }
}

TEST(NfsParamTest, GetSkipsAnUnreadableVolumeButKeepsTheOthers)
{
    json state = json::parse(kState);
    state["faults"] = {{{"call", "NetworkFileSystem.GetMaxWriteTransferSize"}, {"target", "nas1"}, {"message", "io"}}};
    TestSupport::ScopedHost host(state.dump());
    auto in = Input::New();
    in->SetParameter("volume-name", "all");
    const auto result = TestSupport::Execute(*NFSVolumeParamGet::New(), in);
    EXPECT_EQ(Names(result), std::vector<std::string>{"nas2"});
    EXPECT_EQ(result.errors, std::vector<std::string>{"Error getting params for mount 'nas1': io, skipping."});
}

struct SetCase {
    const char* label;
    bool v41;
    const char* name;
    const char* faults;
    std::vector<std::string> expectedErrors; // empty: success
    std::vector<json> expectedCalls;         // {call, args} of the setters, in order
};

TEST(NfsParamTest, SetAppliesInOrderAndStopsAtTheFirstFailure)
{
    const json depth = {{"call", "NetworkFileSystem.SetMaxQueueDepth"}, {"args", {32, true}}};
    const json knxnic = {{"call", "NetworkFileSystem.SetKnxnics"}, {"args", {"knx9"}}};
    const json connections = {{"call", "NetworkFileSystem.SetConnectionsParam"}, {"args", {4}}};
    const json joined = {{"call", "NetworkFileSystem.SetKnxnics"}, {"args", {"hostA:knx1,hostB:knx2"}}};
    const SetCase cases[] = {
        {"all three", false, "nas1", "[]", {}, {depth, knxnic, connections}},
        {"depth fails", false, "nas1",
         R"([{"call": "NetworkFileSystem.SetMaxQueueDepth", "message": "busy"}])",
         {"Error setting params for mount 'nas1': busy"},
         {json{{"call", "NetworkFileSystem.SetMaxQueueDepth"}, {"args", {32, true}}, {"error", "busy"}}}},
        {"knxnic fails", false, "nas1", R"([{"call": "NetworkFileSystem.SetKnxnics", "message": "no nic"}])",
         {"Error setting params for mount 'nas1': no nic"},
         {depth, json{{"call", "NetworkFileSystem.SetKnxnics"}, {"args", {"knx9"}}, {"error", "no nic"}}}},
        {"PE volume is not a target", false, "pe1", "[]", {"No NAS volume named 'pe1' was found"}, {}},
        {"v4.1 volume is not a v3 target", false, "v41a", "[]", {"No NAS volume named 'v41a' was found"}, {}},
        {"v4.1 joins the knxnics", true, "v41a", "[]", {}, {depth, joined}},
        {"v4.1 unknown", true, "nas1", "[]", {"No NFS v4.1 volume named 'nas1' was found"}, {}},
        {"v4.1 fetch fails", true, "v41a",
         R"([{"call": "StorageInfoImpl.GetV41NetworkFileSystems", "message": "down"}])", {"down"}, {}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.label);
        json state = json::parse(kState);
        state["faults"] = json::parse(c.faults);
        TestSupport::ScopedHost host(state.dump());
        auto in = Input::New();
        in->SetParameter("volume-name", c.name);
        in->SetParameterInt("maxqueuedepth", 32);
        in->SetParameter("knxnic", "knx9");
        in->SetParameterInt("connections", 4);
        in->AddParameterListValue("host-knxnic", "hostA:knx1");
        in->AddParameterListValue("host-knxnic", "hostB:knx2");
        const auto result = c.v41 ? TestSupport::Execute(*NFS41VolumeParamSet::New(), in)
                                  : TestSupport::Execute(*NFSVolumeParamSet::New(), in);
        EXPECT_EQ(result.errors, c.expectedErrors);
        EXPECT_EQ(result.root != nullptr, c.expectedErrors.empty());
        std::vector<json> calls;
        for (const auto& line : host.Journal()) {
            json call = {{"call", line["call"]}, {"args", line["args"]}};
            if (line.contains("error")) {
                call["error"] = line["error"];
            }
            calls.push_back(call);
        }
        EXPECT_EQ(calls, c.expectedCalls);
    }
}

TEST(NfsParamTest, SetWithOnlyTheNameChangesNothing)
{
    TestSupport::ScopedHost host(kState);
    auto in = Input::New();
    in->SetParameter("volume-name", "nas2");
    const auto result = TestSupport::Execute(*NFSVolumeParamSet::New(), in);
    EXPECT_TRUE(result.errors.empty());
    ASSERT_NE(std::dynamic_pointer_cast<MetaBool>(result.root), nullptr);
    EXPECT_TRUE(std::dynamic_pointer_cast<MetaBool>(result.root)->GetValue());
    EXPECT_TRUE(host.Journal().empty());
}

} // namespace

// storage hlfs host list: the status of each host against the volume's locking mode, and
// the liveness check handed to the host.

#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "hlfs/HLFSVolumeHostList.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;
using nlohmann::json;

namespace {

constexpr const char* kNormal = "Normal";
constexpr const char* kInvalid = "INVALID (needs unmount)";
constexpr const char* kUp = "ATS Upgrade Pending";
constexpr const char* kDown = "ATS Downgrade Pending";

TEST(HlfsHostListTest, StatusByVolumeModeAndHostMode)
{
    struct Case {
        unsigned volumeMode;
        const char* atsHost;   // host mode 4
        const char* otherHost; // host mode 0
    };
    const std::vector<Case> cases = {
        {0x60, kDown, kUp},      {0x70, kDown, kUp},      {0x20, kNormal, kUp}, {0x30, kNormal, kUp},
        {0x50, kDown, kInvalid}, {0x40, kDown, kNormal},  {0x10, kNormal, kInvalid},
        {0x00, kInvalid, kNormal}, {0x0F, kInvalid, kNormal}, {0x90, kNormal, kInvalid},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.volumeMode);
        EXPECT_STREQ(HLFSVolumeHostList::TranslateStatus(c.volumeMode, 4), c.atsHost);
        EXPECT_STREQ(HLFSVolumeHostList::TranslateStatus(c.volumeMode, 0), c.otherHost);
        // The status tests the bit of value 4, not equality.
        EXPECT_STREQ(HLFSVolumeHostList::TranslateStatus(c.volumeMode, 6), c.atsHost);
        EXPECT_STREQ(HLFSVolumeHostList::TranslateStatus(c.volumeMode, 0xFB), c.otherHost);
    }
}

json User(const std::string& id, int lockModeInUse, bool live)
{
    return {{"heartbeatUuid", id},       {"macAddress", "00:50:56:AB:0c:01"}, {"driverVersionMajor", 14},
            {"driverVersionMinor", 61}, {"heartbeatOffset", 3145728},      {"lockModeInUse", lockModeInUse},
            {"live", live}};
}

std::string State(const json& faults = json::array())
{
    json volume = {{"type", "HLFS"},
                   {"volumeName", "ds1"},
                   {"uuid", "uuid-ds1"},
                   {"lockMode", 0x10},
                   {"users", json::array({User("hb-a", 4, true), User("hb-b", 6, false), User("hb-c", 0, true)})}};
    return json{{"fileSystems", json::array({volume})}, {"faults", faults}}.dump();
}

std::vector<std::vector<std::string>> Table(const TestSupport::CommandResult& result)
{
    std::vector<std::vector<std::string>> table;
    auto list = std::dynamic_pointer_cast<MetaList>(result.root);
    if (!list) {
        return table;
    }
    for (const auto& row : list->GetElements()) {
        std::vector<std::string> cells;
        for (const auto& [name, value] : row->GetFields()) {
            if (auto s = std::dynamic_pointer_cast<MetaString>(value)) {
                cells.push_back(s->GetValue());
            } else if (auto i = std::dynamic_pointer_cast<MetaInt>(value)) {
                cells.push_back(std::to_string(i->GetValue()));
            }
        }
        table.push_back(cells);
    }
    return table;
}

TEST(HlfsHostListTest, LivenessCheckIsPassedToTheHost)
{
    const std::vector<std::string> a = {"hb-a", "00:50:56:ab:0c:01", "14.61", "3145728", "ATS-only", kNormal};
    const std::vector<std::string> b = {"hb-b", "00:50:56:ab:0c:01", "14.61", "3145728", "ATS+SCSI", kNormal};
    const std::vector<std::string> c = {"hb-c", "00:50:56:ab:0c:01", "14.61", "3145728", "ATS+SCSI", kInvalid};
    struct Case {
        std::string liveness;
        bool quick;
        std::vector<std::vector<std::string>> rows;
    };
    const std::vector<Case> cases = {
        {"", false, {a, b, c}},
        {"none", false, {a, b, c}},
        {"quick", true, {a, c}},
    };
    for (const auto& k : cases) {
        SCOPED_TRACE("liveness '" + k.liveness + "'");
        TestSupport::ScopedHost host(State());
        auto in = Input::New();
        in->SetParameter("volume-uuid", "uuid-ds1");
        if (!k.liveness.empty()) {
            in->SetParameter("liveness", k.liveness);
        }
        HLFSVolumeHostList command;
        const auto result = TestSupport::Execute(command, in);
        EXPECT_TRUE(result.errors.empty());
        EXPECT_EQ(Table(result), k.rows);
        const auto journal = host.Journal();
        ASSERT_EQ(journal.size(), 1u);
        EXPECT_EQ(journal[0]["call"], "HlFileSystem.GetUsers");
        EXPECT_EQ(journal[0]["args"], json::array({k.quick}));
    }
}

TEST(HlfsHostListTest, HostFailureShowsNoPartialList)
{
    for (const std::string call : {"HlFileSystem.GetUsers", "HlFileSystem.GetLockMode"}) {
        SCOPED_TRACE(call);
        // Let the first lock mode read through, so a partial list would be visible.
        const int skip = call == "HlFileSystem.GetLockMode" ? 1 : 0;
        TestSupport::ScopedHost host(
            State(json::array({{{"call", call}, {"message", "Heartbeat region unreadable"}, {"skip", skip}}})));
        auto in = Input::New();
        in->SetParameter("volume-label", "ds1");
        HLFSVolumeHostList command;
        const auto result = TestSupport::Execute(command, in);
        EXPECT_EQ(result.errors, std::vector<std::string>{"Heartbeat region unreadable"});
        EXPECT_EQ(result.root, nullptr);
    }
}

} // namespace

// storage hlfs host list in process: the status of each host against the volume's locking
// mode, and no partial list after a host failure. Rows, the liveness check and the table
// are covered by the hlfs-host fixture cases.

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

std::string State(const json& faults)
{
    const json user = {{"heartbeatUuid", "hb-a"}, {"lockModeInUse", 4}};
    const json volume = {{"type", "HLFS"}, {"volumeName", "ds1"}, {"lockMode", 0x10}, {"users", json::array({user, user})}};
    return json{{"fileSystems", json::array({volume})}, {"faults", faults}}.dump();
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

// The state file: checking, persistence and where it is looked for.

#include <functional>

#include <ostream>

#include <gtest/gtest.h>

#include "FeatureList.h"
#include "host/HostSession.h"
#include "host/HostState.h"
#include "hostctl/Host.h"
#include "hostctl/HostCtlException.h"
#include "hostctl/StorageInfoImpl.h"
#include "support/Files.h"
#include "support/HostErrors.h"
#include "support/HostFixture.h"

namespace {

using namespace std::string_literals;
using KnxCtl::Storage::StorageInfoImpl;
using TestSupport::MessageOf;
using TestSupport::ReadFile;
using TestSupport::ScopedHost;
using Fs = HostCtl::Storage::FileSystem;

struct BadState {
    const char* name;
    std::string text;
    std::string place; // must appear in the message after the file name
};

// Test listings name a case by its name rather than by its bytes.
void PrintTo(const BadState& c, std::ostream* os) { *os << c.name; }

const BadState kBadStates[] = {
    {"syntax", R"({"fileSystems": [})", "line 1, column 18"},
    {"syntaxOnLaterLine", "{\n  \"features\": {\"102\": tru}\n}", "line 2, column"},
    {"blank", " \n", "line 2"},
    {"trailingJunk", "{} x", "line 1, column 4"},
    {"topLevelArray", "[]", "expected a JSON object at the top level"},
    {"wrongType", R"({"fileSystems": [{"type": "HLFS", "volumeName": "a", "capacity": "big"}]})",
     "fileSystems[0].capacity: expected an unsigned integer, found string"},
    {"negativeCapacity", R"({"fileSystems": [{"type": "HLFS", "volumeName": "a", "capacity": -1}]})",
     "fileSystems[0].capacity: -1 is out of range"},
    {"partitionTooLarge", R"({"fileSystems": [{"type": "HLFS", "volumeName": "a", "extents": [{"partition": 256}]}]})",
     "fileSystems[0].extents[0].partition: 256 is out of range (0 to 255)"},
    {"unknownTopKey", R"({"features": {"102": true, "270": true}, "fileSystem": []})", "fileSystem: unknown key"},
    {"unknownNestedKey",
     R"({"fileSystems": [{"type": "NFS", "volumeName": "a"}, {"type": "NFS", "volumeName": "b", "remoteHostz": ""}]})",
     "fileSystems[1].remoteHostz: unknown key"},
    {"missingRequired", R"({"fileSystems": [{"type": "HLFS"}]})", "fileSystems[0]: missing required key 'volumeName'"},
    {"unknownFeature", R"({"features": {"102": true, "999": true}})", "features.999: unknown key"},
    {"unresolvedExtent", R"({"unresolvedVolumes": [null, {"volumeName": "x", "extents": [null, {"start": "0"}]}]})",
     "unresolvedVolumes[1].extents[1].start: expected an integer, found string"},
    {"optionFloat", R"({"advancedOptions": {"HLFS3": {"EnableOnlineATSUpgrade": 1.5}}})",
     "advancedOptions.HLFS3.EnableOnlineATSUpgrade: expected an integer or a string, found number"},
    {"faultWithoutCall", R"({"faults": [{"message": "m"}]})", "faults[0]: missing required key 'call'"},
    {"badMac", R"({"fileSystems": [{"type": "HLFS", "volumeName": "a", "users": [{"macAddress": "00:11"}]}]})",
     "fileSystems[0].users[0].macAddress: expected a MAC address"},
    {"pendingWrongType", R"({"pendingRescan": {"fileSystems": {}}})",
     "pendingRescan.fileSystems: expected an array, found object"},
    // Whatever follows the document is refused, a NUL byte (which the JSON reader takes for
    // the end) included, so nothing is silently dropped at the next save.
    {"nulAfterDocument", "{\"features\": {}}\n\0{\"faults\": []}"s, "line 2, column 1: a NUL byte is not allowed"},
    {"nulInsideDocument", "{\"features\":\0 {}}"s, "line 1, column 13: a NUL byte is not allowed"},
    // A repeated key is refused at any depth, whatever the type of its second value.
    {"repeatedFileSystems", R"({"fileSystems": [{"type": "HLFS", "volumeName": "a"}], "fileSystems": {}})",
     "fileSystems: this key is given twice"},
    {"repeatedFileSystemsArray", R"({"fileSystems": [], "fileSystems": [{"type": "HLFS", "volumeName": "a"}]})",
     "fileSystems: this key is given twice"},
    {"repeatedNestedKey", R"({"fileSystems": [{"type": "HLFS", "volumeName": "a"}, {"type": "NFS", "type": "HLFS"}]})",
     "fileSystems[1].type: this key is given twice"},
    {"repeatedKeyInArrayOfObjects", R"({"heaps": [{"name": "a"}, {"name": "b", "size": 1, "size": 2}]})",
     "heaps[1].size: this key is given twice"},
    {"numberTooLarge", "{\n  \"heaps\": [{\"size\": 1e400}]}", "line 2, column 22: number overflow parsing '1e400'"},
    {"integerTooLarge", R"({"heaps": [{"size": 18446744073709551616}]})",
     "heaps[0].size: expected an unsigned integer, found number"},
    // Long texts are cut: neither a huge key nor a huge token makes a huge message.
    {"longKeyIsCut", "{\"" + std::string(100000, 'k') + "\": 1}", std::string(80, 'k') + "...: unknown key"},
    {"longTokenIsCut", "{\"a\": \"" + std::string(100000, 'x'), "last read: '\"" + std::string(79, 'x') + "...'"},
    {"longMacIsCut",
     R"({"fileSystems": [{"type": "HLFS", "volumeName": "a", "users": [{"macAddress": ")" + std::string(100000, 'm') +
         "\"}]}]}",
     "found '" + std::string(80, 'm') + "...'"},
};

class BadStateTest : public ::testing::TestWithParam<BadState> {};

TEST_P(BadStateTest, EveryCallFailsWithTheMessageAndTheFileIsKept)
{
    const BadState& bad = GetParam();
    ScopedHost host(bad.text);
    const std::string before = ReadFile(host.StatePath());

    const std::string message = MessageOf([] { StorageInfoImpl info; });
    EXPECT_EQ(message.rfind("Invalid host state file '" + host.StatePath() + "': ", 0), 0u) << message;
    EXPECT_LT(message.size(), 400u) << message.substr(0, 1000);
    EXPECT_NE(message.find(bad.place), std::string::npos) << message;

    const std::function<void()> calls[] = {
        [] { StorageInfoImpl info; },
        [] { HostCtl::HostFactory::GetHost()->GetStorageInfo(); },
        [] { HostCtl::HostFactory::GetHost()->GetAdvancedOptions(); },
        [] { KnxCtl::Storage::HlFileSystemImpl fs("/hlfs/volumes/a"); },
        [] { StorageInfoImpl::RemoveNetworkFileSystem("a", HostCtl::Storage::NFS_VERSION_3); },
        [] { KnxCtl::Storage::StorageInfoScopedCache cache(false); },
        [] { HostSim::DumpState(); },
    };
    for (const auto& call : calls)
        EXPECT_EQ(MessageOf(call), message);
    for (int feature : {102, 103, 104, 270})
        EXPECT_EQ(*FeatureList[feature], 0) << feature;

    host.Reopen();
    EXPECT_EQ(MessageOf([] { StorageInfoImpl info; }), message);
    EXPECT_EQ(ReadFile(host.StatePath()), before);
}

INSTANTIATE_TEST_SUITE_P(Host, BadStateTest, ::testing::ValuesIn(kBadStates),
                         [](const auto& info) { return std::string(info.param.name); });

TEST(HostState, SavingKeepsEveryKeyAndExactValues)
{
    const nlohmann::json original = nlohmann::json::parse(R"({
      "features": {"103": true},
      "behaviour": {"tryMount": false},
      "fileSystems": [
        {"type": "HLFS", "volumeName": "big", "capacity": 18446744073709551615, "used": 9223372036854775809,
         "majorVersion": 5, "lockMode": 4294967295, "extents": [{"deviceName": "d1", "partition": 255}],
         "users": [{"heartbeatUuid": "h", "macAddress": "00:1e:67:c4:d2:a8", "driverVersionMajor": 1,
                    "driverVersionMinor": 2, "heartbeatOffset": -5, "lockModeInUse": 1, "live": false}],
         "unmapProperty": {"granularity": 4096, "priority": "high", "bandwidth": -1, "reserved": 7, "method": "fixed"}},
        {"type": "NFS41", "volumeName": "n", "remoteHosts": ["a", "b"], "remoteShare": "/s", "mounted": false,
         "connections": -3, "hidden": true, "securityType": 4},
        {"type": "ufs", "volumeName": "u", "name": "other", "mountPoint": "/x", "qaxiState": -2}
      ],
      "pendingRescan": {"fileSystems": [], "unresolvedVolumes": [{"volumeName": "p", "impl": false}]},
      "unresolvedVolumes": [null, {"volumeName": "s", "uuid": "u-1", "lvmUuid": "l", "majorVersion": 5,
        "capacity": 1, "mountReason": 2, "resignatureReason": 3,
        "extents": [null, {"deviceName": "e", "partition": 1, "start": -9223372036854775808, "end": 9, "impl": false}]}],
      "nfsExports": [{"host": "h", "share": "/s", "capacity": 1, "used": 0}],
      "firewall": {"nfs41Client": []},
      "heaps": [{"name": "hlfs3", "size": 1, "maxSize": 2}],
      "pointerBlockCache": {"cacheSize": 1, "cacheSizeMax": 2, "workingSet": 3, "workingSetMax": 4,
                            "heapOverhead": 5, "capacityMissRatio": 6},
      "advancedOptions": {"G": {"i": -7, "s": "text"}},
      "faults": [{"call": "X.Y", "target": "t", "message": "m", "skip": 1, "times": 2}]
    })");
    ScopedHost host(original.dump());
    StorageInfoImpl info;
    auto big = info.GetFileSystemByLabel("big");
    EXPECT_EQ(big->GetCapacity(), 18446744073709551615ull);
    EXPECT_EQ(big->GetUsedSpace(), 9223372036854775809ull);
    EXPECT_EQ(big->Unmount(Fs::MOUNT_UNTIL_RESTART), 0);

    nlohmann::json expected = original;
    expected["fileSystems"][0]["mounted"] = false;
    EXPECT_EQ(host.State(), expected);
}

TEST(HostState, ChangesAreSeenByTheNextSessionAndByOtherObjects)
{
    ScopedHost host(R"({"fileSystems": [{"type": "HLFS", "volumeName": "a", "majorVersion": 3}]})");
    StorageInfoImpl info;
    auto first = info.GetFileSystemByLabel("a");
    auto all = info.GetHlfsFileSystems("");
    auto* second = all.at(0).get();
    KnxCtl::Storage::HlFileSystemImpl byPath("/hlfs/volumes/a");
    byPath.ConvertToVersion5();
    EXPECT_EQ(second->GetMajorVersion(), 5);
    EXPECT_EQ(first->Unmount(Fs::MOUNT_PERSISTENT), 0);
    EXPECT_FALSE(byPath.IsMounted());

    host.Reopen();
    auto again = StorageInfoImpl().GetHlfsFileSystems("a");
    ASSERT_EQ(again.size(), 1u);
    EXPECT_EQ(again[0]->GetMajorVersion(), 5);
    EXPECT_FALSE(again[0]->IsMounted());
    EXPECT_EQ(host.State()["fileSystems"][0]["explicitlyUnmounted"], true);
}

TEST(HostState, DefaultStatePathFollowsTheEnvironment)
{
    struct Case {
        const char* option; // --state
        const char* state;
        const char* xdg;
        const char* home;
        std::string expected;
        bool named; // then the file must exist
    };
    const Case cases[] = {
        {nullptr, "/s/host.json", "/x", "/h", "/s/host.json", true},
        {nullptr, nullptr, "/x", "/h", "/x/autocli/host.json", false},
        {nullptr, "", "", "/h", "/h/.local/state/autocli/host.json", false},
        {"o.json", "/s/host.json", "/x", "/h", "o.json", true},
        {"o.json", nullptr, nullptr, "/h", "o.json", true},
    };
    auto set = [](const char* name, const char* value) {
        if (value)
            ::setenv(name, value, 1);
        else
            ::unsetenv(name);
    };
    const std::string savedHome = std::getenv("HOME") ? std::getenv("HOME") : "";
    for (const auto& c : cases) {
        set("AUTOCLI_STATE", c.state);
        set("XDG_STATE_HOME", c.xdg);
        set("HOME", c.home);
        const std::string option = c.option ? c.option : "";
        const auto choice = HostSim::ChooseStatePath(c.option ? &option : nullptr);
        EXPECT_EQ(choice.path, c.expected);
        EXPECT_EQ(choice.named, c.named) << c.expected;
        if (!c.option) {
            EXPECT_EQ(HostSim::DefaultStatePath(), c.expected);
        }
    }
    ::unsetenv("AUTOCLI_STATE");
    ::unsetenv("XDG_STATE_HOME");
    ::setenv("HOME", savedHome.c_str(), 1);
}

} // namespace

// Injected faults, the call journal and concurrent sessions on one state file.

#include <algorithm>
#include <functional>

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include "host/HostSession.h"
#include "hostctl/Host.h"
#include "hostctl/HostCtlException.h"
#include "hostctl/StorageInfoImpl.h"
#include "support/HostFixture.h"

namespace {

using HostCtl::Lib::HostCtlException;
using KnxCtl::Storage::HlFileSystemImpl;
using KnxCtl::Storage::StorageInfoImpl;
using TestSupport::ScopedHost;
using Fs = HostCtl::Storage::FileSystem;
using nlohmann::json;

const char* const kTwoVolumes = R"("fileSystems": [{"type": "HLFS", "volumeName": "a", "uuid": "ua"},
                                                   {"type": "NFS", "volumeName": "b", "uuid": "ub"}])";

// 'x' when the call threw the injected message, '.' when it went through.
std::string Outcomes(const std::vector<std::function<void()>>& calls)
{
    std::string result;
    for (const auto& call : calls) {
        try {
            call();
            result += '.';
        } catch (const HostCtlException& e) {
            result += e.message == "boom" ? 'x' : '?';
        }
    }
    return result;
}

TEST(HostFaults, CallTargetSkipAndTimes)
{
    struct Case {
        const char* fault;
        const char* expected; // outcomes of: capacity a, capacity b, capacity a, capacity b, capacity a, used a
    };
    const Case cases[] = {
        {R"({"call": "FileSystem.GetCapacity", "message": "boom"})", "xxxxx."},
        {R"({"call": "FileSystem.GetCapacity", "target": "b", "message": "boom"})", ".x.x.."},
        {R"({"call": "FileSystem.GetCapacity", "target": "ua", "message": "boom"})", "x.x.x."},
        {R"({"call": "FileSystem.GetCapacity", "message": "boom", "skip": 2})", "..xxx."},
        {R"({"call": "FileSystem.GetCapacity", "message": "boom", "times": 2})", "xx...."},
        {R"({"call": "FileSystem.GetCapacity", "target": "a", "message": "boom", "skip": 1, "times": 1})", "..x..."},
        {R"({"call": "FileSystem.GetUsedSpace", "message": "boom", "times": 0})", "......"},
        {R"({"call": "HlFileSystem.GetCapacity", "message": "boom"})", "......"},
    };
    for (const auto& c : cases) {
        ScopedHost host(std::string("{") + kTwoVolumes + R"(, "faults": [)" + c.fault + "]}");
        StorageInfoImpl info;
        auto a = info.GetFileSystemByLabel("a");
        auto b = info.GetFileSystemByLabel("b");
        EXPECT_EQ(Outcomes({[&] { a->GetCapacity(); }, [&] { b->GetCapacity(); }, [&] { a->GetCapacity(); },
                            [&] { b->GetCapacity(); }, [&] { a->GetCapacity(); }, [&] { a->GetUsedSpace(); }}),
                  c.expected)
            << c.fault;
        // Counters belong to the process's session: a new session starts again.
        host.Reopen();
        auto again = StorageInfoImpl().GetFileSystemByLabel("a");
        EXPECT_EQ(Outcomes({[&] { again->GetCapacity(); }}).front(), c.expected[0]) << c.fault;
    }
}

// The message a fault throws: its own, else a default naming the call, also once the state
// has been saved and read again.
TEST(HostFaults, MessageDefaultsToTheCall)
{
    struct Case {
        const char* fault;
        const char* message;
    };
    const Case cases[] = {
        {R"({"call": "StorageInfoImpl.new", "times": 1})", "Injected failure of StorageInfoImpl.new"},
        {R"({"call": "StorageInfoImpl.new", "times": 1, "message": ""})", ""},
        {R"({"call": "StorageInfoImpl.new", "times": 1, "message": "Host agent is not responding"})",
         "Host agent is not responding"},
    };
    for (const auto& c : cases) {
        ScopedHost host(std::string(R"({"firewall": {"nfsClient": []}, "faults": [)") + c.fault + "]}");
        auto message = [] {
            try {
                StorageInfoImpl info;
            } catch (const HostCtlException& e) {
                return e.message;
            }
            return std::string("(no exception)");
        };
        EXPECT_EQ(message(), c.message) << c.fault;
        StorageInfoImpl().AddNasFirewallConfig("192.0.2.1", HostCtl::Storage::NFS_VERSION_3);
        host.Reopen(); // saved with the change, read again
        EXPECT_EQ(message(), c.message) << c.fault;
    }
}

TEST(HostFaults, ConstructorsStaticsAndHostObjects)
{
    struct Case {
        const char* fault;
        std::function<void()> call;
    };
    const Case cases[] = {
        {R"({"call": "StorageInfoImpl.new", "message": "boom"})", [] { StorageInfoImpl info; }},
        {R"({"call": "HlFileSystemImpl.new", "target": "/hlfs/volumes/a", "message": "boom"})",
         [] { HlFileSystemImpl fs("/hlfs/volumes/a"); }},
        {R"({"call": "HlFileSystemImpl.new", "target": "a", "message": "boom"})",
         [] { HlFileSystemImpl fs("/hlfs/volumes/ua"); }},
        {R"({"call": "StorageInfoImpl.GetFileSystemByLabel", "target": "b", "message": "boom"})",
         [] { StorageInfoImpl().GetFileSystemByLabel("b"); }},
        {R"({"call": "HlFileSystem.GetExtents", "message": "boom"})",
         [] { HlFileSystemImpl::GetHLFSFileSystemByLabel("a")->GetExtents(); }},
        {R"({"call": "Host.GetAdvancedOptions", "message": "boom"})",
         [] { HostCtl::HostFactory::GetHost()->GetAdvancedOptions(); }},
        {R"({"call": "StorageInfo.GetHlfsFileSystemByUuid", "target": "ua", "message": "boom"})",
         [] { HostCtl::HostFactory::GetHost()->GetStorageInfo()->GetHlfsFileSystemByUuid("ua"); }},
        {R"({"call": "PointerBlockCache.GetStatistics", "message": "boom"})",
         [] { HostCtl::HostFactory::GetHost()->GetStorageInfo()->GetPointerBlockCache()->GetStatistics(); }},
        {R"({"call": "StorageInfoImpl.RemoveNetworkFileSystem", "target": "b", "message": "boom"})",
         [] { StorageInfoImpl::RemoveNetworkFileSystem("b", HostCtl::Storage::NFS_VERSION_3); }},
        {R"({"call": "FileSystem.Unmount", "message": "boom"})",
         [] { StorageInfoImpl().GetFileSystemByLabel("a")->Unmount(Fs::MOUNT_PERSISTENT); }},
        {R"({"call": "StorageInfoImpl.AddNasFirewallConfig", "target": "10.0.0.1", "message": "boom"})",
         [] { StorageInfoImpl().AddNasFirewallConfig("10.0.0.1", HostCtl::Storage::NFS_VERSION_3); }},
    };
    for (const auto& c : cases) {
        ScopedHost host(std::string("{") + kTwoVolumes + R"(, "faults": [)" + c.fault + "]}");
        const std::string before = host.State().dump();
        EXPECT_EQ(Outcomes({c.call}), "x") << c.fault;
        EXPECT_EQ(host.State().dump(), before) << "a fault fires before the call changes anything: " << c.fault;
    }
}

TEST(HostJournal, LinesInCallOrderWithArguments)
{
    ScopedHost host(std::string("{") + kTwoVolumes + R"(, "behaviour": {"tryMount": true},
        "faults": [{"call": "FileSystem.Mount", "message": "boom"}]})");
    {
        StorageInfoImpl info;
        info.SignalIORM(true);
        auto a = info.GetFileSystemByLabel("a");
        a->GetCapacity(); // not journaled
        a->Unmount(Fs::MOUNT_UNTIL_RESTART);
        EXPECT_THROW(a->Mount(Fs::MOUNT_PERSISTENT), HostCtlException);
        info.TryMount(Fs::MOUNT_UNTIL_RESTART, "ua", "");
        info.AddNetworkFileSystem("h", "/s", "n", true, "knx1", 16, 2);
        info.AddV41NetworkFileSystem({"h1", "h2"}, "/s", "n41", HostCtl::Storage::NetworkFileSystem::SEC_KRB5, false);
        auto nfs = info.GetV3NetworkFileSystems(nullptr);
        nfs[0]->SetMaxQueueDepth(8, true);
        HlFileSystemImpl fs("/hlfs/volumes/a");
        fs.SetUnmapProperty({4096, "high", 5, 0, "fixed"});
        fs.UnmapVolume(200, nullptr);
        EXPECT_THROW(info.RemoveNasFirewallConfig("1.2.3.4", HostCtl::Storage::NFS_VERSION_41), HostCtlException);
        StorageInfoImpl::RemoveNetworkFileSystem("n", HostCtl::Storage::NFS_VERSION_3);
    }
    const std::vector<json> expected = {
        json::parse(R"({"call": "StorageInfoImpl.SignalIORM", "target": "", "args": [true]})"),
        json::parse(R"({"call": "FileSystem.Unmount", "target": "a", "args": [1]})"),
        json::parse(R"({"call": "FileSystem.Mount", "target": "a", "args": [0], "error": "boom"})"),
        json::parse(R"({"call": "StorageInfoImpl.TryMount", "target": "a", "args": [1, "ua", ""]})"),
        json::parse(R"({"call": "StorageInfoImpl.AddNetworkFileSystem", "target": "n",
                        "args": ["h", "/s", "n", true, "knx1", 16, 2]})"),
        json::parse(R"({"call": "StorageInfoImpl.AddV41NetworkFileSystem", "target": "n41",
                        "args": [["h1", "h2"], "/s", "n41", 2, false]})"),
        json::parse(R"({"call": "NetworkFileSystem.SetMaxQueueDepth", "target": "b", "args": [8, true]})"),
        json::parse(R"({"call": "HlFileSystemImpl.new", "target": "a", "args": ["/hlfs/volumes/a"]})"),
        json::parse(R"({"call": "HlFileSystem.SetUnmapProperty", "target": "a",
                        "args": [4096, "high", 5, 0, "fixed"]})"),
        json::parse(R"({"call": "HlFileSystemImpl.UnmapVolume", "target": "a", "args": [200, null]})"),
        json::parse(R"({"call": "StorageInfoImpl.RemoveNasFirewallConfig", "target": "", "args": ["1.2.3.4", 2],
                        "error": "IP/Mask '1.2.3.4' not found in ruleset nfs41Client"})"),
        json::parse(R"({"call": "StorageInfoImpl.RemoveNetworkFileSystem", "target": "n", "args": ["n", 1]})"),
    };
    EXPECT_EQ(host.Journal(), expected);
}

} // namespace

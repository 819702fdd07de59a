// The semantics of the host operations that the plug-in relies on.

#include <array>
#include <functional>
#include <optional>
#include <regex>

#include <gtest/gtest.h>

#include "hostctl/Host.h"
#include "hostctl/HostCtlException.h"
#include "hostctl/Network.h"
#include "hostctl/StorageInfoImpl.h"
#include "support/HostErrors.h"
#include "support/HostFixture.h"

namespace {

using HostCtl::Storage::NFS_VERSION_3;
using HostCtl::Storage::NFS_VERSION_41;
using KnxCtl::Storage::HlFileSystemImpl;
using KnxCtl::Storage::StorageInfoImpl;
using KnxCtl::Storage::UnresolvedHlfsExtentImpl;
using KnxCtl::Storage::UnresolvedHlfsVolumeImpl;
using namespace TestSupport; // ScopedHost, MessageOf
using Fs = HostCtl::Storage::FileSystem;
using Nfs = HostCtl::Storage::NetworkFileSystem;

std::vector<std::string> Names(const auto& objects)
{
    std::vector<std::string> names;
    for (const auto& fs : objects)
        names.push_back(fs->GetVolumeName());
    return names;
}

TEST(HostOperations, IpStringClassification)
{
    const std::pair<const char*, int> cases[] = {
        {"10.0.0.0/8", 1},  {"10.0.0.1/0", 1},   {"10.0.0.1/32", 1},  {"10.0.0.1/33", 0},
        {"10.0.0.1", 2},    {"10.0.0.256", 0},   {"10.0.0", 0},       {"fd00::/64", 3},
        {"::1/128", 3},     {"::1/129", 0},      {"fd00:1:2::9", 4},  {"10.0.0.1/", 0},
        {"10.0.0.1/-1", 0}, {"10.0.0.1/8x", 0},  {"host.example", 0}, {"", 0},
        {"::/0", 3},        {"1.2.3.4/24/8", 0},
    };
    for (const auto& [text, type] : cases)
        EXPECT_EQ(KnxCtl::Network::FirewallRulesetImpl::GetTypeFromIpString(text), type) << text;
    const std::array<std::uint8_t, 6> bytes{0x00, 0x1E, 0x67, 0x0a, 0xff, 0x01};
    EXPECT_EQ(HostCtl::Network::MacAddress(bytes).GetStringAddress(), "00:1e:67:0a:ff:01");
}

TEST(HostOperations, MountAndUnmount)
{
    struct Case {
        bool busy;
        Fs::MountOperationOption option;
        int result;
        bool mounted;
        bool explicitlyUnmounted;
    };
    const Case cases[] = {
        {false, Fs::MOUNT_PERSISTENT, 0, false, true},
        {false, Fs::MOUNT_UNTIL_RESTART, 0, false, false},
        {true, Fs::MOUNT_PERSISTENT, 1, true, false},
    };
    for (const auto& c : cases) {
        ScopedHost host(std::string(R"({"fileSystems": [{"type": "vfat", "volumeName": "v", "busy": )") +
                        (c.busy ? "true" : "false") + "}]}");
        auto fs = StorageInfoImpl().GetFileSystemByLabel("v");
        EXPECT_EQ(fs->Unmount(c.option), c.result);
        EXPECT_EQ(fs->IsMounted(), c.mounted);
        StorageInfoImpl().AutoFullMountVolumes();
        EXPECT_EQ(fs->IsMounted(), !c.explicitlyUnmounted) << "automount leaves explicitly unmounted volumes";
        fs->Mount(Fs::MOUNT_PERSISTENT);
        EXPECT_TRUE(fs->IsMounted());
        if (c.explicitlyUnmounted) {
            EXPECT_EQ(host.State()["fileSystems"][0]["explicitlyUnmounted"], false);
        }
    }
}

TEST(HostOperations, LookUps)
{
    ScopedHost host(R"({"fileSystems": [
        {"type": "HLFS", "volumeName": "a", "uuid": "u1", "mounted": false},
        {"type": "NFS", "volumeName": "a", "uuid": "u2", "mountPoint": "/mnt/x"},
        {"type": "HLFS", "volumeName": "c", "uuid": "u1"},
        {"type": "HLFS", "volumeName": "d"}]})");
    StorageInfoImpl info;
    struct Case {
        std::function<std::unique_ptr<Fs>()> find;
        const char* expectedUuid; // nullptr: none found
    };
    const Case cases[] = {
        {[&] { return info.GetFileSystemByUUID("u1"); }, "u1"},
        {[&] { return info.GetFileSystemByUuidEx("u2"); }, "u2"},
        {[&] { return info.GetFileSystemByUUID("U1"); }, nullptr},
        {[&] { return info.GetFileSystemByLabel("a"); }, "u1"},
        {[&] { return info.GetFileSystemByLabel("zz"); }, nullptr},
        {[&] { return info.GetFileSystemByPath("/mnt/x"); }, "u2"},
        {[&] { return info.GetFileSystemByPath("/hlfs/volumes/a"); }, "u2"}, // the first one is not mounted
        {[&] { return info.GetFileSystemByPath("/hlfs/volumes/u1"); }, "u1"},
        {[&] { return info.GetFileSystemByPath("/hlfs/volumes/"); }, nullptr},
    };
    for (std::size_t i = 0; i < std::size(cases); ++i) {
        auto fs = cases[i].find();
        EXPECT_EQ(fs ? fs->GetUuid() : "(none)", cases[i].expectedUuid ? cases[i].expectedUuid : "(none)") << i;
    }
    EXPECT_EQ(Names(info.GetHlfsFileSystems("")), (std::vector<std::string>{"a", "c", "d"}));
    EXPECT_EQ(Names(info.GetHlfsFileSystemsList("u1")), (std::vector<std::string>{"a", "c"}));
    auto storage = HostCtl::HostFactory::GetHost()->GetStorageInfo();
    EXPECT_EQ(storage->GetHlfsFileSystemByLabel("c")->GetUuid(), "u1");
    EXPECT_EQ(storage->GetHlfsFileSystemByUuid("u2"), nullptr) << "u2 is not HLFS";
    // Derived UUIDs are stable, in the host's format, and differ between names.
    const std::string derived = storage->GetHlfsFileSystemByLabel("d")->GetUuid();
    EXPECT_TRUE(std::regex_match(derived, std::regex("[0-9a-f]{8}-[0-9a-f]{8}-[0-9a-f]{4}-[0-9a-f]{12}"))) << derived;
    EXPECT_EQ(info.GetFileSystemByLabel("d")->GetMountPoint(), "/hlfs/volumes/" + derived);
    host.Reopen();
    EXPECT_EQ(StorageInfoImpl().GetFileSystemByLabel("d")->GetUuid(), derived);
    EXPECT_NE(StorageInfoImpl().GetFileSystemByLabel("c")->GetUuid(), derived);
}

TEST(HostOperations, TryMount)
{
    struct Case {
        bool enabled;
        const char* uuid;
        const char* label;
        bool result;
    };
    const Case cases[] = {
        {true, "u1", "", true}, {true, "", "a", true},     {true, "u1", "a", true}, {true, "u1", "b", false},
        {true, "", "", false},  {false, "u1", "a", false}, {true, "u2", "", false}, // u2 is mounted already
    };
    for (const auto& c : cases) {
        ScopedHost host(std::string(R"({"behaviour": {"tryMount": )") + (c.enabled ? "true" : "false") +
                        R"(}, "fileSystems": [{"type": "HLFS", "volumeName": "a", "uuid": "u1", "mounted": false},
                                              {"type": "HLFS", "volumeName": "b", "uuid": "u2"}]})");
        EXPECT_EQ(StorageInfoImpl().TryMount(Fs::MOUNT_PERSISTENT, c.uuid, c.label), c.result)
            << c.uuid << "/" << c.label;
        EXPECT_EQ(StorageInfoImpl().GetFileSystemByUUID("u1")->IsMounted(), c.result);
    }
}

TEST(HostOperations, RescanAndAutomount)
{
    ScopedHost host(R"({
        "fileSystems": [{"type": "HLFS", "volumeName": "a", "mounted": false},
                        {"type": "HLFS", "volumeName": "b", "mounted": false, "explicitlyUnmounted": true}],
        "pendingRescan": {"fileSystems": [{"type": "vfat", "volumeName": "new", "mounted": false}],
                          "unresolvedVolumes": [{"volumeName": "snap"}]}})");
    StorageInfoImpl info;
    info.RescanHlfs();
    EXPECT_EQ(Names(info.GetFileSystems()), (std::vector<std::string>{"a", "b", "new"}));
    EXPECT_EQ(info.GetUnresolvedVolumes().size(), 1u);
    info.RescanHlfs(); // nothing more to find
    EXPECT_EQ(info.GetFileSystems().size(), 3u);
    info.AutoFullMountVolumes();
    std::vector<bool> mounted;
    for (const auto& fs : info.GetFileSystems())
        mounted.push_back(fs->IsMounted());
    EXPECT_EQ(mounted, (std::vector<bool>{true, false, true}));
    EXPECT_TRUE(host.State()["pendingRescan"]["fileSystems"].empty());
}

TEST(HostOperations, NfsAddMountAndRemove)
{
    ScopedHost host(R"({"fileSystems": [{"type": "vfat", "volumeName": "taken"}],
        "nfsExports": [{"host": "h1", "share": "/s", "capacity": 100, "used": 40},
                       {"host": "h2", "share": "/t", "capacity": 7, "used": 1}]})");
    StorageInfoImpl info;
    EXPECT_EQ(MessageOf([&] { info.AddNetworkFileSystem("h1", "/s", "taken", false, "", 0, 1); }),
              "A volume named 'taken' already exists");

    auto v3 = info.AddNetworkFileSystem("h1", "/s", "n3", true, "knx0", 0, 4);
    EXPECT_FALSE(v3->IsMounted());
    EXPECT_EQ(v3->GetType(), "NFS");
    EXPECT_EQ(v3->GetKnxnic(), "knx0");
    EXPECT_EQ(v3->GetKnxnics(), "knx0");
    EXPECT_EQ(v3->GetConnections(), 4);
    EXPECT_EQ(v3->GetConnectionsParam(), 4);
    EXPECT_EQ(v3->GetMaxQueueDepth(), 4294967295u);
    EXPECT_EQ(v3->GetRemoteHosts(), (std::vector<std::string>{"h1"}));
    v3->Mount(0u);
    EXPECT_TRUE(v3->IsMounted());
    EXPECT_EQ(v3->GetCapacity(), 100u);
    EXPECT_EQ(v3->GetUsedSpace(), 40u);

    auto unbound = info.AddNetworkFileSystem("h2", "/s", "wrong", false, "knx0", 32, 1);
    EXPECT_EQ(unbound->GetKnxnic(), "");
    EXPECT_EQ(unbound->GetMaxQueueDepth(), 32u);
    EXPECT_EQ(MessageOf([&] { unbound->Mount(4u); }), "Unable to connect to NFS server h2:/s");

    auto v41 = info.AddV41NetworkFileSystem({"h9:knxA", "h2:knxB"}, "/t", "n41", Nfs::SEC_KRB5I, true);
    EXPECT_EQ(v41->GetRemoteHosts(), (std::vector<std::string>{"h9", "h2"}));
    EXPECT_EQ(v41->GetRemoteHost(), "h9");
    EXPECT_EQ(v41->GetKnxnics(), "knxA,knxB");
    EXPECT_EQ(v41->GetSecurityType(), Nfs::SEC_KRB5I);
    v41->Mount(0u); // h2 exports /t although h9 does not
    EXPECT_EQ(v41->GetCapacity(), 7u);
    auto plain41 = info.AddV41NetworkFileSystem({"h8"}, "/t", "other41", Nfs::SEC_SYS, false);
    EXPECT_EQ(MessageOf([&] { plain41->Mount(0u); }), "Unable to connect to NFS server h8:/t");

    EXPECT_EQ(Names(info.GetV3NetworkFileSystems(nullptr)), (std::vector<std::string>{"n3", "wrong"}));
    EXPECT_EQ(Names(info.GetV41NetworkFileSystems(StorageInfoImpl::IsNotPE)),
              (std::vector<std::string>{"n41", "other41"}));
    v41->SetPE(true);
    EXPECT_EQ(Names(info.GetV41NetworkFileSystems(StorageInfoImpl::IsPE)), (std::vector<std::string>{"n41"}));

    struct Removal {
        std::function<void()> remove;
        const char* message;
    };
    const Removal removals[] = {
        {[] { StorageInfoImpl::RemoveNetworkFileSystem("n3", NFS_VERSION_41); }, "NFS volume 'n3' not found"},
        {[] { StorageInfoImpl().RemoveNetworkFileSystem("taken"); }, "NFS volume 'taken' not found"},
        {[] { StorageInfoImpl::RemoveNetworkFileSystem("n3", NFS_VERSION_3); }, ""},
        {[] { StorageInfoImpl().RemoveNetworkFileSystem("n41"); }, ""},
        {[] { StorageInfoImpl().RemoveNetworkFileSystem("n41"); }, "NFS volume 'n41' not found"},
    };
    for (const auto& r : removals)
        EXPECT_EQ(MessageOf(r.remove), r.message);
    EXPECT_EQ(Names(info.GetFileSystems()), (std::vector<std::string>{"taken", "wrong", "other41"}));
    EXPECT_EQ(MessageOf([&] { v3->GetCapacity(); }), "Volume 'n3' no longer exists");

    host.Reopen();
    EXPECT_EQ(Names(StorageInfoImpl().GetFileSystems()), (std::vector<std::string>{"taken", "wrong", "other41"}));
}

TEST(HostOperations, NfsBusyRemovalAndPreUnmount)
{
    ScopedHost host(R"({"fileSystems": [{"type": "NFS", "volumeName": "n", "busy": true},
                                        {"type": "NFS41", "volumeName": "m"}]})");
    StorageInfoImpl info;
    EXPECT_EQ(MessageOf([&] { info.RemoveNetworkFileSystem("n"); }), "Volume 'n' is busy");
    info.EnterNetworkFileSystemPreUnmount("n");
    EXPECT_EQ(host.State()["fileSystems"][0]["preUnmount"], true);
    info.ExitNetworkFileSystemPreUnmount("n");
    EXPECT_EQ(host.State()["fileSystems"][0]["preUnmount"], false);
    EXPECT_EQ(MessageOf([&] { info.EnterNetworkFileSystemPreUnmount("m"); }), "NFS volume 'm' not found");
    EXPECT_EQ(info.GetFileSystems().size(), 2u);
}

TEST(HostOperations, FirewallRulesets)
{
    ScopedHost host(R"({"firewall": {"nfsClient": ["10.0.0.0/8"]}})");
    StorageInfoImpl info;
    struct Step {
        bool add;
        const char* entry;
        HostCtl::Storage::NfsVersion version;
        const char* message;
    };
    const Step steps[] = {
        {true, "10.0.0.0/8", NFS_VERSION_3, "IP/Mask '10.0.0.0/8' already exists in ruleset nfsClient"},
        {true, "10.0.0.0/8", NFS_VERSION_41, ""},
        {true, "fd00::/64", NFS_VERSION_3, ""},
        {false, "192.0.2.1", NFS_VERSION_41, "IP/Mask '192.0.2.1' not found in ruleset nfs41Client"},
        {false, "10.0.0.0/8", NFS_VERSION_3, ""},
        {false, "10.0.0.0/8", NFS_VERSION_3, "IP/Mask '10.0.0.0/8' not found in ruleset nfsClient"},
    };
    for (const auto& s : steps)
        EXPECT_EQ(MessageOf([&] {
                      s.add ? info.AddNasFirewallConfig(s.entry, s.version)
                            : info.RemoveNasFirewallConfig(s.entry, s.version);
                  }),
                  s.message)
            << s.entry;
    EXPECT_EQ(info.GetNasFirewallConfigs(NFS_VERSION_3), (std::vector<std::string>{"fd00::/64"}));
    EXPECT_EQ(info.GetNasFirewallConfigs(NFS_VERSION_41), (std::vector<std::string>{"10.0.0.0/8"}));
    EXPECT_EQ(host.State()["firewall"]["nfs41Client"], nlohmann::json::array({"10.0.0.0/8"}));
}

TEST(HostOperations, SnapshotsMountAndResignature)
{
    ScopedHost host(R"({
      "fileSystems": [{"type": "HLFS", "volumeName": "ds", "uuid": "u-ds"}],
      "unresolvedVolumes": [
        {"volumeName": "ds", "uuid": "u-ds", "lvmUuid": "l", "majorVersion": 5, "capacity": 77, "mountReason": 6,
         "extents": [{"deviceName": "e1", "partition": 2, "start": 5, "end": 9}, null,
                     {"deviceName": "e3", "impl": false}]},
        null,
        {"volumeName": "old", "uuid": "u-old", "resignatureReason": 3},
        {"volumeName": "foreign", "impl": false}]})");
    StorageInfoImpl info;
    auto copies = info.GetUnresolvedVolumes();
    ASSERT_EQ(copies.size(), 4u);
    EXPECT_EQ(copies[1], nullptr);
    EXPECT_EQ(dynamic_cast<UnresolvedHlfsVolumeImpl*>(copies[3].get()), nullptr);
    auto* replica = dynamic_cast<UnresolvedHlfsVolumeImpl*>(copies[0].get());
    auto* old = dynamic_cast<UnresolvedHlfsVolumeImpl*>(copies[2].get());
    ASSERT_TRUE(replica && old);

    auto extents = replica->GetExtents();
    ASSERT_EQ(extents.size(), 3u);
    auto* first = dynamic_cast<UnresolvedHlfsExtentImpl*>(extents[0].get());
    ASSERT_NE(first, nullptr);
    EXPECT_EQ(first->GetDeviceName() + ":" + std::to_string(first->GetPartition()), "e1:2");
    EXPECT_EQ(first->GetEnd() - first->GetStart(), 4);
    EXPECT_EQ(extents[1], nullptr);
    EXPECT_EQ(dynamic_cast<UnresolvedHlfsExtentImpl*>(extents[2].get()), nullptr);
    EXPECT_EQ(extents[2]->GetDeviceName(), "e3");

    struct Check {
        UnresolvedHlfsVolumeImpl* copy;
        bool second;
        bool result;
        unsigned code;
    };
    for (const auto& c : {Check{replica, true, false, 6}, Check{replica, false, true, 0}, Check{old, true, true, 0},
                          Check{old, false, false, 3}}) {
        unsigned code = 99;
        EXPECT_EQ(c.copy->CanResolve(false, c.second, &code), c.result);
        EXPECT_EQ(code, c.code);
    }
    EXPECT_EQ(MessageOf([&] { replica->Mount(false, true); }), "Cannot mount snapshot 'ds': reason code 6");
    EXPECT_EQ(MessageOf([&] { old->Resignature(); }), "Cannot resignature snapshot 'old': reason code 3");
    EXPECT_EQ(info.GetUnresolvedVolumes().size(), 4u);

    auto resignatured = replica->Resignature();
    const std::string uuid = resignatured->GetUuid();
    EXPECT_NE(uuid, "u-ds");
    EXPECT_EQ(resignatured->GetVolumeName(), "snap-" + uuid.substr(0, 8) + "-ds");
    auto* hlfs = dynamic_cast<HlFileSystemImpl*>(resignatured.get());
    ASSERT_NE(hlfs, nullptr);
    EXPECT_TRUE(hlfs->IsMounted());
    EXPECT_EQ(hlfs->GetMajorVersion(), 5);
    EXPECT_EQ(hlfs->GetLvmUuid(), "l");
    EXPECT_EQ(hlfs->GetCapacity(), 77u);
    EXPECT_EQ(hlfs->GetExtents().size(), 2u);
    EXPECT_EQ(hlfs->GetExtents()[1]->GetDeviceName(), "e3");

    auto mounted = old->Mount(false, true);
    EXPECT_EQ(mounted->GetUuid(), "u-old");
    EXPECT_EQ(Names(info.GetFileSystems()), (std::vector<std::string>{"ds", resignatured->GetVolumeName(), "old"}));
    EXPECT_EQ(info.GetUnresolvedVolumes().size(), 2u);
    EXPECT_EQ(MessageOf([&] { replica->GetUuid(); }), "Snapshot 'ds' no longer exists");

    // The same state resignatures to the same UUID every time.
    host.Reopen();
    EXPECT_EQ(StorageInfoImpl().GetFileSystemByUUID(uuid)->GetVolumeName(), "snap-" + uuid.substr(0, 8) + "-ds");
}

TEST(HostOperations, HlfsOpenConvertAndSettings)
{
    ScopedHost host(R"({"fileSystems": [{"type": "HLFS", "volumeName": "v3", "uuid": "u3", "majorVersion": 3},
                                        {"type": "HLFS", "volumeName": "v5", "majorVersion": 5},
                                        {"type": "vfat", "volumeName": "boot", "uuid": "ub"}]})");
    const std::pair<const char*, const char*> opens[] = {
        {"/hlfs/volumes/u3", ""},
        {"/hlfs/volumes/v5", ""},
        {"/hlfs/volumes/boot", "Cannot open HLFS volume at '/hlfs/volumes/boot'"},
        {"/hlfs/volumes/ub", "Cannot open HLFS volume at '/hlfs/volumes/ub'"},
        {"/volumes/u3", "Cannot open HLFS volume at '/volumes/u3'"},
    };
    for (const auto& [path, message] : opens)
        EXPECT_EQ(MessageOf([p = path] { HlFileSystemImpl fs(p); }), message) << path;

    HlFileSystemImpl v3("/hlfs/volumes/v3");
    HlFileSystemImpl v5("/hlfs/volumes/v5");
    EXPECT_EQ(MessageOf([&] { v5.ConvertToVersion5(); }), "Volume 'v5' is not an HLFS-3 volume");
    v3.ConvertToVersion5();
    EXPECT_EQ(v3.GetMajorVersion(), 5);
    EXPECT_EQ(MessageOf([&] { v3.ConvertToVersion5(); }), "Volume 'v3' is not an HLFS-3 volume");

    const auto defaults = v5.GetUnmapProperty();
    EXPECT_EQ(defaults.granularity, 1048576u);
    EXPECT_EQ(defaults.priority + "/" + defaults.method, "low/priority");
    v5.SetUnmapProperty({65536, "high", 100, 1, "fixed"});
    v5.SetLockMode(0x10);
    v5.SetClusteredHdskEnabled(true);
    host.Reopen();
    auto again = HlFileSystemImpl::GetHLFSFileSystemByLabel("v5");
    EXPECT_EQ(again->GetUnmapProperty().method, "fixed");
    EXPECT_EQ(again->GetUnmapProperty().bandwidth, 100);
    EXPECT_EQ(again->GetLockMode(), 0x10u);
    EXPECT_TRUE(again->IsClusteredHdskEnabled());
    EXPECT_EQ(HlFileSystemImpl::GetHLFSFileSystemByUUID("ub"), nullptr);
}

TEST(HostOperations, UsersPointerBlockCacheHeapsAndOptions)
{
    ScopedHost host(R"({
      "fileSystems": [{"type": "HLFS", "volumeName": "v", "users": [
        {"heartbeatUuid": "a", "macAddress": "00:1E:67:C4:D2:A8", "live": false}, {"heartbeatUuid": "b"}]}],
      "pointerBlockCache": {"cacheSize": 1, "cacheSizeMax": 2, "workingSet": 30, "workingSetMax": 40,
                            "heapOverhead": 5, "capacityMissRatio": 6},
      "heaps": [{"name": "hlfs3", "size": 10, "maxSize": 20}],
      "advancedOptions": {"HLFS3": {"EnableOnlineATSUpgrade": 1, "Mode": "fast"}}})");
    auto fs = HlFileSystemImpl::GetHLFSFileSystemByLabel("v");
    EXPECT_EQ(fs->GetUsers(false).size(), 2u);
    auto live = fs->GetUsers(true);
    ASSERT_EQ(live.size(), 1u);
    EXPECT_EQ(live[0].heartbeatUuid, "b");
    EXPECT_EQ(fs->GetUsers(false)[0].macAddress.GetStringAddress(), "00:1e:67:c4:d2:a8");

    HostCtl::Host* h = HostCtl::HostFactory::GetHost();
    auto cache = h->GetStorageInfo()->GetPointerBlockCache();
    EXPECT_EQ(cache->GetStatistics().capacityMissRatio, 6);
    cache->ResetStatistics();
    const auto stats = cache->GetStatistics();
    EXPECT_EQ(stats.capacityMissRatio, 0);
    EXPECT_EQ(stats.workingSetMax, 30u);
    EXPECT_EQ(stats.cacheSizeMax, 2u);
    EXPECT_EQ(host.State()["pointerBlockCache"]["workingSetMax"], 30);

    auto heaps = h->GetHardwareInfo()->GetMemoryInfo()->GetHeapStats();
    ASSERT_EQ(heaps.size(), 1u);
    EXPECT_EQ(heaps[0]->name + "/" + std::to_string(heaps[0]->maxSize), "hlfs3/20");

    auto group = h->GetAdvancedOptions()->GetOptionGroup("HLFS3");
    auto option = group->GetOption("EnableOnlineATSUpgrade");
    auto* number = dynamic_cast<HostCtl::AdvancedIntegerOption*>(option.get());
    ASSERT_NE(number, nullptr);
    EXPECT_EQ(number->GetValue(), 1);
    EXPECT_EQ(dynamic_cast<HostCtl::AdvancedIntegerOption*>(group->GetOption("Mode").get()), nullptr);
    EXPECT_EQ(MessageOf([&] { group->GetOption("Nope"); }), "Advanced option 'HLFS3/Nope' not found");
    EXPECT_EQ(MessageOf([&] { h->GetAdvancedOptions()->GetOptionGroup("NFS"); }),
              "Advanced option group 'NFS' not found");
}

} // namespace

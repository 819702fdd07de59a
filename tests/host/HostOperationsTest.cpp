// The semantics of the host operations that the plug-in relies on.

#include <array>
#include <functional>
#include <regex>

#include <gtest/gtest.h>

#include "hostctl/Host.h"
#include "hostctl/Network.h"
#include "hostctl/StorageInfoImpl.h"
#include "support/HostErrors.h"
#include "support/HostFixture.h"

namespace {

using HostCtl::Storage::NFS_VERSION_3;
using HostCtl::Storage::NFS_VERSION_41;
using KnxCtl::Storage::StorageInfoImpl;
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

} // namespace

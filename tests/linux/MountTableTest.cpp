// The mount table reader against findmnt on the same fixture files, and what the Linux
// host makes of each mount: block or not, NFS version and options, server and share.

#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "LinuxTestSupport.h"
#include "host/linux/LinuxMounts.h"

namespace {

using namespace HostLinux;

const std::string kFixtures = LINUX_FIXTURES_DIR;

class MountTableFile : public ::testing::TestWithParam<const char*> {};

TEST_P(MountTableFile, ReadsWhatFindmntReads)
{
    const std::string file = kFixtures + "/" + GetParam();
    const auto ran =
        LinuxTest::Run({"findmnt", "-F", file, "-J", "-l", "--nofsroot", "-o", "ID,TARGET,SOURCE,FSTYPE,OPTIONS"});
    if (ran.exitCode == 127)
        GTEST_SKIP() << "findmnt is not installed: " << ran.err;
    ASSERT_EQ(ran.exitCode, 0) << ran.err;
    const auto expected = nlohmann::json::parse(ran.out)["filesystems"];
    const auto entries = ReadMountTable(file);
    ASSERT_EQ(entries.size(), expected.size());
    for (std::size_t i = 0; i < entries.size(); ++i) {
        SCOPED_TRACE(entries[i].target);
        EXPECT_EQ(entries[i].id, expected[i]["id"].get<int>());
        EXPECT_EQ(entries[i].target, expected[i]["target"].get<std::string>());
        EXPECT_EQ(entries[i].source, expected[i]["source"].get<std::string>());
        EXPECT_EQ(entries[i].fsType, expected[i]["fstype"].get<std::string>());
        EXPECT_EQ(entries[i].options, expected[i]["options"].get<std::string>());
    }
}

INSTANTIATE_TEST_SUITE_P(Fixtures, MountTableFile, ::testing::Values("blanks-and-optional.mountinfo", "nfs.mountinfo"));

TEST(MountTable, MissingFileIsAnErrorNamingIt)
{
    const auto message = LinuxTest::ErrorOf([] { ReadMountTable(kFixtures + "/no-such.mountinfo"); });
    EXPECT_NE(message.find("no-such.mountinfo"), std::string::npos) << message;
}

// The entry mounted on `target`.
const MountEntry& At(const std::vector<MountEntry>& entries, const std::string& target)
{
    static const MountEntry none{};
    auto it = std::find_if(entries.begin(), entries.end(), [&](const MountEntry& e) { return e.target == target; });
    EXPECT_NE(it, entries.end()) << target;
    return it == entries.end() ? none : *it;
}

struct KindCase {
    const char* target;
    MountKind kind;
};

TEST(MountTable, ClassifiesBlockNodevAndNfs)
{
    const auto kinds = ReadFilesystemKinds(kFixtures + "/filesystems");
    std::vector<MountEntry> entries = ReadMountTable(kFixtures + "/blanks-and-optional.mountinfo");
    for (const auto& e : ReadMountTable(kFixtures + "/nfs.mountinfo"))
        entries.push_back(e);
    const KindCase cases[] = {
        {"/mnt/my data", MountKind::Block},   {"/srv/tab\tand\\slash", MountKind::Block},
        {"/run/user/0", MountKind::Other},    // tmpfs: nodev
        {"/mnt/fuse disk", MountKind::Block}, // fuseblk needs a device
        {"/home/u/remote", MountKind::Other}, // fuse.sshfs: its main type is nodev
        {"/srv/v3", MountKind::Nfs3},         {"/srv/v6", MountKind::Nfs3},
        {"/srv/v40", MountKind::Nfs4},        {"/srv/v42", MountKind::Nfs4},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.target);
        EXPECT_EQ(Classify(At(entries, c.target), kinds), c.kind);
    }
    // A type the kernel does not list at all is not taken for a block file system.
    EXPECT_EQ(Classify(MountEntry{0, "/x", "/dev/x", "madeupfs", ""}, kinds), MountKind::Other);
}

struct NfsCase {
    const char* target;
    const char* version;
    std::int64_t connections;
    std::uint32_t rsize;
    std::uint32_t wsize;
    const char* security;
    bool readOnly;
    const char* host;
    const char* share;
};

TEST(MountTable, NfsOptionsAndServer)
{
    const auto entries = ReadMountTable(kFixtures + "/nfs.mountinfo");
    const NfsCase cases[] = {
        {"/srv/v3", "3", 1, 1048576, 524288, "sys", false, "10.0.0.1", "/export/v3"},
        {"/srv/v6", "3", 1, 65536, 65536, "sys", true, "fd00::1", "/export six"},
        {"/srv/v40", "4.0", 1, 131072, 131072, "sys", false, "server.example", "/"},
        {"/srv/v41", "4.1", 8, 1048576, 1048576, "krb5", false, "10.0.0.3", "/data"},
        {"/srv/v42", "4.2", 1, 262144, 262144, "krb5p", false, "fd00::3", "/k"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.target);
        const MountEntry& entry = At(entries, c.target);
        const NfsOptions nfs = ReadNfsOptions(entry.options);
        EXPECT_EQ(nfs.version, c.version);
        EXPECT_EQ(nfs.connections, c.connections);
        EXPECT_EQ(nfs.rsize, c.rsize);
        EXPECT_EQ(nfs.wsize, c.wsize);
        EXPECT_EQ(nfs.security, c.security);
        EXPECT_EQ(nfs.readOnly, c.readOnly);
        const NfsSource source = SplitNfsSource(entry.source);
        EXPECT_EQ(source.host, c.host);
        EXPECT_EQ(source.share, c.share);
    }
}

TEST(MountTable, NfsOptionEdges)
{
    struct Case {
        const char* options;
        const char* version;
        std::int64_t connections;
        bool readOnly;
    };
    const Case cases[] = {
        {"rw,vers=4,minorversion=1", "4.1", 1, false}, // older kernels' spelling
        {"rw,nfsvers=3", "3", 1, false},
        {"ro,nconnect=junk", "", 1, true},         // junk is not a count
        {"rw,nconnect=99999999999", "", 1, false}, // neither is an overflow
        {"rw,errors=remount-ro", "", 1, false},    // "ro" inside another value is not ro
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.options);
        const NfsOptions nfs = ReadNfsOptions(c.options);
        EXPECT_EQ(nfs.version, c.version);
        EXPECT_EQ(nfs.connections, c.connections);
        EXPECT_EQ(nfs.readOnly, c.readOnly);
    }
}

TEST(MountTable, StatWithinAnswersAndFails)
{
    const auto root = StatWithin("/", 5);
    ASSERT_TRUE(root.has_value());
    EXPECT_GT(root->size, 0u);
    EXPECT_LE(root->available, root->size);
    EXPECT_THROW(StatWithin("/no/such/path/at/all", 5), std::runtime_error);
}

} // namespace

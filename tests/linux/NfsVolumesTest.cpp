// NFS volumes on the Linux host through autocli: the registry, the clear error of a kernel
// without an NFS client, and unmount/remove in a private mount namespace with a tmpfs
// standing in for a mounted NFS volume.

#include <gtest/gtest.h>

#include <sys/stat.h>

#include <nlohmann/json.hpp>

#include "LinuxTestSupport.h"

namespace {

const char* const kNoClient = "This kernel has no NFS client (nfs is not in /proc/filesystems)";

// `listing` holds one row, with at least the given fields.
void ExpectRow(const std::string& listing, const nlohmann::json& fields)
{
    const auto rows = nlohmann::json::parse(listing);
    ASSERT_EQ(rows.size(), 1u) << listing;
    for (const auto& [name, value] : fields.items())
        EXPECT_EQ(rows[0][name], value) << name;
}

TEST(NfsVolumes, AddOnAKernelWithoutNfsClientSaysSoAndRecordsNothing)
{
    if (LinuxTest::KernelHasNfsClient())
        GTEST_SKIP() << "this kernel has an NFS client; the clear error is for kernels without one";
    LinuxTest::TempDir dir;
    const std::string journal = dir.Path() + "/journal";
    const std::vector<std::string> env{"AUTOCLI_LINUX_DIR=" + dir.Path() + "/state", "AUTOCLI_JOURNAL=" + journal};
    const std::pair<const char*, const char*> cases[] = {
        {"nfs add -H 10.0.0.1 -s /export -v v3vol", "StorageInfoImpl.AddNetworkFileSystem"},
        {"nfs add -H 10.0.0.1 -s /export -v v3vol -c 4 -r", "StorageInfoImpl.AddNetworkFileSystem"},
        {"nfs41 add -H 10.0.0.1,10.0.0.2 -s /export -v v41vol -a krb5", "StorageInfoImpl.AddV41NetworkFileSystem"},
    };
    for (const auto& [words, call] : cases) {
        SCOPED_TRACE(words);
        const auto ran = LinuxTest::Autocli(LinuxTest::Words(std::string("--host linux storage ") + words), env);
        EXPECT_EQ(ran.exitCode, 1) << ran.out << ran.err;
        EXPECT_EQ(ran.err, std::string(kNoClient) + "\n");
        const std::string lines = LinuxTest::ReadFile(journal);
        EXPECT_NE(lines.find(std::string("\"call\":\"") + call + "\""), std::string::npos) << lines;
        EXPECT_NE(lines.find(kNoClient), std::string::npos) << lines;
    }
    // Nothing was recorded, no folder was made for a volume that can never be mounted here.
    struct stat st {};
    EXPECT_NE(::stat((dir.Path() + "/state").c_str(), &st), 0);
    const auto listed = LinuxTest::Autocli({"--host", "linux", "--formatter", "json", "storage", "nfs", "list"}, env);
    EXPECT_EQ(listed.exitCode, 0) << listed.err;
    EXPECT_EQ(nlohmann::json::parse(listed.out), nlohmann::json::array());

    // A volume recorded where the kernel could mount it (the registry moved with a disk, say):
    // mounting it, by hand or automatically, gives the same clear answer and changes nothing.
    ASSERT_EQ(::mkdir((dir.Path() + "/state").c_str(), 0755), 0);
    const std::string registry = R"({"volumes": [{"name": "moved", "version": "3", "hosts": ["10.0.0.1"],
        "share": "/export", "readOnly": false, "connections": 1, "security": 0, "explicitlyUnmounted": false}]})";
    LinuxTest::WriteFile(dir.Path() + "/state/linux-host.json", registry);
    for (const char* words : {"storage filesystem mount -l moved", "storage filesystem automount"}) {
        SCOPED_TRACE(words);
        const auto ran = LinuxTest::Autocli(LinuxTest::Words(std::string("--host linux ") + words), env);
        EXPECT_EQ(ran.exitCode, 1) << ran.out << ran.err;
        EXPECT_NE(ran.err.find(kNoClient), std::string::npos) << ran.err;
    }
    EXPECT_EQ(LinuxTest::ReadFile(dir.Path() + "/state/linux-host.json"), registry);
    EXPECT_NE(::stat((dir.Path() + "/state/volumes").c_str(), &st), 0);
}

TEST(NfsVolumes, ServedFromANamespaceWithAStandIn)
{
    if (auto problem = LinuxTest::NamespaceProblem({"-m", "--propagation", "private"}))
        GTEST_SKIP() << *problem;
    LinuxTest::TempDir dir;
    const std::string state = dir.Path() + "/state";
    ASSERT_EQ(::mkdir(state.c_str(), 0755), 0);
    // Two volumes this tool added earlier; the first is mounted (a tmpfs stands in for the
    // server's share), the second is not.
    LinuxTest::WriteFile(state + "/linux-host.json", R"({"volumes": [
        {"name": "vol1", "version": "3", "hosts": ["nfs.example"], "share": "/export/one", "readOnly": false,
         "connections": 2, "security": 0, "explicitlyUnmounted": false},
        {"name": "vol41", "version": "4.1", "hosts": ["a.example", "b.example"], "share": "/export/two",
         "readOnly": true, "connections": 1, "security": 2, "explicitlyUnmounted": true}]})");
    const std::string script = R"SH(
mkdir -p "$DIR/volumes/vol1" "$DIR/volumes/vol2" || exit 9
mount -t tmpfs standin "$DIR/volumes/vol1" || exit 10
step nfslist "$AUTOCLI" --host linux --formatter json storage nfs list
step nfs41list "$AUTOCLI" --host linux --formatter json storage nfs41 list
step param "$AUTOCLI" --host linux --formatter json storage nfs41 param get -v vol41
step fslist "$AUTOCLI" --host linux --formatter json storage filesystem list
step root "$AUTOCLI" --host linux storage filesystem unmount -p /
step proc "$AUTOCLI" --host linux storage filesystem unmount -p /proc
step unmount "$AUTOCLI" --host linux --formatter json storage filesystem unmount -l vol1
step gone findmnt -n "$DIR/volumes/vol1"
step rootstays findmnt -n -o TARGET /
step registry1 cat "$DIR/linux-host.json"
step after "$AUTOCLI" --host linux --formatter json storage nfs list
step remove "$AUTOCLI" --host linux --formatter json storage nfs remove -v vol1
step removewrong "$AUTOCLI" --host linux storage nfs remove -v vol41
step removenone "$AUTOCLI" --host linux storage nfs remove -v nothing
mkdir -p "$DIR/volumes/vol41" && mount -t tmpfs standin "$DIR/volumes/vol41" && touch "$DIR/volumes/vol41/held" || exit 11
exec 3<"$DIR/volumes/vol41/held"
step busy "$AUTOCLI" --host linux storage filesystem unmount -l vol41
step busyremove "$AUTOCLI" --host linux storage nfs41 remove -v vol41
exec 3<&-
step remove41 "$AUTOCLI" --host linux --formatter json storage nfs41 remove -v vol41
step registry2 cat "$DIR/linux-host.json"
)SH";
    const auto ran = LinuxTest::RunInNamespaces(
        {"-m", "--propagation", "private"}, LinuxTest::kStepFunction + script,
        {"DIR=" + state, "AUTOCLI_LINUX_DIR=" + state, "AUTOCLI_JOURNAL=" + dir.Path() + "/journal"});
    ASSERT_EQ(ran.exitCode, 0) << ran.out << ran.err;
    auto steps = LinuxTest::ParseSteps(ran.out);

    const std::vector<LinuxTest::StepExpectation> expectations = {
        {"root", 1, "Volume '/' was not added with autocli"},
        {"proc", 1, "No NAS volume was found mounted on '/proc'"},
        {"unmount", 0, "true"},
        {"gone", 1, ""},
        {"rootstays", 0, "/"},
        {"remove", 0, "true"},
        {"removewrong", 1, "NFS volume 'vol41' not found"}, // it is a v4.1 volume
        {"removenone", 1, "NFS volume 'nothing' not found"},
        {"busy", 1, "Volume 'vol41' cannot be unmounted. Reason: Busy"},
        {"busyremove", 1, "Volume 'vol41' is busy"},
        {"remove41", 0, "true"},
    };
    LinuxTest::ExpectSteps(steps, expectations);

    // Lists: the mounted volume from the mount table, the other from the registry.
    ExpectRow(steps["nfslist"].output, {{"Volume Name", "vol1"},
                                        {"Host", "nfs.example"},
                                        {"Share", "/export/one"},
                                        {"Mounted", true},
                                        {"Accessible", true},
                                        {"Connections", 2},
                                        {"isPE", false}});
    ExpectRow(steps["nfs41list"].output, {{"Volume Name", "vol41"},
                                          {"Host(s)", "a.example,b.example"},
                                          {"Mounted", false},
                                          {"Accessible", false},
                                          {"Read-Only", true},
                                          {"Security", "krb5"}});
    EXPECT_EQ(steps["param"].exitCode, 0) << steps["param"].output;
    // A tmpfs is no block file system: the file system list leaves it out.
    EXPECT_EQ(steps["fslist"].output.find("vol1"), std::string::npos) << steps["fslist"].output;

    // The unmount is remembered (automount leaves the volume alone), then it is removed.
    const auto afterUnmount = nlohmann::json::parse(steps["registry1"].output);
    EXPECT_EQ(afterUnmount["volumes"][0]["name"], "vol1");
    EXPECT_EQ(afterUnmount["volumes"][0]["explicitlyUnmounted"], true);
    ExpectRow(steps["after"].output, {{"Volume Name", "vol1"}, {"Mounted", false}});
    EXPECT_EQ(nlohmann::json::parse(steps["registry2"].output)["volumes"], nlohmann::json::array());
    struct stat st {};
    EXPECT_NE(::stat((state + "/volumes/vol1").c_str(), &st), 0) << "the empty mount point stays behind";

    // The journal holds the changes the Linux host was asked for, with their outcome.
    const std::string journal = LinuxTest::ReadFile(dir.Path() + "/journal");
    for (
        const char* line :
        {R"({"call":"FileSystem.Unmount","target":"vol1","args":[0]})",
         R"({"call":"StorageInfoImpl.RemoveNetworkFileSystem","target":"vol1","args":["vol1",1]})",
         R"({"call":"StorageInfoImpl.RemoveNetworkFileSystem","target":"vol41","args":["vol41",2],"error":"Volume 'vol41' is busy"})"})
        EXPECT_NE(journal.find(line), std::string::npos) << line << "\n" << journal;
}

TEST(NfsVolumes, NfsGaneshaServerOnLoopback)
{
    if (!LinuxTest::KernelHasNfsClient())
        GTEST_SKIP() << "this kernel has no NFS client (nfs is not in /proc/filesystems): nothing can be mounted "
                        "from a user-space NFS server";
    if (LinuxTest::Run({"ganesha.nfsd", "-v"}).exitCode == 127 || LinuxTest::Run({"rpcbind", "-h"}).exitCode == 127)
        GTEST_SKIP() << "nfs-ganesha (ganesha.nfsd with its VFS back end) and rpcbind are not installed";
    if (auto problem = LinuxTest::NamespaceProblem({"-m", "-n", "--propagation", "private"}))
        GTEST_SKIP() << *problem;
    LinuxTest::TempDir dir;
    const std::string exported = dir.Path() + "/export";
    ASSERT_EQ(::mkdir(exported.c_str(), 0755), 0);
    LinuxTest::WriteFile(dir.Path() + "/ganesha.conf",
                         "NFS_CORE_PARAM { Protocols = 3, 4; Bind_addr = 127.0.0.1; }\n"
                         "EXPORT { Export_Id = 1; Path = " +
                             exported +
                             "; Pseudo = /export;"
                             " Access_Type = RW; Squash = None; FSAL { Name = VFS; } }\n");
    const std::string script = R"SH(
ip link set lo up || exit 20
rpcbind -w || exit 21
ganesha.nfsd -f "$DIR/ganesha.conf" -L "$DIR/ganesha.log" -p "$DIR/ganesha.pid" || exit 22
sleep 3
"$AUTOCLI" --host linux --formatter json storage nfs add -H 127.0.0.1 -s "$EXPORT" -v gvol; echo "@@add $?"
"$AUTOCLI" --host linux --formatter json storage nfs list; echo "@@list $?"
"$AUTOCLI" --host linux --formatter json storage nfs remove -v gvol; echo "@@remove $?"
kill "$(cat "$DIR/ganesha.pid")"
)SH";
    const auto ran = LinuxTest::RunInNamespaces(
        {"-m", "-n", "--propagation", "private"}, script,
        {"DIR=" + dir.Path(), "EXPORT=" + exported, "AUTOCLI_LINUX_DIR=" + dir.Path() + "/state"});
    ASSERT_EQ(ran.exitCode, 0) << ran.out << ran.err;
    EXPECT_NE(ran.out.find("@@add 0"), std::string::npos) << ran.out << ran.err;
    EXPECT_NE(ran.out.find("\"Mounted\": true"), std::string::npos) << ran.out;
    EXPECT_NE(ran.out.find("@@remove 0"), std::string::npos) << ran.out << ran.err;
}

} // namespace

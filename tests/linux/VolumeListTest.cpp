// `storage filesystem list` on the Linux host against findmnt on the same machine, and in a
// private mount namespace with a loop device standing in for a volume.

#include <gtest/gtest.h>

#include <sys/stat.h>

#include <cmath>
#include <fstream>
#include <set>

#include <nlohmann/json.hpp>

#include "LinuxTestSupport.h"

namespace {

// The types /proc/filesystems lists without "nodev".
std::set<std::string> BlockTypes()
{
    std::set<std::string> types;
    std::ifstream in("/proc/filesystems");
    for (std::string line; std::getline(in, line);)
        if (line.rfind("nodev", 0) != 0 && line.find('\t') != std::string::npos)
            types.insert(line.substr(line.find('\t') + 1));
    return types;
}

struct Row {
    std::string target;
    std::uint64_t size = 0;
    std::uint64_t avail = 0;
};

// What findmnt shows of block and NFS mounts, in its order.
std::vector<Row> FromFindmnt(const std::string& json)
{
    const auto types = BlockTypes();
    std::vector<Row> rows;
    const auto doc = nlohmann::json::parse(json);
    for (const auto& fs : doc["filesystems"]) {
        std::string type = fs["fstype"].get<std::string>();
        const bool nfs = type == "nfs" || type == "nfs4";
        if (!types.count(type) && type.find('.') != std::string::npos)
            type.resize(type.find('.'));
        if (!nfs && !types.count(type))
            continue;
        auto number = [](const nlohmann::json& v) -> std::uint64_t {
            return v.is_number() ? v.get<std::uint64_t>() : v.is_string() ? std::stoull(v.get<std::string>()) : 0;
        };
        rows.push_back({fs["target"].get<std::string>(), number(fs["size"]), number(fs["avail"])});
    }
    return rows;
}

std::vector<Row> FromAutocli(const std::string& json)
{
    std::vector<Row> rows;
    const auto doc = nlohmann::json::parse(json);
    for (const auto& r : doc)
        rows.push_back(
            {r["Mount Point"].get<std::string>(), r["Size"].get<std::uint64_t>(), r["Free"].get<std::uint64_t>()});
    return rows;
}

bool Near(std::uint64_t a, std::uint64_t b)
{
    const double larger = static_cast<double>(std::max(a, b));
    return larger == 0 || std::fabs(static_cast<double>(a) - static_cast<double>(b)) <= larger * 0.01;
}

void ExpectSameVolumes(const std::vector<Row>& expected, const std::vector<Row>& listed)
{
    ASSERT_EQ(listed.size(), expected.size());
    for (std::size_t i = 0; i < listed.size(); ++i) {
        SCOPED_TRACE(expected[i].target);
        EXPECT_EQ(listed[i].target, expected[i].target);
        EXPECT_TRUE(Near(listed[i].size, expected[i].size)) << listed[i].size << " vs " << expected[i].size;
        EXPECT_TRUE(Near(listed[i].avail, expected[i].avail)) << listed[i].avail << " vs " << expected[i].avail;
    }
}

const char* kFindmnt[] = {"findmnt", "-J", "-b", "-l", "-o", "TARGET,FSTYPE,SIZE,AVAIL"};

TEST(VolumeList, ListsWhatFindmntShowsOnThisMachine)
{
    LinuxTest::TempDir registry;
    const auto listed = LinuxTest::Autocli({"--host", "linux", "--formatter", "json", "storage", "filesystem", "list"},
                                           {"AUTOCLI_LINUX_DIR=" + registry.Path()});
    const auto shown = LinuxTest::Run(std::vector<std::string>(std::begin(kFindmnt), std::end(kFindmnt)));
    if (shown.exitCode == 127)
        GTEST_SKIP() << "findmnt is not installed";
    ASSERT_EQ(shown.exitCode, 0) << shown.err;
    ASSERT_EQ(listed.exitCode, 0) << listed.err;
    const auto expected = FromFindmnt(shown.out);
    ASSERT_FALSE(expected.empty()) << "findmnt shows no block file system: " << shown.out;
    ExpectSameVolumes(expected, FromAutocli(listed.out));
    // A list creates nothing in the registry folder.
    struct stat st {};
    EXPECT_NE(::stat((registry.Path() + "/linux-host.json").c_str(), &st), 0);
    EXPECT_NE(::stat((registry.Path() + "/linux-host.json.lock").c_str(), &st), 0);
}

TEST(VolumeList, LoopVolumeInAPrivateMountNamespace)
{
    if (auto problem = LinuxTest::NamespaceProblem({"-m", "--propagation", "private"}))
        GTEST_SKIP() << *problem;
    if (LinuxTest::Run({"mkfs.ext4", "-V"}).exitCode == 127)
        GTEST_SKIP() << "mkfs.ext4 is not installed";
    LinuxTest::TempDir dir;
    const std::string image = dir.Path() + "/volume.img";
    const std::string target = dir.Path() + "/loop volume";
    ASSERT_EQ(::mkdir(target.c_str(), 0755), 0);
    ASSERT_EQ(LinuxTest::Run({"truncate", "-s", "16M", image}).exitCode, 0);
    const auto made = LinuxTest::Run({"mkfs.ext4", "-q", "-F", "-L", "datastore-x", image});
    ASSERT_EQ(made.exitCode, 0) << made.err;
    // Everything after the mount runs in the namespace that holds it; the mount (and the
    // loop device, which is released automatically) go when the namespace ends.
    const std::string script = R"SH(
mount -o loop "$IMAGE" "$TARGET" || { echo "@@nomount"; exit 0; }
"$AUTOCLI" --host linux --formatter json storage filesystem list; echo "@@list"
findmnt -J -b -l -o TARGET,FSTYPE,SIZE,AVAIL; echo "@@findmnt"
blkid -p -o value -s UUID "$(findmnt -n -o SOURCE "$TARGET")"; echo "@@uuid"
)SH";
    const auto ran = LinuxTest::RunInNamespaces(
        {"-m", "--propagation", "private"}, script,
        {"IMAGE=" + image, "TARGET=" + target, "AUTOCLI_LINUX_DIR=" + dir.Path() + "/registry"});
    ASSERT_EQ(ran.exitCode, 0) << ran.err;
    if (ran.out.find("@@nomount") != std::string::npos)
        GTEST_SKIP() << "loop devices cannot be mounted here: " << ran.err;
    const auto part = [&](const std::string& end, const std::string& start) {
        const auto from = start.empty() ? 0 : ran.out.find(start) + start.size() + 1;
        return ran.out.substr(from, ran.out.find(end) - from);
    };
    const std::string list = part("@@list", "");
    const std::string findmnt = part("@@findmnt", "@@list");
    const std::string uuid = part("@@uuid", "@@findmnt");
    ExpectSameVolumes(FromFindmnt(findmnt), FromAutocli(list));

    const auto rows = nlohmann::json::parse(list);
    auto row = std::find_if(rows.begin(), rows.end(), [&](const auto& r) { return r["Mount Point"] == target; });
    ASSERT_NE(row, rows.end()) << list;
    EXPECT_EQ((*row)["Volume Name"], "datastore-x"); // the label
    EXPECT_EQ((*row)["Type"], "ext4");
    EXPECT_EQ((*row)["Mounted"], true);
    // libblkid's UUID where blkid can read the device; the test's blkid may not be allowed to.
    if (!uuid.empty() && uuid != "\n") {
        EXPECT_EQ((*row)["UUID"].get<std::string>() + "\n", uuid);
    }

    // The same volume by UUID and by label.
    const std::string byUuid = (*row)["UUID"].get<std::string>();
    const auto single = LinuxTest::RunInNamespaces(
        {"-m", "--propagation", "private"},
        R"(mount -o loop "$IMAGE" "$TARGET" && "$AUTOCLI" --host linux --formatter json storage filesystem list -u "$UUID")",
        {"IMAGE=" + image, "TARGET=" + target, "UUID=" + byUuid, "AUTOCLI_LINUX_DIR=" + dir.Path() + "/registry"});
    ASSERT_EQ(single.exitCode, 0) << single.err;
    const auto one = nlohmann::json::parse(single.out);
    ASSERT_EQ(one.size(), 1u) << single.out;
    EXPECT_EQ(one[0]["Mount Point"], target);
}

} // namespace

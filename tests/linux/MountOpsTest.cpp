// Mounting and unmounting on the Linux host, in a private mount namespace (a child process
// that calls unshare), with a tmpfs standing in for a volume.

#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "LinuxTestSupport.h"
#include "host/linux/LinuxMountOps.h"
#include "host/linux/LinuxMounts.h"

namespace {

using namespace HostLinux;

bool MountedAt(const std::string& target)
{
    for (const auto& e : ReadMountTable())
        if (e.target == target)
            return true;
    return false;
}

void ExpectInNamespace(const std::function<std::string()>& body)
{
    const std::string answer = LinuxTest::InPrivateMountNamespace(body);
    if (answer.rfind("SKIP: ", 0) == 0)
        GTEST_SKIP() << answer.substr(6);
    EXPECT_EQ(answer, "");
}

TEST(MountOps, MountAndUnmountAStandIn)
{
    LinuxTest::TempDir dir;
    const std::string& folder = dir.Path();
    ExpectInNamespace([&]() -> std::string {
        const int fd = OpenMountPoint(folder, "vol one");
        MountOnto(fd, "standin", "tmpfs", 0, "size=1m");
        ::close(fd);
        const std::string target = folder + "/volumes/vol one";
        if (!MountedAt(target))
            return "the stand-in is not in the mount table";
        // Busy while a file inside is open, unmounted once it is closed.
        const int held = ::open((target + "/held").c_str(), O_CREAT | O_RDWR | O_CLOEXEC, 0600);
        if (held < 0)
            return "cannot create a file on the stand-in";
        if (UnmountPath(target) != 1)
            return "a busy file system was not reported busy";
        ::close(held);
        if (UnmountPath(target) != 0)
            return "unmount failed";
        if (MountedAt(target))
            return "still mounted after unmount";
        try {
            UnmountPath(target);
            return "unmounting what is not mounted did not fail";
        } catch (const std::runtime_error& e) {
            if (std::string(e.what()).find("Cannot unmount '" + target + "'") != 0)
                return std::string("wrong message: ") + e.what();
        }
        return "";
    });
}

TEST(MountOps, LinksInTheWayAreRefused)
{
    LinuxTest::TempDir dir;
    const std::string& folder = dir.Path();
    const std::string elsewhere = folder + "/elsewhere";
    ASSERT_EQ(::mkdir(elsewhere.c_str(), 0755), 0);
    struct Case {
        const char* name;
        std::function<void(const std::string&)> prepare; // given the registry folder
    };
    const Case cases[] = {
        {"volumes is a link", [&](const std::string& f) { ::symlink(elsewhere.c_str(), (f + "/volumes").c_str()); }},
        {"the mount point is a link",
         [&](const std::string& f) {
             ::mkdir((f + "/volumes").c_str(), 0755);
             ::symlink(elsewhere.c_str(), (f + "/volumes/vol").c_str());
         }},
        {"the mount point is a file",
         [&](const std::string& f) {
             ::mkdir((f + "/volumes").c_str(), 0755);
             LinuxTest::WriteFile(f + "/volumes/vol", "x");
         }},
    };
    int i = 0;
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const std::string registry = folder + "/r" + std::to_string(i++);
        ASSERT_EQ(::mkdir(registry.c_str(), 0755), 0);
        c.prepare(registry);
        EXPECT_THROW(OpenMountPoint(registry, "vol"), std::runtime_error);
    }
    // Nothing was made where the links point.
    struct stat st {};
    EXPECT_NE(::stat((elsewhere + "/vol").c_str(), &st), 0);
}

} // namespace

// The registry of NFS volumes added on a Linux host: its lock, its atomic save and what it
// refuses to read.

#include <gtest/gtest.h>

#include <dirent.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <ostream>

#include "LinuxTestSupport.h"
#include "host/linux/LinuxRegistry.h"

namespace HostLinux {

// A volume as a failed comparison shows it.
void PrintTo(const RegisteredVolume& v, std::ostream* os)
{
    *os << "{name '" << v.name << "', v41 " << v.v41 << ", hosts";
    for (const auto& host : v.hosts)
        *os << " '" << host << "'";
    *os << ", share '" << v.share << "', readOnly " << v.readOnly << ", connections " << v.connections << ", security "
        << v.security << ", explicitlyUnmounted " << v.explicitlyUnmounted << "}";
}

} // namespace HostLinux

namespace {

using HostLinux::RegisteredVolume;
using HostLinux::Registry;

RegisteredVolume Sample()
{
    RegisteredVolume v;
    v.name = "ds-9";
    v.v41 = true;
    v.hosts = {"10.0.0.1", "fd00::2"};
    v.share = "/export/a b";
    v.readOnly = true;
    v.connections = 4;
    v.security = 3;
    v.explicitlyUnmounted = true;
    return v;
}

mode_t ModeOf(const std::string& path)
{
    struct stat st {};
    return ::lstat(path.c_str(), &st) == 0 ? (st.st_mode & 07777) : 0;
}

std::vector<std::string> Names(const std::string& dir)
{
    std::vector<std::string> names;
    if (DIR* d = ::opendir(dir.c_str())) {
        while (dirent* e = ::readdir(d))
            if (std::string(e->d_name) != "." && std::string(e->d_name) != "..")
                names.push_back(e->d_name);
        ::closedir(d);
    }
    std::sort(names.begin(), names.end());
    return names;
}

TEST(Registry, ReadingAMissingFolderCreatesNothing)
{
    LinuxTest::TempDir dir;
    Registry registry(dir.Path() + "/not/yet");
    EXPECT_TRUE(registry.Load().empty());
    struct stat st {};
    EXPECT_NE(::stat((dir.Path() + "/not").c_str(), &st), 0);
}

TEST(Registry, SavesEveryFieldAndKeepsTheFileMode)
{
    LinuxTest::TempDir dir;
    const std::string folder = dir.Path() + "/reg";
    const mode_t oldMask = ::umask(022);
    {
        Registry registry(folder);
        registry.Update([](std::vector<RegisteredVolume>& volumes) { volumes.push_back(Sample()); });
    }
    ::umask(oldMask);
    EXPECT_EQ(ModeOf(folder + "/linux-host.json"), 0644u);
    EXPECT_EQ(ModeOf(folder + "/linux-host.json.lock"), 0600u);
    EXPECT_EQ(Names(folder),
              (std::vector<std::string>{"linux-host.json", "linux-host.json.lock"})); // no temporary left

    ASSERT_EQ(::chmod((folder + "/linux-host.json").c_str(), 0640), 0);
    Registry again(folder);
    const auto loaded = again.Load();
    ASSERT_EQ(loaded.size(), 1u);
    EXPECT_EQ(loaded[0], Sample());
    again.Update([](std::vector<RegisteredVolume>& volumes) { volumes.clear(); });
    EXPECT_EQ(ModeOf(folder + "/linux-host.json"), 0640u);
    EXPECT_TRUE(again.Load().empty());
}

TEST(Registry, AFailedChangeLeavesTheFileAsItWas)
{
    LinuxTest::TempDir dir;
    Registry registry(dir.Path());
    registry.Update([](std::vector<RegisteredVolume>& volumes) { volumes.push_back(Sample()); });
    const std::string before = LinuxTest::ReadFile(dir.Path() + "/linux-host.json");
    EXPECT_THROW(registry.Update([](std::vector<RegisteredVolume>& volumes) {
        volumes.clear();
        throw std::runtime_error("no");
    }),
                 std::runtime_error);
    EXPECT_EQ(LinuxTest::ReadFile(dir.Path() + "/linux-host.json"), before);
}

TEST(Registry, ASecondHolderWaitsThenGivesUp)
{
    LinuxTest::TempDir dir;
    Registry first(dir.Path());
    first.Update([](std::vector<RegisteredVolume>&) {});
    ::setenv("AUTOCLI_LOCK_TIMEOUT", "0", 1);
    Registry second(dir.Path());
    const auto message = LinuxTest::ErrorOf([&] { second.Update([](std::vector<RegisteredVolume>&) {}); });
    EXPECT_NE(message.find("is in use by another process"), std::string::npos) << message;
    ::unsetenv("AUTOCLI_LOCK_TIMEOUT");
}

TEST(Registry, LinksAreNotFollowed)
{
    LinuxTest::TempDir dir;
    const std::string elsewhere = dir.Path() + "/elsewhere";
    LinuxTest::WriteFile(elsewhere, "{\"volumes\": []}");
    struct Case {
        const char* name;
        const char* link;
        bool onLoad;
        const char* message;
    };
    const Case cases[] = {
        {"registry file", "linux-host.json", true, "Cannot read registry file"},
        {"lock file", "linux-host.json.lock", false, "Cannot open lock file"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const std::string folder = dir.Path() + "/" + c.name;
        ASSERT_EQ(::mkdir(folder.c_str(), 0755), 0);
        ASSERT_EQ(::symlink(elsewhere.c_str(), (folder + "/" + c.link).c_str()), 0);
        Registry registry(folder);
        const auto message = LinuxTest::ErrorOf([&] {
            if (c.onLoad)
                registry.Load();
            else
                registry.Update([](std::vector<RegisteredVolume>&) {});
        });
        EXPECT_NE(message.find(c.message), std::string::npos) << message;
    }
    EXPECT_EQ(LinuxTest::ReadFile(elsewhere), "{\"volumes\": []}");
}

TEST(Registry, RefusesWhatIsNotARegistry)
{
    struct Case {
        const char* text;
        const char* what;
    };
    const Case cases[] = {
        {"", "parse error"},
        {"[]", "the document is not an object"},
        {"{\"volumes\": {}}", "'volumes' is not an array"},
        {"{\"volume\": []}", "unknown key 'volume'"},
        {"{\"volumes\": [{\"name\": \"a\", \"version\": \"4.0\"}]}", "'version' has the wrong type"},
        {"{\"volumes\": [{\"name\": \"a\", \"connections\": \"2\"}]}", "'connections' has the wrong type"},
        {"{\"volumes\": [{\"name\": \"../../etc\"}]}", "a volume has no usable name"},
        {"{\"volumes\": [{\"name\": \"a\", \"extra\": 1}]}", "unknown key 'extra'"},
        {"{\"volumes\": []} trailing", "parse error"},
    };
    LinuxTest::TempDir dir;
    Registry registry(dir.Path());
    for (const auto& c : cases) {
        SCOPED_TRACE(c.text);
        LinuxTest::WriteFile(dir.Path() + "/linux-host.json", c.text);
        const auto message = LinuxTest::ErrorOf([&] { registry.Load(); });
        EXPECT_EQ(message.rfind("Invalid registry file '" + dir.Path() + "/linux-host.json': ", 0), 0u) << message;
        EXPECT_NE(message.find(c.what), std::string::npos) << message;
    }
}

TEST(Registry, FolderAndVolumeNames)
{
    ::setenv("AUTOCLI_LINUX_DIR", "relative/dir", 1);
    EXPECT_THROW(Registry::DefaultFolder(), std::runtime_error);
    ::setenv("AUTOCLI_LINUX_DIR", "/srv/autocli//", 1);
    EXPECT_EQ(Registry::DefaultFolder(), "/srv/autocli");
    ::unsetenv("AUTOCLI_LINUX_DIR");
    EXPECT_EQ(Registry::DefaultFolder(), "/var/lib/autocli");

    struct Case {
        std::string name;
        bool usable;
    };
    const Case cases[] = {
        {"datastore1", true},
        {"with space", true},
        {".hidden", true},
        {"", false},
        {".", false},
        {"..", false},
        {"a/b", false},
        {std::string(255, 'x'), true},
        {std::string(256, 'x'), false},
        {std::string("a\0b", 3), false},
    };
    for (const auto& c : cases)
        EXPECT_EQ(HostLinux::IsUsableVolumeName(c.name), c.usable) << c.name.size() << ":" << c.name;
}

} // namespace

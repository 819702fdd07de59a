// The state store as its users, and other users of the machine, meet it: which file it reads
// and writes, what it refuses, and what survives failed saves, kills, hostile folders and
// many writers at once. Behaviour is checked through the session's interface and the built
// autocli.

#include <dirent.h>
#include <fcntl.h>
#include <pwd.h>
#include <signal.h>
#include <spawn.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <optional>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "host/HostSession.h"
#include "hostctl/HostCtlException.h"
#include "hostctl/StorageInfoImpl.h"
#include "support/Cli.h"
#include "support/Files.h"
#include "support/TempFolder.h"

extern char** environ;

namespace {

namespace fs = std::filesystem;
using KnxCtl::Storage::StorageInfoImpl;
using TestSupport::ReadFile;
using TestSupport::RunAutocli;
using TestSupport::WriteFile;

// A test's folder; runs without --state use the default path inside it.
class Folder : public TestSupport::TempFolder {
public:
    using TempFolder::TempFolder;
    std::vector<std::string> Env() const { return {"XDG_STATE_HOME=" + Path() + "/xdg", "AUTOCLI_STATE="}; }
};

// The tests that save hundreds of times use memory-backed /dev/shm where there is one, since
// they check what is written, not the disk.
fs::path MemoryBacked()
{
    std::error_code error;
    return fs::is_directory("/dev/shm", error) ? fs::path("/dev/shm") : fs::temp_directory_path();
}

// Every name under `root`, with a trailing "/" for folders and "@" for links.
std::vector<std::string> Tree(const std::string& root)
{
    std::vector<std::string> names;
    std::error_code error;
    for (fs::recursive_directory_iterator it(root, error), end; !error && it != end; it.increment(error)) {
        std::string name = it->path().string().substr(root.size() + 1);
        const auto status = it->symlink_status(error);
        if (fs::is_symlink(status))
            name += "@";
        else if (fs::is_directory(status))
            name += "/";
        names.push_back(name);
    }
    std::sort(names.begin(), names.end());
    return names;
}

bool HasTemporaries(const std::string& folder)
{
    for (const auto& name : Tree(folder))
        if (name.find(".tmp.") != std::string::npos)
            return true;
    return false;
}

struct stat Lstat(const std::string& path)
{
    struct stat st {};
    if (::lstat(path.c_str(), &st) != 0)
        st.st_ino = 0;
    return st;
}

std::string InitState(const Folder& folder, const std::string& name = "host.json")
{
    std::string path = folder / name;
    const auto made = RunAutocli({"--state", path, "--init-state"}, "", folder.Env());
    if (made.exitCode != 0)
        throw std::runtime_error("--init-state failed: " + made.err);
    return path;
}

std::string Quoted(const std::string& path) { return "'" + path + "'"; }

// ---- what a save leaves on disk ----------------------------------------------------------

struct ModeCase {
    const char* name;
    mode_t umask;
    std::optional<mode_t> existing; // the state file's mode before the save, if there is one
    mode_t expected;
};

void PrintTo(const ModeCase& c, std::ostream* os) { *os << c.name; }

class SaveModeTest : public ::testing::TestWithParam<ModeCase> {};

TEST_P(SaveModeTest, ReplacesTheFileByRenameWithTheRightMode)
{
    const ModeCase& c = GetParam();
    Folder folder;
    const std::string state = folder / "host.json";
    const std::string oldText = R"({"firewall": {"nfsClient": []}})";
    if (c.existing) {
        WriteFile(state, oldText);
        ::chmod(state.c_str(), *c.existing);
        ASSERT_EQ(::link(state.c_str(), (folder / "old").c_str()), 0);
    }
    const ino_t before = Lstat(state).st_ino;
    const mode_t saved = ::umask(c.umask);
    HostSim::OpenSession(state);
    StorageInfoImpl().AddNasFirewallConfig("192.0.2.1", HostCtl::Storage::NFS_VERSION_3);
    HostSim::SaveChanges();
    HostSim::CloseSession();
    ::umask(saved);

    const struct stat after = Lstat(state);
    ASSERT_TRUE(S_ISREG(after.st_mode));
    EXPECT_EQ(after.st_mode & 07777, c.expected);
    EXPECT_NE(ReadFile(state).find("192.0.2.1"), std::string::npos);
    // The lock never lets others in.
    EXPECT_EQ(Lstat(state + ".lock").st_mode & S_IRWXO, 0u);
    if (c.existing) {
        // A new file took the old one's place; the old one was never written.
        EXPECT_NE(after.st_ino, before);
        EXPECT_EQ(ReadFile(folder / "old"), oldText);
    }
    EXPECT_FALSE(HasTemporaries(folder.Path()));
}

const ModeCase kModeCases[] = {
    {"existing0640", 022, 0640, 0640},
    {"existing0600WithOpenUmask", 0, 0600, 0600},
    {"existing0664WithTightUmask", 077, 0664, 0664},
    {"newWithUmask022", 022, std::nullopt, 0644},
    {"newWithUmask077", 077, std::nullopt, 0600},
    {"newWithUmask002", 002, std::nullopt, 0664},
};

INSTANTIATE_TEST_SUITE_P(Store, SaveModeTest, ::testing::ValuesIn(kModeCases),
                         [](const auto& info) { return std::string(info.param.name); });

// A save that cannot be written (here: the file size limit) reports, keeps the old file and
// removes what it started.
TEST(StateStore, FailedSaveKeepsTheOldFile)
{
    Folder folder;
    const std::string state = InitState(folder);
    const std::string before = ReadFile(state);
    ASSERT_GT(before.size(), 2048u);
    const ino_t inode = Lstat(state).st_ino;

    // An ignored SIGXFSZ and the size limit pass to autocli; the limit is below the state's size.
    const auto run = TestSupport::RunProgram(
        {"/bin/sh", "-c",
         "trap '' XFSZ; ulimit -f 1 && exec \"$0\" --state \"$1\" storage filesystem unmount -l datastore1",
         AUTOCLI_BINARY, state});
    EXPECT_EQ(run.exitCode, 3) << run.err;
    EXPECT_NE(run.err.find("Cannot save host state file " + Quoted(state) + ": File too large\n"), std::string::npos)
        << run.err;
    EXPECT_EQ(ReadFile(state), before);
    EXPECT_EQ(Lstat(state).st_ino, inode);
    EXPECT_FALSE(HasTemporaries(folder.Path()));
}

// What killed writers leave is removed by the next save, whatever its form, and only
// names are removed: nothing a link points at.
TEST(StateStore, NextSaveRemovesLeftoversOfKilledWriters)
{
    Folder folder;
    const std::string state = InitState(folder);
    WriteFile(folder / "elsewhere", "keep");
    WriteFile(state + ".tmp.AbC123", "{half");
    fs::create_directory(state + ".tmp.Dir456");
    WriteFile(state + ".tmp.Dir456/state", "{half");
    fs::create_symlink(folder / "elsewhere", state + ".tmp.Link78");
    WriteFile(folder / "other.json.tmp.Zz", "not this state's");

    auto run = RunAutocli({"storage", "filesystem", "unmount", "-l", "datastore1"}, state);
    ASSERT_EQ(run.exitCode, 0) << run.err;
    EXPECT_EQ(Tree(folder.Path()),
              (std::vector<std::string>{"elsewhere", "host.json", "host.json.lock", "other.json.tmp.Zz"}));
    EXPECT_EQ(ReadFile(folder / "elsewhere"), "keep");
}

// ---- paths that are not a plain file --------------------------------------------------------

struct PathCase {
    const char* name;
    // Prepares the folder; returns the autocli arguments before the command.
    std::function<std::vector<std::string>(const Folder&)> setUp;
    std::vector<std::string> command;
    int exitCode;
    std::function<std::string(const Folder&)> err; // the exact standard error
};

void PrintTo(const PathCase& c, std::ostream* os) { *os << c.name; }

class StatePathTest : public ::testing::TestWithParam<PathCase> {};

TEST_P(StatePathTest, RefusedAtOnceAndNothingIsCreated)
{
    const PathCase& c = GetParam();
    Folder folder;
    WriteFile(folder / "victim", "keep");
    std::vector<std::string> args = c.setUp(folder);
    const auto before = Tree(folder.Path());
    args.insert(args.end(), c.command.begin(), c.command.end());

    const auto start = std::chrono::steady_clock::now();
    auto env = folder.Env();
    const auto run = RunAutocli(args, "", env);
    const auto took = std::chrono::steady_clock::now() - start;

    EXPECT_EQ(run.exitCode, c.exitCode) << run.err;
    EXPECT_EQ(run.err, c.err(folder));
    EXPECT_EQ(run.out, "");
    EXPECT_LT(took, std::chrono::seconds(3)); // nothing waits on a pipe or a lock
    EXPECT_EQ(Tree(folder.Path()), before);
    EXPECT_EQ(ReadFile(folder / "victim"), "keep");
}

const std::vector<std::string> kList{"storage", "filesystem", "list"};
const std::vector<std::string> kChange{"storage", "filesystem", "unmount", "-l", "datastore1"};

std::vector<std::string> StateArgs(const std::string& path) { return {"--state", path}; }

// A state whose lock file `replace` has swapped for something else: a change is refused, as
// `why` says, before anything is touched.
PathCase LockReplacedCase(const char* name, void (*replace)(const fs::path& lock), const char* why)
{
    return {
        name,
        [replace](const Folder& f) {
            InitState(f);
            fs::remove(f / "host.json.lock");
            replace(f / "host.json.lock");
            return StateArgs(f / "host.json");
        },
        kChange, 3,
        [why](const Folder& f) { return "Lock file " + Quoted(f / "host.json.lock") + " " + why + "; remove it\n"; }};
}

const PathCase kPathCases[] = {
    {"fifo",
     [](const Folder& f) {
         ::mkfifo((f / "host.json").c_str(), 0600);
         return StateArgs(f / "host.json");
     },
     kList, 3,
     [](const Folder& f) { return "Host state file " + Quoted(f / "host.json") + " is not a regular file\n"; }},
    {"folder",
     [](const Folder& f) {
         fs::create_directory(f / "host.json");
         return StateArgs(f / "host.json");
     },
     kList, 3,
     [](const Folder& f) { return "Host state file " + Quoted(f / "host.json") + " is not a regular file\n"; }},
    {"symlinkLoop",
     [](const Folder& f) {
         fs::create_symlink(f / "b.json", f / "a.json");
         fs::create_symlink(f / "a.json", f / "b.json");
         return StateArgs(f / "a.json");
     },
     kList, 3,
     [](const Folder& f) {
         return "Cannot use host state file " + Quoted(f / "a.json") + ": Too many levels of symbolic links\n";
     }},
    {"componentNotAFolder", [](const Folder& f) { return StateArgs(f / "victim/host.json"); }, kList, 3,
     [](const Folder& f) {
         return "Cannot use host state file " + Quoted(f / "victim/host.json") + ": Not a directory\n";
     }},
    // The default path too: a path that cannot be examined is never the demo host.
    {"defaultPathInALoop",
     [](const Folder& f) {
         fs::create_symlink(f / "xdg", f / "xdg");
         return std::vector<std::string>{};
     },
     kChange, 3,
     [](const Folder& f) {
         return "Cannot use host state file " + Quoted(f / "xdg/autocli/host.json") +
                ": Too many levels of symbolic links\n";
     }},
    LockReplacedCase(
        "lockIsALink", [](const fs::path& lock) { fs::create_symlink(lock.parent_path() / "created-by-root", lock); },
        "is a symbolic link"),
    LockReplacedCase(
        "lockIsAFifo", [](const fs::path& lock) { ::mkfifo(lock.c_str(), 0600); }, "is not a regular file"),
    {"namedFileMissing", [](const Folder& f) { return StateArgs(f / "nope/host.json"); }, kChange, 2,
     [](const Folder& f) {
         return "State file " + Quoted(f / "nope/host.json") +
                " does not exist. Create it from the demo host with: autocli --state " + Quoted(f / "nope/host.json") +
                " --init-state\n";
     }},
    {"relativeNameMissing", [](const Folder&) { return StateArgs("it's.json"); }, kChange, 2,
     [](const Folder&) {
         return std::string("State file 'it's.json' does not exist. Create it from the demo host with: autocli "
                            "--state 'it'\\''s.json' --init-state\n");
     }},
    {"initOverDanglingLink",
     [](const Folder& f) {
         fs::create_symlink(f / "created-by-root", f / "host.json");
         return std::vector<std::string>{"--state", f / "host.json", "--init-state"};
     },
     {},
     1,
     [](const Folder& f) {
         return "Host state file " + Quoted(f / "host.json") + " already exists; --init-state leaves it as it is.\n";
     }},
};

INSTANTIATE_TEST_SUITE_P(Store, StatePathTest, ::testing::ValuesIn(kPathCases),
                         [](const auto& info) { return std::string(info.param.name); });

std::optional<passwd> Nobody();

// A folder another user may not enter hides whether a file is there: that is an error for
// that user, not the demo host.
TEST(StateStore, UnreadableFolderIsNotTheDemoHost)
{
    const auto nobody = Nobody();
    if (::geteuid() != 0 || !nobody)
        GTEST_SKIP() << "needs root and a 'nobody' user to act as the other user";
    Folder folder;
    fs::create_directory(folder / "private");
    ::chmod((folder / "private").c_str(), 0700);
    const std::string state = folder / "private/host.json";
    const pid_t child = ::fork();
    if (child == 0) {
        if (::setgid(nobody->pw_gid) != 0 || ::setuid(nobody->pw_uid) != 0)
            ::_exit(1);
        try {
            HostSim::OpenSession(state);
        } catch (const std::runtime_error& e) {
            ::_exit(std::string(e.what()) == "Cannot use host state file '" + state + "': Permission denied" ? 0 : 2);
        }
        ::_exit(3);
    }
    int status = 0;
    ::waitpid(child, &status, 0);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << "status " << status;
}

TEST(StateStore, NamedStateFromTheEnvironmentMustExistToo)
{
    Folder folder;
    const auto run =
        RunAutocli(kChange, "", {"XDG_STATE_HOME=" + (folder / "xdg"), "AUTOCLI_STATE=" + (folder / "host.json")});
    EXPECT_EQ(run.exitCode, 2);
    EXPECT_EQ(run.err.rfind("State file " + Quoted(folder / "host.json") + " does not exist.", 0), 0u) << run.err;
    EXPECT_EQ(Tree(folder.Path()), std::vector<std::string>{});
}

// Runs on the demo host that change nothing leave no file and no folder behind.
TEST(StateStore, OnlyAChangeWritesTheDemoHost)
{
    Folder folder;
    const std::vector<std::vector<std::string>> quiet{
        {"--help"},
        {"--version"},
        {"storage", "filesystem", "nope"},
        kList,
        {"--dump-state"},
        {"storage", "filesystem", "list", "--formatter"},
        {"--dry-run", "storage", "filesystem", "unmount", "-a"},
    };
    for (const auto& args : quiet) {
        const auto run = RunAutocli(args, "", folder.Env());
        EXPECT_NE(run.exitCode, 3) << run.err;
        EXPECT_EQ(Tree(folder.Path()), std::vector<std::string>{}) << args.back();
    }
    const auto change = RunAutocli(kChange, "", folder.Env());
    EXPECT_EQ(change.exitCode, 0) << change.err;
    EXPECT_EQ(Tree(folder.Path()), (std::vector<std::string>{"xdg/", "xdg/autocli/", "xdg/autocli/host.json",
                                                             "xdg/autocli/host.json.lock"}));
    EXPECT_EQ((Lstat(folder / "xdg/autocli").st_mode & 0777), 0700u);
}

// Two commands that both started from the demo host: the first to save writes the file; the
// second must not overwrite it with changes made on a host that no longer is the state.
TEST(StateStore, SecondFirstSaveOfTheDemoHostIsRefused)
{
    Folder folder;
    const std::string state = folder / "xdg/autocli/host.json";
    int opened[2], saved[2];
    ASSERT_EQ(::pipe(opened), 0);
    ASSERT_EQ(::pipe(saved), 0);
    const pid_t child = ::fork();
    if (child == 0) {
        char byte = 0;
        HostSim::OpenSession(state);
        (void)!::write(opened[1], &byte, 1);
        (void)!::read(saved[0], &byte, 1); // the parent has saved
        StorageInfoImpl().AddNasFirewallConfig("192.0.2.2", HostCtl::Storage::NFS_VERSION_3);
        try {
            HostSim::SaveChanges();
        } catch (const std::runtime_error& e) {
            const std::string expected = "Cannot save host state file '" + state +
                                         "': another process created it while this command ran; run the command again";
            ::_exit(e.what() == expected ? 0 : 2);
        }
        ::_exit(1);
    }
    char byte = 0;
    ASSERT_EQ(::read(opened[0], &byte, 1), 1); // both sessions are on the demo host now
    HostSim::OpenSession(state);
    StorageInfoImpl().AddNasFirewallConfig("192.0.2.1", HostCtl::Storage::NFS_VERSION_3);
    HostSim::SaveChanges();
    HostSim::CloseSession(); // lets the other one have the lock
    ASSERT_EQ(::write(saved[1], &byte, 1), 1);
    int status = 0;
    ::waitpid(child, &status, 0);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << "status " << status;
    const std::string text = ReadFile(state);
    EXPECT_NE(text.find("192.0.2.1"), std::string::npos);
    EXPECT_EQ(text.find("192.0.2.2"), std::string::npos);
    for (int fd : {opened[0], opened[1], saved[0], saved[1]})
        ::close(fd);
}

TEST(StateStore, InitStateWritesTheDemoHostOnce)
{
    Folder folder;
    const std::string state = folder / "new/folders/host.json";
    auto made = RunAutocli({"--state", state, "--init-state"}, "", folder.Env());
    EXPECT_EQ(made.exitCode, 0) << made.err;
    EXPECT_EQ(made.out, "Created host state file " + Quoted(state) + " from the demo host.\n");
    const auto demo = RunAutocli({"--dump-state"}, "", folder.Env());
    EXPECT_EQ(ReadFile(state), demo.out);

    RunAutocli({"storage", "filesystem", "unmount", "-l", "datastore1"}, state);
    const std::string changed = ReadFile(state);
    auto again = RunAutocli({"--state", state, "--init-state"}, "", folder.Env());
    EXPECT_EQ(again.exitCode, 1);
    EXPECT_EQ(again.err, "Host state file " + Quoted(state) + " already exists; --init-state leaves it as it is.\n");
    EXPECT_EQ(ReadFile(state), changed);
}

// A symlinked state stays a link: the target changes, and both names share one lock.
TEST(StateStore, SymlinkedStateIsFollowedOnce)
{
    Folder folder;
    fs::create_directory(folder / "real");
    const std::string target = InitState(folder, "real/host.json");
    fs::create_symlink(target, folder / "link.json");

    const auto run = RunAutocli(kChange, folder / "link.json");
    ASSERT_EQ(run.exitCode, 0) << run.err;
    EXPECT_TRUE(S_ISLNK(Lstat(folder / "link.json").st_mode));
    EXPECT_NE(ReadFile(target).find("\"mounted\": false"), std::string::npos);
    EXPECT_FALSE(fs::exists(fs::symlink_status(folder / "link.json.lock")));

    // One name's lock holds the other name's writers, as long as AUTOCLI_LOCK_TIMEOUT says.
    const int lock = ::open((target + ".lock").c_str(), O_RDONLY);
    ASSERT_GE(lock, 0);
    ASSERT_EQ(::flock(lock, LOCK_EX), 0);
    const auto start = std::chrono::steady_clock::now();
    const auto blocked = RunAutocli(kList, folder / "link.json", {"AUTOCLI_LOCK_TIMEOUT=0.5"});
    const auto took = std::chrono::steady_clock::now() - start;
    const auto badTimeout = RunAutocli(kList, target, {"AUTOCLI_LOCK_TIMEOUT=soon"});
    ::close(lock);
    EXPECT_EQ(blocked.exitCode, 3);
    EXPECT_EQ(blocked.err, "Host state file " + Quoted(folder / "link.json") +
                               " is in use by another process (waited 0.5 seconds for lock file " +
                               Quoted(target + ".lock") + ")\n");
    EXPECT_GE(took, std::chrono::milliseconds(500));
    EXPECT_LT(took, std::chrono::seconds(3));
    EXPECT_EQ(badTimeout.err, "Invalid AUTOCLI_LOCK_TIMEOUT 'soon': expected a number of seconds\n");
    EXPECT_EQ(RunAutocli(kList, target).exitCode, 0);
}

TEST(StateStore, JournalIsNeverFollowedThroughALink)
{
    Folder folder;
    const std::string state = InitState(folder);
    WriteFile(folder / "victim", "keep");
    fs::create_symlink(folder / "victim", folder / "journal");
    const auto run = RunAutocli(kChange, state, {"AUTOCLI_JOURNAL=" + (folder / "journal")});
    EXPECT_EQ(run.exitCode, 0);
    EXPECT_EQ(run.err, "Cannot write the call journal " + Quoted(folder / "journal") + ": it is a symbolic link\n");
    EXPECT_EQ(ReadFile(folder / "victim"), "keep");
    EXPECT_NE(ReadFile(state).find("\"mounted\": false"), std::string::npos); // the command itself ran
}

// ---- a dry run against the real thing --------------------------------------------------------

struct DryRunCase {
    const char* name;
    std::vector<std::string> command;
    bool changes; // a real run changes the state
};

void PrintTo(const DryRunCase& c, std::ostream* os) { *os << c.name; }

class DryRunTest : public ::testing::TestWithParam<DryRunCase> {};

TEST_P(DryRunTest, ListsTheCallsARealRunJournalsAndSavesNothing)
{
    Folder folder;
    const std::string real = InitState(folder, "real.json");
    const std::string dry = InitState(folder, "dry.json");
    const auto realRun = RunAutocli(GetParam().command, real, {"AUTOCLI_JOURNAL=" + (folder / "real.jsonl")});

    const std::string before = ReadFile(dry);
    const ino_t inode = Lstat(dry).st_ino;
    std::vector<std::string> args{"--dry-run"};
    args.insert(args.end(), GetParam().command.begin(), GetParam().command.end());
    const auto dryRun = RunAutocli(args, dry, {"AUTOCLI_JOURNAL=" + (folder / "dry.jsonl")});

    EXPECT_EQ(dryRun.exitCode, realRun.exitCode);
    EXPECT_EQ(dryRun.out, realRun.out);
    EXPECT_EQ(dryRun.err, realRun.err + "Dry run: nothing was saved.\n" + ReadFile(folder / "real.jsonl"));
    EXPECT_EQ(ReadFile(dry), before);
    EXPECT_EQ(Lstat(dry).st_ino, inode);
    EXPECT_FALSE(fs::exists(folder / "dry.jsonl"));
    EXPECT_FALSE(HasTemporaries(folder.Path()));
    EXPECT_EQ(ReadFile(real) != before, GetParam().changes);
}

const DryRunCase kDryRunCases[] = {
    {"unmountRunsTheNotifyScript", {"storage", "filesystem", "unmount", "-l", "datastore1"}, true},
    {"unmountEverything", {"storage", "filesystem", "unmount", "-a"}, true},
    {"removeNfsVolume", {"storage", "nfs", "remove", "-v", "nfs-iso"}, true},
    {"failingCommand", {"storage", "nfs", "remove", "-v", "no-such-volume"}, false},
};

INSTANTIATE_TEST_SUITE_P(Store, DryRunTest, ::testing::ValuesIn(kDryRunCases),
                         [](const auto& info) { return std::string(info.param.name); });

// ---- kills, hostile folders and many writers -------------------------------------------------

std::string ManyVolumes(int count)
{
    nlohmann::json volumes = nlohmann::json::array();
    for (int i = 0; i < count; ++i)
        volumes.push_back({{"type", "HLFS"}, {"volumeName", "v" + std::to_string(i)}});
    return nlohmann::json{{"fileSystems", volumes}}.dump();
}

pid_t Spawn(const std::vector<std::string>& args)
{
    std::vector<char*> argv;
    for (const auto& arg : args)
        argv.push_back(const_cast<char*>(arg.c_str()));
    argv.push_back(nullptr);
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
    posix_spawn_file_actions_addopen(&actions, STDERR_FILENO, "/dev/null", O_WRONLY, 0);
    pid_t pid = -1;
    posix_spawn(&pid, argv[0], &actions, nullptr, argv.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    return pid;
}

// `unmount -a` changes every volume; a kill at any moment leaves all of them or none changed.
TEST(StateStore, KilledCommandLeavesTheOldOrTheNewState)
{
    constexpr int kVolumes = 3000;
    Folder folder;
    const std::string original = ManyVolumes(kVolumes);
    const std::string state = folder / "host.json";
    const std::vector<std::string> command{AUTOCLI_BINARY, "--state", state, "storage", "filesystem", "unmount", "-a"};

    WriteFile(state, original);
    auto start = std::chrono::steady_clock::now();
    int status = 0;
    ::waitpid(Spawn(command), &status, 0);
    const auto full = std::chrono::steady_clock::now() - start;
    ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);

    int unchanged = 0, complete = 0;
    for (int step = 1; step <= 8; ++step) {
        WriteFile(state, original);
        const pid_t pid = Spawn(command);
        std::this_thread::sleep_for(full * step / 9);
        ::kill(pid, SIGKILL);
        ::waitpid(pid, &status, 0);
        const auto saved = nlohmann::json::parse(ReadFile(state));
        int unmounted = 0;
        for (const auto& volume : saved["fileSystems"])
            unmounted += volume.value("mounted", true) ? 0 : 1;
        EXPECT_TRUE(unmounted == 0 || unmounted == kVolumes) << "after a kill at " << step << "/9: " << unmounted;
        (unmounted == 0 ? unchanged : complete) += 1;
    }
    EXPECT_GT(unchanged, 0);
    // The next change clears whatever a kill during a save left.
    WriteFile(state, original);
    ASSERT_EQ(RunAutocli({"storage", "filesystem", "unmount", "-a"}, state).exitCode, 0);
    EXPECT_FALSE(HasTemporaries(folder.Path()));
}

std::optional<passwd> Nobody()
{
    const passwd* pw = ::getpwnam("nobody");
    if (!pw || pw->pw_uid == 0)
        return std::nullopt;
    return *pw;
}

// Another user who owns the state's folder swaps every temporary name it sees for a link to
// a root-only file. No save may write through such a link or rename it into the state's place.
TEST(StateStore, SavesInAFolderOthersControlWriteOnlyTheirOwnFile)
{
    const auto nobody = Nobody();
    if (::geteuid() != 0 || !nobody)
        GTEST_SKIP() << "needs root and a 'nobody' user to act as the other user";
    Folder folder(MemoryBacked());
    fs::create_directory(folder / "secret");
    ::chmod((folder / "secret").c_str(), 0700);
    const std::string victim = folder / "secret/shadow";
    WriteFile(victim, "root only");
    ::chmod(victim.c_str(), 0600);
    const std::string shared = folder / "shared";
    fs::create_directory(shared);
    ASSERT_EQ(::chown(shared.c_str(), nobody->pw_uid, nobody->pw_gid), 0);
    const std::string state = shared + "/host.json";
    // Large enough that each save takes a while, so the other user sees its temporary files.
    auto text = nlohmann::json::parse(ManyVolumes(500));
    text["firewall"]["nfsClient"] = nlohmann::json::array();
    WriteFile(state, text.dump());
    ::chmod(state.c_str(), 0600);

    int seen[2];
    ASSERT_EQ(::pipe2(seen, O_NONBLOCK), 0);
    const pid_t attacker = ::fork();
    if (attacker == 0) {
        if (::setgid(nobody->pw_gid) != 0 || ::setuid(nobody->pw_uid) != 0)
            ::_exit(1);
        (void)!::write(seen[1], "r", 1);
        const std::string link = shared + "/.link";
        for (long round = 0;; ++round) {
            DIR* dir = ::opendir(shared.c_str());
            if (!dir)
                ::_exit(1);
            std::vector<std::string> names;
            while (const dirent* entry = ::readdir(dir))
                if (std::string(entry->d_name).find(".tmp.") != std::string::npos)
                    names.push_back(entry->d_name);
            ::closedir(dir);
            for (const auto& name : names) {
                (void)!::write(seen[1], "s", 1);
                const std::string path = shared + "/" + name;
                // Replace the name in one step where the kernel allows it, else move it away.
                ::unlink(link.c_str());
                if (::symlink(victim.c_str(), link.c_str()) == 0 && ::rename(link.c_str(), path.c_str()) != 0) {
                    ::rename(path.c_str(), (path + ".moved" + std::to_string(round)).c_str());
                    ::symlink(victim.c_str(), path.c_str());
                }
                // And inside what it may have opened, try the same.
                ::symlink(victim.c_str(), (path + "/state").c_str());
            }
        }
    }

    ::close(seen[1]);
    char ready = 0;
    while (::read(seen[0], &ready, 1) != 1)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    int overwritten = 0, replaced = 0, failed = 0;
    for (int i = 0; i < 300; ++i) {
        try {
            HostSim::OpenSession(state);
            StorageInfoImpl info;
            if (i % 2 == 0)
                info.AddNasFirewallConfig("10.0.0.1", HostCtl::Storage::NFS_VERSION_3);
            else
                info.RemoveNasFirewallConfig("10.0.0.1", HostCtl::Storage::NFS_VERSION_3);
            HostSim::SaveChanges();
        } catch (const std::exception&) {
            ++failed;
        }
        HostSim::CloseSession();
        overwritten += ReadFile(victim) != "root only" ? 1 : 0;
        replaced += S_ISREG(Lstat(state).st_mode) ? 0 : 1;
        if (replaced || overwritten)
            break;
    }
    ::kill(attacker, SIGKILL);
    ::waitpid(attacker, nullptr, 0);
    long swaps = 0;
    for (char byte; ::read(seen[0], &byte, 1) == 1;)
        ++swaps;
    ::close(seen[0]);
    EXPECT_GT(swaps, 0) << "the other user never met a temporary file, so nothing was tried";
    EXPECT_EQ(overwritten, 0);
    EXPECT_EQ(replaced, 0);
    EXPECT_EQ(failed, 0);
    EXPECT_EQ(Lstat(state).st_mode & 07777, 0600u);
    EXPECT_FALSE(nlohmann::json::parse(ReadFile(state), nullptr, false).is_discarded());
}

// Many processes adding rules at once, each in several sessions: every rule arrives, and a
// reader never sees a torn file.
TEST(StateStore, ParallelWritersLoseNothing)
{
    constexpr int kWriters = 50;
    constexpr int kRounds = 20;
    Folder folder(MemoryBacked());
    const std::string state = folder / "host.json";
    WriteFile(state, R"({"firewall": {"nfsClient": []}})");
    int go[2];
    ASSERT_EQ(::pipe(go), 0);
    std::vector<pid_t> writers;
    for (int w = 0; w < kWriters; ++w) {
        const pid_t pid = ::fork();
        if (pid == 0) {
            ::close(go[1]);
            char byte;
            (void)!::read(go[0], &byte, 1); // all start together when the parent closes its end
            int failures = 0;
            for (int r = 0; r < kRounds; ++r) {
                try {
                    HostSim::OpenSession(state);
                    StorageInfoImpl().AddNasFirewallConfig("10." + std::to_string(w) + ".0." + std::to_string(r),
                                                           HostCtl::Storage::NFS_VERSION_3);
                    HostSim::SaveChanges();
                } catch (...) {
                    ++failures;
                }
                HostSim::CloseSession();
            }
            ::_exit(failures == 0 ? 0 : 1);
        }
        writers.push_back(pid);
    }
    ::close(go[0]);
    ::close(go[1]);

    int torn = 0, reads = 0;
    std::vector<int> statuses;
    while (true) {
        const auto parsed = nlohmann::json::parse(ReadFile(state), nullptr, false);
        torn += parsed.is_discarded() ? 1 : 0;
        ++reads;
        bool all = true;
        for (auto& pid : writers) {
            if (pid <= 0)
                continue;
            int status = 0;
            const pid_t done = ::waitpid(pid, &status, WNOHANG);
            if (done == 0) {
                all = false;
                continue;
            }
            statuses.push_back(status);
            pid = -1;
        }
        if (all)
            break;
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
    for (int status : statuses)
        EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
    EXPECT_EQ(torn, 0) << "of " << reads << " reads";
    const auto saved = nlohmann::json::parse(ReadFile(state));
    std::vector<std::string> rules = saved["firewall"]["nfsClient"];
    std::sort(rules.begin(), rules.end());
    EXPECT_EQ(rules.size(), static_cast<std::size_t>(kWriters * kRounds));
    EXPECT_EQ(std::unique(rules.begin(), rules.end()), rules.end());
    EXPECT_FALSE(HasTemporaries(folder.Path()));
}

} // namespace

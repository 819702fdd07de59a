// Where autocli takes code from. It runs as root, so a plug-in that someone else could have
// changed, or a library that is not a plug-in, is skipped with a warning naming it, and the
// others still load.

#include <pwd.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <functional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/Cli.h"
#include "support/TempFolder.h"

namespace {

namespace fs = std::filesystem;
using TestSupport::RunAutocli;

using Folder = TestSupport::TempFolder;

// A shared library that is no storage plug-in: the one the simulated host is built into
// would register nothing either, but a plain system library is the likelier stray file.
std::string StrayLibrary()
{
    for (const char* candidate : {"/usr/lib/x86_64-linux-gnu/libz.so.1", "/lib/x86_64-linux-gnu/libz.so.1",
                                  "/usr/lib/aarch64-linux-gnu/libz.so.1", "/usr/lib/libz.so.1"})
        if (fs::exists(candidate))
            return candidate;
    return {};
}

void Plugin(const std::string& path, mode_t mode = 0644)
{
    fs::create_directories(fs::path(path).parent_path());
    fs::copy_file(STORAGECLI_PLUGIN, path, fs::copy_options::overwrite_existing);
    ::chmod(path.c_str(), mode);
}

uid_t NobodyUid()
{
    const passwd* pw = ::getpwnam("nobody");
    return pw ? pw->pw_uid : 65534;
}

struct LoadCase {
    const char* name;
    // Prepares the folder; returns the value of AUTOCLI_PLUGIN_PATH.
    std::function<std::string(const Folder&)> setUp;
    int exitCode;
    bool listed; // the command ran and printed its table
    std::function<std::string(const Folder&)> err;
};

void PrintTo(const LoadCase& c, std::ostream* os) { *os << c.name; }

class PluginLoadingTest : public ::testing::TestWithParam<LoadCase> {};

TEST_P(PluginLoadingTest, UntrustedOrStrayLibrariesAreSkipped)
{
    const LoadCase& c = GetParam();
    if (::geteuid() != 0)
        GTEST_SKIP() << "needs root to give files to another user";
    if (StrayLibrary().empty())
        GTEST_SKIP() << "no plain shared library found to stand for a stray file";
    Folder folder;
    const std::string plugins = c.setUp(folder);
    const auto run =
        RunAutocli({"storage", "filesystem", "list"}, "",
                   {"AUTOCLI_PLUGIN_PATH=" + plugins, "XDG_STATE_HOME=" + (folder / "xdg"), "AUTOCLI_STATE="});
    EXPECT_EQ(run.exitCode, c.exitCode) << run.err;
    EXPECT_EQ(run.out.find("datastore1") != std::string::npos, c.listed) << run.out;
    EXPECT_EQ(run.err, c.err(folder));
}

const std::string kWritable = "it can be written by users other than its owner";

// What autocli says last when no plug-in in `folder` was loaded.
std::string NothingLoaded(const std::string& folder) { return "No plug-in could be loaded from '" + folder + "'.\n"; }

// A plug-in in `folder` (under the test's folder) where `open`, that folder or one above it,
// has `mode`, writable by others: the whole folder is refused.
LoadCase OpenFolderCase(const char* name, const std::string& folder, const std::string& open, mode_t mode)
{
    return {name,
            [=](const Folder& f) {
                Plugin(f / (folder + "/a.so"));
                ::chmod((f / open).c_str(), mode);
                return f / folder;
            },
            3, false,
            [=](const Folder& f) {
                return "Skipping the plug-in folder '" + (f / folder) + "': '" + (f / open) + "': " + kWritable +
                       ".\n" + NothingLoaded(f / folder);
            }};
}

const LoadCase kLoadCases[] = {
    {"relativeFolder", [](const Folder&) { return std::string("lib/autocli/plugins"); }, 2, false,
     [](const Folder&) {
         return std::string("AUTOCLI_PLUGIN_PATH must name an absolute folder, not 'lib/autocli/plugins'.\n");
     }},
    {"strayLibraryBesideThePlugin",
     [](const Folder& f) {
         Plugin(f / "p/storage.so");
         fs::copy_file(StrayLibrary(), f / "p/notes.so");
         return f / "p";
     },
     0, true,
     [](const Folder& f) {
         return "Skipping '" + (f / "p/notes.so") +
                "': it is not a storage plug-in (it exports no registration function).\n";
     }},
    {"worldWritablePlugin",
     [](const Folder& f) {
         Plugin(f / "p/a.so", 0666);
         Plugin(f / "p/b.so");
         return f / "p";
     },
     0, true, [](const Folder& f) { return "Skipping plug-in '" + (f / "p/a.so") + "': " + kWritable + ".\n"; }},
    {"anotherUsersPlugin",
     [](const Folder& f) {
         Plugin(f / "p/a.so");
         ::chown((f / "p/a.so").c_str(), NobodyUid(), 0);
         return f / "p";
     },
     3, false,
     [](const Folder& f) {
         return "Skipping plug-in '" + (f / "p/a.so") + "': it is owned by user " + std::to_string(NobodyUid()) +
                ", neither root nor the caller.\n" + NothingLoaded(f / "p");
     }},
    OpenFolderCase("groupWritableFolder", "p", "p", 0775),
    OpenFolderCase("worldWritableFolderAbove", "open/p", "open", 0777),
    {"linkIntoAnOpenFolder",
     [](const Folder& f) {
         Plugin(f / "open/a.so");
         ::chmod((f / "open").c_str(), 0777);
         fs::create_directories(f / "p");
         fs::create_symlink(f / "open/a.so", f / "p/a.so");
         Plugin(f / "p/b.so");
         return f / "p";
     },
     0, true,
     [](const Folder& f) {
         return "Skipping plug-in '" + (f / "p/a.so") + "': '" + (f / "open") + "': " + kWritable + ".\n";
     }},
};

INSTANTIATE_TEST_SUITE_P(Loading, PluginLoadingTest, ::testing::ValuesIn(kLoadCases),
                         [](const auto& info) { return std::string(info.param.name); });

// Without /proc and started by a relative name, autocli cannot know where it lives: it
// refuses rather than look in the current folder, where anyone's files may be.
TEST(PluginFolder, NeverTheCurrentFolder)
{
#if defined(__SANITIZE_ADDRESS__)
    GTEST_SKIP() << "the address sanitizer's runtime itself needs /proc";
#endif
    if (::geteuid() != 0 || !fs::exists("/usr/bin/unshare"))
        GTEST_SKIP() << "needs root and unshare for a private mount namespace without /proc";
    Folder folder;
    Plugin(folder / "lib/autocli/plugins/a.so");
    fs::copy_file(AUTOCLI_BINARY, folder / "autocli");
    const std::string libraries = fs::path(STORAGECLI_PLUGIN).parent_path().parent_path().parent_path().string();
    // A clean environment: no AUTOCLI_PLUGIN_PATH, no state from the caller.
    const std::string script = "mount -t tmpfs none /proc || exit 99; cd \"$1\" && exec env -i PATH=/usr/bin:/bin "
                               "LD_LIBRARY_PATH=\"$2\" XDG_STATE_HOME=\"$1xdg\" ./autocli storage filesystem list";
    const auto run = TestSupport::RunProgram(
        {"/usr/bin/unshare", "-m", "--propagation", "private", "/bin/sh", "-c", script, "sh", folder / "", libraries});
    if (run.exitCode == 99)
        GTEST_SKIP() << "cannot mount in a private namespace here";
    EXPECT_EQ(run.exitCode, 3);
    EXPECT_EQ(run.err.substr(0, run.err.find('\n')),
              "Cannot find the plug-in folder: the path of the running program is not known "
              "(set AUTOCLI_PLUGIN_PATH to an absolute folder).");
    EXPECT_EQ(run.out, "");
}

} // namespace

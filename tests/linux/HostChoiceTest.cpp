// Choosing the host: --host and AUTOCLI_HOST, the options that belong to the simulated host
// only, and what the Linux host answers where Linux has no equivalent.

#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "LinuxTestSupport.h"

namespace {

struct ChoiceCase {
    const char* name;
    std::vector<std::string> args;
    std::vector<std::string> env;
    int exitCode;
    const char* err; // a part of standard error ("" for none expected)
};

TEST(HostChoice, UsageErrorsAndChoices)
{
    LinuxTest::TempDir dir;
    const std::string state = dir.Path() + "/host.json";
    LinuxTest::WriteFile(state, "{}");
    const std::string linuxDir = "AUTOCLI_LINUX_DIR=" + dir.Path() + "/linux";
    const ChoiceCase cases[] = {
        {"unknown name",
         {"--host", "vm", "storage", "filesystem", "list"},
         {},
         2,
         "Unknown host 'vm': use sim or linux."},
        {"no value", {"--host"}, {}, 2, "Option '--host' needs a value."},
        {"twice",
         {"--host", "linux", "--host", "sim", "storage", "filesystem", "list"},
         {},
         2,
         "Option '--host' given more than once."},
        {"after the path",
         {"storage", "--host", "linux", "filesystem", "list"},
         {},
         2,
         "Option '--host' must come before the command path."},
        {"with --state",
         {"--host", "linux", "--state", state, "storage", "filesystem", "list"},
         {},
         2,
         "Option '--state' cannot be used with the Linux host."},
        {"with --dump-state",
         {"--host", "linux", "--dump-state"},
         {},
         2,
         "Option '--dump-state' cannot be used with the Linux host."},
        {"variable with --state",
         {"--state", state, "storage", "filesystem", "list"},
         {"AUTOCLI_HOST=linux"},
         2,
         "Option '--state' cannot be used with the Linux host."},
        {"unknown variable",
         {"storage", "filesystem", "list"},
         {"AUTOCLI_HOST=xen"},
         2,
         "Unknown host 'xen' in AUTOCLI_HOST"},
        {"option wins over variable",
         {"--host", "sim", "--state", state, "storage", "filesystem", "list"},
         {"AUTOCLI_HOST=linux"},
         0,
         ""},
        {"variable chooses linux", {"storage", "hlfs", "extent", "list"}, {"AUTOCLI_HOST=linux", linuxDir}, 0, ""},
        {"empty variable is sim", {"--state", state, "storage", "filesystem", "list"}, {"AUTOCLI_HOST="}, 0, ""},
        {"version needs no host", {"--version"}, {"AUTOCLI_HOST=xen"}, 0, ""},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const auto ran = LinuxTest::Autocli(c.args, c.env);
        EXPECT_EQ(ran.exitCode, c.exitCode) << ran.out << ran.err;
        if (*c.err) {
            EXPECT_NE(ran.err.find(c.err), std::string::npos) << ran.err;
        } else {
            EXPECT_EQ(ran.err, "");
        }
    }
}

struct AnswerCase {
    const char* name;
    std::vector<std::string> args;
    int exitCode;
    const char* out; // exact standard output ("" to skip the check)
    const char* err; // a part of standard error ("" for none expected)
};

// What Linux has no equivalent for: empty HLFS lists, "not found" for HLFS look-ups, and
// "not available" for operations. None of these reads or changes anything on the machine.
TEST(HostChoice, LinuxAnswersWhereItHasNoEquivalent)
{
    LinuxTest::TempDir dir;
    const std::vector<std::string> env{"AUTOCLI_LINUX_DIR=" + dir.Path() + "/linux"};
    const AnswerCase cases[] = {
        {"extent list", {"storage", "hlfs", "extent", "list"}, 0, "[]\n", ""},
        {"snapshot list", {"storage", "hlfs", "snapshot", "list"}, 0, "[]\n", ""},
        {"lock mode list", {"storage", "hlfs", "lockmode", "list"}, 0, "[]\n", ""},
        {"host list",
         {"storage", "hlfs", "host", "list", "-l", "ds1"},
         1,
         "",
         "HLFS volume with label ds1 could not be found."},
        {"upgrade", {"storage", "hlfs", "upgrade", "-l", "ds1"}, 1, "", "Cannot find HLFS volume with label ds1"},
        {"snapshot mount",
         {"storage", "hlfs", "snapshot", "mount", "-l", "ds1"},
         1,
         "",
         "No unresolved HLFS snapshots with volume label 'ds1' found."},
        {"pointer block cache",
         {"storage", "hlfs", "pbcache", "reset"},
         1,
         "",
         "StorageInfo.GetPointerBlockCache is not available on a Linux host"},
        {"heap statistics",
         {"storage", "hlfs", "pbcache", "get"},
         1,
         "",
         "MemoryInfo.GetHeapStats is not available on a Linux host"},
        {"rescan", {"storage", "filesystem", "rescan"}, 0, "true\n", ""},
        {"automount with nothing registered", {"storage", "filesystem", "automount"}, 0, "true\n", ""},
        {"unmount all HLFS", {"storage", "filesystem", "unmount", "-a"}, 0, "true\n", ""},
        {"mount unknown",
         {"storage", "filesystem", "mount", "-l", "nothing"},
         1,
         "",
         "No volume with label 'nothing' was found"},
        {"parameters of an unknown volume", {"storage", "nfs", "param", "get", "-v", "nothing"}, 0, "[]\n", ""},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        std::vector<std::string> args{"--host", "linux", "--formatter", "json"};
        args.insert(args.end(), c.args.begin(), c.args.end());
        const auto ran = LinuxTest::Autocli(args, env);
        EXPECT_EQ(ran.exitCode, c.exitCode) << ran.out << ran.err;
        if (*c.out) {
            EXPECT_EQ(ran.out, c.out);
        }
        if (*c.err) {
            EXPECT_NE(ran.err.find(c.err), std::string::npos) << ran.err;
        }
    }
}

// Feature switches on Linux: connections (103) on; the knxnic bindings (102, 104) and NAS
// pre-unmount (270) off, which decides which parameters and commands exist.
TEST(HostChoice, FeatureSwitchesOnLinux)
{
    LinuxTest::TempDir dir;
    const std::vector<std::string> env{"AUTOCLI_LINUX_DIR=" + dir.Path()};
    const auto add = LinuxTest::Autocli({"--host", "linux", "storage", "nfs", "add", "--help"}, env);
    EXPECT_NE(add.out.find("--connections"), std::string::npos) << add.out;
    EXPECT_EQ(add.out.find("knxnic"), std::string::npos) << add.out;
    const auto add41 = LinuxTest::Autocli({"--host", "linux", "storage", "nfs41", "add", "--help"}, env);
    EXPECT_EQ(add41.out.find("knxnic"), std::string::npos) << add41.out;
    const auto pre = LinuxTest::Autocli({"--host", "linux", "storage", "nfs", "preunmount", "--help"}, env);
    EXPECT_EQ(pre.exitCode, 2) << pre.out;
    // The simulated demo host has all four on.
    LinuxTest::TempDir sim;
    const auto demo = LinuxTest::Autocli({"storage", "nfs", "add", "--help"}, {"XDG_STATE_HOME=" + sim.Path()});
    EXPECT_NE(demo.out.find("knxnic"), std::string::npos) << demo.out;
}

} // namespace

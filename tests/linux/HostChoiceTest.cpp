// Choosing the host: --host and AUTOCLI_HOST, the options that belong to the simulated host
// only, and what the Linux host answers where Linux has no equivalent.

#include <gtest/gtest.h>

#include "LinuxTestSupport.h"

namespace {

struct Case {
    std::string args; // autocli's words, split at spaces
    std::vector<std::string> env;
    int exitCode;
    const char* out; // exact standard output ("" to skip the check)
    const char* err; // a part of standard error ("" for none expected)
};

void ExpectRuns(const std::vector<Case>& cases, const std::string& prefix, const std::vector<std::string>& env)
{
    for (const auto& c : cases) {
        SCOPED_TRACE(prefix + c.args);
        auto allEnv = env;
        allEnv.insert(allEnv.end(), c.env.begin(), c.env.end());
        const auto ran = LinuxTest::Autocli(LinuxTest::Words(prefix + c.args), allEnv);
        EXPECT_EQ(ran.exitCode, c.exitCode) << ran.out << ran.err;
        if (*c.out) {
            EXPECT_EQ(ran.out, c.out);
        }
        if (*c.err) {
            EXPECT_NE(ran.err.find(c.err), std::string::npos) << ran.err;
        } else {
            EXPECT_EQ(ran.err, "");
        }
    }
}

TEST(HostChoice, UsageErrorsAndChoices)
{
    LinuxTest::TempDir dir;
    const std::string state = dir.Path() + "/host.json";
    LinuxTest::WriteFile(state, "{}");
    const std::string list = " storage filesystem list";
    const char* const stateRefused = "Option '--state' cannot be used with the Linux host.";
    const std::string linuxDir = "AUTOCLI_LINUX_DIR=" + dir.Path() + "/linux";
    ExpectRuns(
        {
            {"--host vm" + list, {}, 2, "", "Unknown host 'vm': use sim or linux."},
            {"--host", {}, 2, "", "Option '--host' needs a value."},
            {"--host linux --host sim" + list, {}, 2, "", "Option '--host' given more than once."},
            {"storage --host linux filesystem list", {}, 2, "", "Option '--host' must come before the command path."},
            {"--host linux --state " + state + list, {}, 2, "", stateRefused},
            {"--host linux --dump-state", {}, 2, "", "Option '--dump-state' cannot be used with the Linux host."},
            {"--state " + state + list, {"AUTOCLI_HOST=linux"}, 2, "", stateRefused},
            {list, {"AUTOCLI_HOST=xen"}, 2, "", "Unknown host 'xen' in AUTOCLI_HOST"},
            {"--host sim --state " + state + list, {"AUTOCLI_HOST=linux"}, 0, "", ""},
            {"storage hlfs extent list", {"AUTOCLI_HOST=linux", linuxDir}, 0, "", ""},
            {"--state " + state + list, {"AUTOCLI_HOST="}, 0, "", ""},
            {"--version", {"AUTOCLI_HOST=xen"}, 0, "", ""},
        },
        "", {});
}

// What Linux has no equivalent for: empty HLFS lists, "not found" for HLFS look-ups, and
// "not available" for operations. None of these reads or changes anything on the machine.
TEST(HostChoice, LinuxAnswersWhereItHasNoEquivalent)
{
    LinuxTest::TempDir dir;
    ExpectRuns(
        {
            {"storage hlfs extent list", {}, 0, "[]\n", ""},
            {"storage hlfs snapshot list", {}, 0, "[]\n", ""},
            {"storage hlfs lockmode list", {}, 0, "[]\n", ""},
            {"storage hlfs host list -l ds1", {}, 1, "", "HLFS volume with label ds1 could not be found."},
            {"storage hlfs upgrade -l ds1", {}, 1, "", "Cannot find HLFS volume with label ds1"},
            {"storage hlfs snapshot mount -l ds1",
             {},
             1,
             "",
             "No unresolved HLFS snapshots with volume label 'ds1' found."},
            {"storage hlfs pbcache reset",
             {},
             1,
             "",
             "StorageInfo.GetPointerBlockCache is not available on a Linux host"},
            {"storage hlfs pbcache get", {}, 1, "", "MemoryInfo.GetHeapStats is not available on a Linux host"},
            {"storage filesystem rescan", {}, 0, "true\n", ""},
            {"storage filesystem automount", {}, 0, "true\n", ""},
            {"storage filesystem unmount -a", {}, 0, "true\n", ""},
            {"storage filesystem mount -l nothing", {}, 1, "", "No volume with label 'nothing' was found"},
            {"storage nfs param get -v nothing", {}, 0, "[]\n", ""},
        },
        "--host linux --formatter json ", {"AUTOCLI_LINUX_DIR=" + dir.Path() + "/linux"});
}

// Feature switches on Linux: connections (103) on; the knxnic bindings (102, 104) and NAS
// pre-unmount (270) off, which decides which parameters and commands exist.
TEST(HostChoice, FeatureSwitchesOnLinux)
{
    LinuxTest::TempDir dir;
    const std::vector<std::string> env{"AUTOCLI_LINUX_DIR=" + dir.Path()};
    const auto add = LinuxTest::Autocli(LinuxTest::Words("--host linux storage nfs add --help"), env);
    EXPECT_NE(add.out.find("--connections"), std::string::npos) << add.out;
    EXPECT_EQ(add.out.find("knxnic"), std::string::npos) << add.out;
    const auto add41 = LinuxTest::Autocli(LinuxTest::Words("--host linux storage nfs41 add --help"), env);
    EXPECT_EQ(add41.out.find("knxnic"), std::string::npos) << add41.out;
    EXPECT_EQ(LinuxTest::Autocli(LinuxTest::Words("--host linux storage nfs preunmount --help"), env).exitCode, 2);
    // The simulated demo host has all four on.
    LinuxTest::TempDir sim;
    const auto demo = LinuxTest::Autocli(LinuxTest::Words("storage nfs add --help"), {"XDG_STATE_HOME=" + sim.Path()});
    EXPECT_NE(demo.out.find("knxnic"), std::string::npos) << demo.out;
}

} // namespace

// The built autocli as a user runs it: plug-in loading, exit codes and the streams.

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>

#include <nlohmann/json.hpp>

#include "support/Cli.h"
#include "support/Files.h"
#include "support/TempFolder.h"

namespace fs = std::filesystem;
using TestSupport::RunAutocli;

namespace {

class Autocli : public ::testing::Test {
protected:
    void SetUp() override
    {
        fs::create_directories(dir_ / "plugins");
        // Runs without --state use the default path, here inside the test's folder.
        ::setenv("XDG_STATE_HOME", (dir_ / "xdg").c_str(), 1);
        ::unsetenv("AUTOCLI_STATE");
    }
    void TearDown() override { ::unsetenv("XDG_STATE_HOME"); }

    std::string State(const std::string& json)
    {
        TestSupport::WriteFile(tmp_ / "host.json", json);
        return tmp_ / "host.json";
    }
    // No --state: the default path, where no file is yet, so the demo host.
    std::string DemoState() const { return {}; }
    std::string PluginEnv() const { return "AUTOCLI_PLUGIN_PATH=" + (dir_ / "plugins").string(); }

    const TestSupport::TempFolder tmp_;
    const fs::path dir_ = tmp_.Path();
};

struct UsageRun {
    std::vector<std::string> args;
    std::string start;
};

TEST_F(Autocli, UsageErrorsAreOneLineAndExitTwo)
{
    const std::vector<UsageRun> runs{
        {{"storage", "filesystem", "nope"}, "Unknown namespace or command 'nope' in 'storage filesystem'."},
        {{"storage", "filesystem", "rescan", "--x"}, "Unknown parameter '--x' for 'storage filesystem rescan'."},
        {{"--formatter"}, "Option '--formatter' needs a value."},
        // Bytes that are not UTF-8 are shown as escapes, so the message stays one valid line.
        {{"storage", "caf\xe9\x1b[2J"}, "Unknown namespace or command 'caf\\xe9\\x1b[2J' in 'storage'. See"},
        // Single-valued global options, wherever they stand.
        {{"--state", "one.json", "--state", "other.json", "storage", "filesystem", "list"},
         "Option '--state' given more than once."},
        {{"--formatter", "json", "storage", "filesystem", "list", "--formatter", "json"},
         "Option '--formatter' given more than once."},
        {{"--format-param", "show-header=false", "storage", "filesystem", "list", "--format-param", "show-header=true"},
         "Format parameter 'show-header' given more than once."},
        {{"storage", "internal", "clusteredhdsk", "set", "-l", "datastore1", "-e", "onn"},
         "Invalid value 'onn' for '--enabled': expected true or false (also yes/no, 1/0, on/off)."},
    };
    for (const auto& run : runs) {
        auto result = RunAutocli(run.args, DemoState());
        EXPECT_EQ(result.exitCode, 2) << run.start;
        EXPECT_EQ(result.out, "");
        EXPECT_EQ(result.err.rfind(run.start, 0), 0u) << result.err;
        EXPECT_EQ(std::count(result.err.begin(), result.err.end(), '\n'), 1) << result.err;
    }
}

TEST_F(Autocli, FormatParamsWithDifferentKeysCombine)
{
    auto result = RunAutocli({"--format-param", "show-header=off", "storage", "filesystem", "list", "--format-param",
                              "fields=Volume Name,Type", "--formatter", "csv"},
                             DemoState());
    EXPECT_EQ(result.exitCode, 0) << result.err;
    EXPECT_EQ(result.out.rfind("datastore1,", 0), 0u) << result.out;
    EXPECT_EQ(result.out.find("Volume Name"), std::string::npos) << result.out;
}

TEST_F(Autocli, HelpAndStateDump)
{
    auto help = RunAutocli({"storage", "--help"}, DemoState());
    EXPECT_EQ(help.exitCode, 0);
    EXPECT_NE(help.out.find("Manage storage on the Zephal host."), std::string::npos) << help.out;
    EXPECT_LT(help.out.find("  filesystem"), help.out.find("  nfs "));

    auto dump = RunAutocli({"--dump-state"}, State(R"({"features": {"102": true}})"));
    EXPECT_EQ(dump.exitCode, 0) << dump.err;
    EXPECT_EQ(nlohmann::json::parse(dump.out)["features"]["102"], true);

    auto bad = RunAutocli({"--dump-state"}, State("{not json"));
    EXPECT_EQ(bad.exitCode, 1);
    EXPECT_NE(bad.err.find("host.json"), std::string::npos) << bad.err;
}

TEST_F(Autocli, PluginFolderDecidesTheTree)
{
    // With no plug-in at all there are no commands to run.
    auto empty = RunAutocli({"storage", "--help"}, DemoState(), {PluginEnv()});
    EXPECT_EQ(empty.exitCode, 3);
    EXPECT_EQ(empty.err, "No plug-in could be loaded from '" + (dir_ / "plugins").string() + "'.\n");

    auto missing = RunAutocli({"storage", "--help"}, DemoState(), {"AUTOCLI_PLUGIN_PATH=" + (dir_ / "none").string()});
    EXPECT_EQ(missing.exitCode, 3);
    EXPECT_NE(missing.err.find((dir_ / "none").string()), std::string::npos) << missing.err;
}

TEST_F(Autocli, BrokenPluginIsNamedNotACrash)
{
    std::ofstream(dir_ / "plugins" / "junk.so") << "not a library";
    auto junk = RunAutocli({"storage", "--help"}, DemoState(), {PluginEnv()});
    EXPECT_EQ(junk.exitCode, 3);
    EXPECT_EQ(junk.err.rfind("Cannot load plug-in '" + (dir_ / "plugins" / "junk.so").string() + "'", 0), 0u)
        << junk.err;

    // A second copy of the real plug-in registers the same names again.
    fs::remove(dir_ / "plugins" / "junk.so");
    fs::copy_file(STORAGECLI_PLUGIN, dir_ / "plugins" / "a.so");
    fs::copy_file(STORAGECLI_PLUGIN, dir_ / "plugins" / "b.so");
    auto twice = RunAutocli({"storage", "--help"}, DemoState(), {PluginEnv()});
    EXPECT_EQ(twice.exitCode, 3);
    EXPECT_EQ(twice.err.rfind("Plug-in '" + (dir_ / "plugins" / "b.so").string() + "' failed to register: ", 0), 0u)
        << twice.err;
}

} // namespace

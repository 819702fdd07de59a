// Runs every fixture case under tests/e2e/cases: a state file, one or more autocli runs
// with their expected standard output, standard error and exit status, and optionally
// the host journal they leave behind.

#include <algorithm>
#include <filesystem>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "support/Cli.h"
#include "support/Files.h"
#include "support/FixtureCase.h"
#include "support/TempFolder.h"

namespace fs = std::filesystem;

namespace {

std::vector<std::string> CaseFiles()
{
    std::vector<std::string> files;
    for (const auto& entry : fs::recursive_directory_iterator(STORAGECLI_CASES_DIR)) {
        if (entry.is_regular_file() && entry.path().extension() == ".case") {
            files.push_back(fs::relative(entry.path(), STORAGECLI_CASES_DIR).string());
        }
    }
    std::sort(files.begin(), files.end());
    return files;
}

class FixtureCaseTest : public ::testing::TestWithParam<std::string> {};

TEST_P(FixtureCaseTest, MatchesExpectedOutput)
{
    const fs::path file = fs::path(STORAGECLI_CASES_DIR) / GetParam();
    const TestSupport::FixtureCase fixture = TestSupport::ParseFixtureCase(TestSupport::ReadFile(file));
    ASSERT_FALSE(fixture.steps.empty()) << file << ": no '== run:' step";

    const TestSupport::TempFolder dir;
    const std::string journal = dir / "journal.jsonl";
    // A case with a state names its file; one without runs at the default path, inside the
    // case's folder, where the demo host is used until a change writes it.
    std::string state;
    if (fixture.state) {
        state = dir / "host.json";
        TestSupport::WriteFile(state, *fixture.state);
    }
    std::vector<std::string> env{"XDG_STATE_HOME=" + (dir / "xdg"), "AUTOCLI_STATE="};
    env.insert(env.end(), fixture.env.begin(), fixture.env.end());
    env.push_back("AUTOCLI_JOURNAL=" + journal);

    for (const auto& step : fixture.steps) {
        SCOPED_TRACE(file.string() + ": autocli " + step.commandLine);
        const auto result = TestSupport::RunAutocli(step.args, state, env);
        EXPECT_EQ(result.out, step.expectedStdout);
        EXPECT_EQ(result.err, step.expectedStderr);
        EXPECT_EQ(result.exitCode, step.expectedExit);
    }

    if (fixture.expectedJournal) {
        std::vector<nlohmann::json> actual;
        std::istringstream lines(TestSupport::ReadFile(journal));
        for (std::string line; std::getline(lines, line);) {
            actual.push_back(nlohmann::json::parse(line));
        }
        std::vector<nlohmann::json> expected;
        for (const auto& line : *fixture.expectedJournal) {
            expected.push_back(nlohmann::json::parse(line));
        }
        EXPECT_EQ(nlohmann::json(actual).dump(1), nlohmann::json(expected).dump(1)) << file << ": journal";
    }
}

std::string CaseName(const ::testing::TestParamInfo<std::string>& info)
{
    std::string name = info.param.substr(0, info.param.size() - std::string(".case").size());
    std::replace_if(
        name.begin(), name.end(), [](char c) { return !std::isalnum(static_cast<unsigned char>(c)); }, '_');
    return name;
}

INSTANTIATE_TEST_SUITE_P(Cases, FixtureCaseTest, ::testing::ValuesIn(CaseFiles()), CaseName);

} // namespace

#pragma once

#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace TestSupport {

// One autocli run of a fixture case and what it must print.
struct FixtureStep {
    std::string commandLine;
    std::vector<std::string> args;
    std::string expectedStdout;
    std::string expectedStderr;
    int expectedExit = 0;
};

// A fixture case file:
//   # comments (only before the first section)
//   == state            the state file, named with --state (absent: the default path, with
//                       no file there, so the demo host until a change writes it)
//   == env NAME=VALUE   an extra environment entry for every run
//   == run: ARGS        a run, ARGS split as a POSIX shell would
//   == stdout / == stderr   the exact expected text (absent: empty)
//   == exit N           the expected exit status (absent: 0)
//   == journal          the exact journal lines of all runs together
// A section's text is its lines, each ending in a newline; trailing blank lines are dropped.
struct FixtureCase {
    std::optional<std::string> state;
    std::vector<std::string> env;
    std::vector<FixtureStep> steps;
    std::optional<std::vector<std::string>> expectedJournal;
};

struct FixtureError : std::runtime_error {
    using std::runtime_error::runtime_error;
};

FixtureCase ParseFixtureCase(const std::string& text);

// Splits a command line into words: blanks separate words; single quotes keep everything;
// double quotes keep everything but backslash escapes of " \ $ `; a backslash outside
// quotes keeps the next character.
std::vector<std::string> SplitShellWords(const std::string& line);

} // namespace TestSupport

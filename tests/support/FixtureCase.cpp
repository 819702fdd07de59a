#include "support/FixtureCase.h"

#include <sstream>

namespace TestSupport {

std::vector<std::string> SplitShellWords(const std::string& line)
{
    std::vector<std::string> words;
    std::string word;
    bool inWord = false;
    for (std::size_t i = 0; i < line.size(); ++i) {
        const char c = line[i];
        if (c == ' ' || c == '\t') {
            if (inWord) {
                words.push_back(word);
                word.clear();
                inWord = false;
            }
            continue;
        }
        inWord = true;
        if (c == '\'') {
            const auto end = line.find('\'', i + 1);
            if (end == std::string::npos) {
                throw FixtureError("unterminated single quote in: " + line);
            }
            word += line.substr(i + 1, end - i - 1);
            i = end;
        } else if (c == '"') {
            for (++i;; ++i) {
                if (i >= line.size()) {
                    throw FixtureError("unterminated double quote in: " + line);
                }
                if (line[i] == '"') {
                    break;
                }
                if (line[i] == '\\' && i + 1 < line.size() &&
                    std::string("\"\\$`").find(line[i + 1]) != std::string::npos) {
                    ++i;
                }
                word += line[i];
            }
        } else if (c == '\\') {
            if (i + 1 >= line.size()) {
                throw FixtureError("trailing backslash in: " + line);
            }
            word += line[++i];
        } else {
            word += c;
        }
    }
    if (inWord) {
        words.push_back(word);
    }
    return words;
}

namespace {

std::string JoinSection(std::vector<std::string> lines)
{
    while (!lines.empty() && lines.back().empty()) {
        lines.pop_back();
    }
    std::string text;
    for (const auto& line : lines) {
        text += line;
        text += '\n';
    }
    return text;
}

} // namespace

FixtureCase ParseFixtureCase(const std::string& text)
{
    FixtureCase fixture;
    std::istringstream in(text);
    std::string section;
    std::vector<std::string> body;
    bool started = false;

    auto close = [&] {
        if (section == "state") {
            fixture.state = JoinSection(body);
        } else if (section == "stdout" || section == "stderr") {
            if (fixture.steps.empty()) {
                throw FixtureError("'== " + section + "' before any '== run:'");
            }
            (section == "stdout" ? fixture.steps.back().expectedStdout : fixture.steps.back().expectedStderr) =
                JoinSection(body);
        } else if (section == "journal") {
            std::vector<std::string> lines;
            for (const auto& line : body) {
                if (!line.empty()) {
                    lines.push_back(line);
                }
            }
            fixture.expectedJournal = lines;
        }
        body.clear();
    };

    for (std::string line; std::getline(in, line);) {
        if (line.rfind("== ", 0) != 0) {
            if (!started && (line.empty() || line[0] == '#')) {
                continue;
            }
            if (!started) {
                throw FixtureError("text before the first section: " + line);
            }
            body.push_back(line);
            continue;
        }
        close();
        started = true;
        const std::string header = line.substr(3);
        if (header.rfind("run:", 0) == 0) {
            FixtureStep step;
            step.commandLine = header.substr(4);
            step.args = SplitShellWords(step.commandLine);
            fixture.steps.push_back(step);
            section = "run";
        } else if (header.rfind("exit", 0) == 0) {
            if (fixture.steps.empty()) {
                throw FixtureError("'== exit' before any '== run:'");
            }
            fixture.steps.back().expectedExit = std::stoi(header.substr(4));
            section = "exit";
        } else if (header.rfind("env ", 0) == 0) {
            fixture.env.push_back(header.substr(4));
            section = "env";
        } else if (header == "state" || header == "stdout" || header == "stderr" || header == "journal") {
            section = header;
        } else {
            throw FixtureError("unknown section: " + line);
        }
    }
    close();
    return fixture;
}

} // namespace TestSupport

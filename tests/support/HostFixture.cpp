#include "support/HostFixture.h"

#include <cstdlib>
#include <fstream>
#include <sstream>

#include "host/HostSession.h"

namespace TestSupport {

ScopedHost::ScopedHost(const std::string& stateJson)
    : statePath_(dir_ / "host.json"), journalPath_(dir_ / "journal.jsonl")
{
    if (!stateJson.empty())
        std::ofstream(statePath_, std::ios::binary) << stateJson;
    ::setenv("AUTOCLI_JOURNAL", journalPath_.c_str(), 1);
    HostSim::OpenSession(statePath_);
}

ScopedHost::~ScopedHost()
{
    HostSim::CloseSession();
    ::unsetenv("AUTOCLI_JOURNAL");
}

nlohmann::json ScopedHost::State() const
{
    HostSim::SaveChanges(); // what a command would have saved when it ended
    std::ifstream in(statePath_, std::ios::binary);
    if (!in)
        return nullptr;
    return nlohmann::json::parse(in, nullptr, false);
}

std::vector<nlohmann::json> ScopedHost::Journal() const
{
    std::vector<nlohmann::json> lines;
    std::ifstream in(journalPath_);
    for (std::string line; std::getline(in, line);)
        if (!line.empty())
            lines.push_back(nlohmann::json::parse(line, nullptr, false));
    return lines;
}

std::vector<std::string> ScopedHost::JournalCalls() const
{
    std::vector<std::string> calls;
    for (const auto& line : Journal())
        calls.push_back(line.value("call", std::string()));
    return calls;
}

void ScopedHost::ClearJournal() { std::ofstream(journalPath_, std::ios::trunc); }

void ScopedHost::Reopen()
{
    HostSim::SaveChanges();
    HostSim::CloseSession();
    HostSim::OpenSession(statePath_);
}

} // namespace TestSupport

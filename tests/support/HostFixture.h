#pragma once

#include <string>
#include <vector>

#include <nlohmann/json.hpp>

#include "support/TempFolder.h"

namespace TestSupport {

// An in-process host session on a temporary state file, with its own call journal.
class ScopedHost {
public:
    // Writes `stateJson` to a fresh temporary directory (an empty text writes no file, so
    // the demo host is used), points AUTOCLI_JOURNAL at a fresh journal file there and
    // opens the host session on the state file.
    explicit ScopedHost(const std::string& stateJson = "{}");
    ~ScopedHost(); // closes the session, unsets AUTOCLI_JOURNAL, removes the directory
    ScopedHost(const ScopedHost&) = delete;
    ScopedHost& operator=(const ScopedHost&) = delete;

    const std::string& Dir() const { return dir_.Path(); }
    const std::string& StatePath() const { return statePath_; }
    const std::string& JournalPath() const { return journalPath_; }

    // The state file as it is on disk after saving the session's changes (null when there is none).
    nlohmann::json State() const;
    // Every journal line so far, parsed.
    std::vector<nlohmann::json> Journal() const;
    // The "call" of every journal line so far.
    std::vector<std::string> JournalCalls() const;
    // Forgets the journal so far.
    void ClearJournal();
    // Saves, closes and reopens the session (fault counters restart, FeatureList is read again).
    void Reopen();

private:
    TempFolder dir_;
    std::string statePath_;
    std::string journalPath_;
};

} // namespace TestSupport

#pragma once

#include <functional>
#include <stdexcept>
#include <string>

// The simulated host's session: which state file it serves, under an exclusive lock, and
// the one save of a command's changes.
namespace HostSim {

// Where the state lives: $AUTOCLI_STATE, else ${XDG_STATE_HOME:-$HOME/.local/state}/autocli/host.json.
std::string DefaultStatePath();

// The state file for a command line: `option` (--state) when given, else $AUTOCLI_STATE,
// else the default path. `named` tells whether the user named it (then it must exist).
struct StateChoice {
    std::string path;
    bool named = false;
};
StateChoice ChooseStatePath(const std::string* option);

// A named state file that does not exist.
class StateFileMissing : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// --init-state on a path where something already is.
class StateFileExists : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

struct SessionOptions {
    bool mustExist = false; // a missing file is StateFileMissing rather than the demo host
    bool dryRun = false;    // SaveChanges() writes nothing
};

// Opens the session on `stateFile`. A symlink is followed once and the session then works on
// its final target. An existing file is locked (FILE.lock beside it, waiting up to
// $AUTOCLI_LOCK_TIMEOUT seconds, default 10) and read; a bad one is remembered, and every
// host operation then throws HostCtlException naming the file and the place. A missing file
// is the demo host, and nothing is created until SaveChanges() has something to write.
// Throws std::runtime_error when the path cannot be used (not a regular file, cannot be
// examined, lock not had) and StateFileMissing as described above.
void OpenSession(const std::string& stateFile, const SessionOptions& options = {});

// Writes the changes made since the session opened (or since the last save) in one step:
// a private temporary file beside the state, renamed over it. Nothing to do when nothing
// changed or in a dry run. Throws std::runtime_error "Cannot save host state file ...";
// the file on disk is then unchanged.
void SaveChanges();

// Ends the session without saving; the lock is released.
void CloseSession();

// Writes the demo host to `stateFile`, creating missing folders. Throws StateFileExists when
// anything is at that path already, std::runtime_error for any other failure.
void InitState(const std::string& stateFile);

// The effective state (the file, or the demo host) as indented JSON. Throws
// HostCtlException when the state is bad.
std::string DumpState();

// While set, every journal line goes to `sink` (without its newline) instead of the
// AUTOCLI_JOURNAL file. An empty function restores the file.
void SetJournalSink(std::function<void(const std::string&)> sink);

} // namespace HostSim

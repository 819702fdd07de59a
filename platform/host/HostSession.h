#pragma once

#include <string>

// The simulated host's session: which state file it serves, under an exclusive lock.
namespace HostSim {

// The state file used when none is named: $AUTOCLI_STATE, else
// ${XDG_STATE_HOME:-$HOME/.local/state}/autocli/host.json.
std::string DefaultStatePath();

// Opens the session on `stateFile`: takes an exclusive lock on stateFile + ".lock"
// (waiting up to 10 seconds), loads and validates the state (a missing file is the demo
// host; a bad one is remembered, and every host operation then throws HostCtlException
// with a message naming the file and the place) and fills FeatureList from it.
// Reopening closes the previous session first. Throws std::runtime_error when the lock
// cannot be had.
void OpenSession(const std::string& stateFile);
void CloseSession();

// The effective state (the file, or the demo host) as indented JSON. Throws
// HostCtlException when the state is bad.
std::string DumpState();

} // namespace HostSim

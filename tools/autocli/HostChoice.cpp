#include "HostChoice.h"

#include <cstdlib>

HostChoice ChooseHost(const Quillets::Cli::GlobalOptions& globals)
{
    HostChoice choice;
    std::string name = "sim";
    if (globals.hostName) {
        name = *globals.hostName;
    } else if (const char* fromEnvironment = std::getenv("AUTOCLI_HOST"); fromEnvironment && *fromEnvironment) {
        name = fromEnvironment;
        if (name != "sim" && name != "linux") {
            choice.error = "Unknown host '" + name + "' in AUTOCLI_HOST: use sim or linux. See 'autocli --help'.";
            return choice;
        }
    }
    choice.useLinux = name == "linux";
    // The state options belong to the simulated host; on this machine they would mean nothing.
    // A dry run works on a state held in memory; this machine has none, so it would change things for real.
    if (choice.useLinux && (globals.statePath || globals.dumpState || globals.initState || globals.dryRun)) {
        const char* option = globals.statePath   ? "--state"
                             : globals.dumpState ? "--dump-state"
                             : globals.initState ? "--init-state"
                                                 : "--dry-run";
        choice.error = std::string("Option '") + option + "' cannot be used with the Linux host. See 'autocli --help'.";
    }
    return choice;
}

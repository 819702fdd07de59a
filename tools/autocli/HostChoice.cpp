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
    if (choice.useLinux && (globals.statePath || globals.dumpState)) {
        choice.error = std::string("Option '") + (globals.statePath ? "--state" : "--dump-state") +
                       "' cannot be used with the Linux host. See 'autocli --help'.";
    }
    return choice;
}

#include "framework/GlobalOptions.h"

namespace Quillets::Cli {

const std::vector<GlobalOptionInfo>& GlobalOptionTable()
{
    static const std::vector<GlobalOptionInfo> table{
        {"--state",
         "",
         "FILE",
         {},
         true,
         true,
         "Host state file (default: $AUTOCLI_STATE, else ${XDG_STATE_HOME:-$HOME/.local/state}/autocli/host.json). "
         "A file named here or in $AUTOCLI_STATE must exist."},
        {"--host",
         "",
         "NAME",
         {"sim", "linux"},
         false,
         true,
         "Which host answers: sim (the simulated host over the state file) or linux (this machine); "
         "default: $AUTOCLI_HOST, else sim."},
        {"--formatter",
         "",
         "NAME",
         {"table", "simple", "json", "csv"},
         false,
         false,
         "Output format: table, simple, json or csv (default: the command's own, else simple)."},
        {"--format-param",
         "",
         "KEY=VALUE",
         {},
         false,
         false,
         "fields=A,B,C chooses the fields and their order; show-header=false drops the table header. Repeatable."},
        {"--help", "-h", "", {}, false, false, "Help for the path given so far."},
        {"--version", "", "", {}, false, true, "Show the version and exit."},
        {"--dump-state", "", "", {}, false, true, "Print the effective host state as JSON and exit."},
        {"--init-state",
         "",
         "",
         {},
         false,
         true,
         "Create the named state file (--state or $AUTOCLI_STATE) from the demo host and exit; "
         "refuses an existing file."},
        {"--dry-run",
         "",
         "",
         {},
         false,
         true,
         "Run the command on the state in memory and save nothing; then print \"Dry run: nothing was saved.\" "
         "and the host calls it made on standard error."},
        {"--list-commands", "", "", {}, false, true, "Print every command path, one per line, and exit."},
        {"--completion",
         "",
         "SHELL",
         {"bash", "zsh"},
         false,
         true,
         "Print a completion script for bash or zsh and exit."},
    };
    return table;
}

} // namespace Quillets::Cli

#pragma once

#include <string>

#include "framework/Parser.h"

// Which host answers this run: --host, else $AUTOCLI_HOST, else the simulated host.
struct HostChoice {
    bool useLinux = false;
    std::string error; // a usage error ("" when none)
};

HostChoice ChooseHost(const Quillets::Cli::GlobalOptions& globals);

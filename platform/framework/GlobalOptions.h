#pragma once

#include <string>
#include <vector>

// The global options autocli documents: one table for help, the manual page, completion
// and suggestions, so none of them can leave one out.
namespace Quillets::Cli {

struct GlobalOptionInfo {
    std::string longName;             // "--state"
    std::string shortName;            // "-h", or ""
    std::string value;                // what the value is called ("FILE"), "" for none
    std::vector<std::string> choices; // the only values it takes, when it has a fixed set
    bool fileValue = false;           // the value is a file name
    bool beforePathOnly = true;       // read only before the command path
    std::string description;
};

const std::vector<GlobalOptionInfo>& GlobalOptionTable();

} // namespace Quillets::Cli

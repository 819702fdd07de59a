#pragma once

#include <optional>
#include <string>
#include <vector>

#include "framework/Completion.h"

// What the completion scripts offer for the parameters that name a volume: the front end
// knows which parameters those are, the host knows the volumes.
namespace Autocli {

// Parameter long name -> the kind of value it names.
Quillets::Cli::ValueSources VolumeParameters();

// The values of `kind` on the host now; nothing for a kind VolumeParameters does not use.
std::optional<std::vector<std::string>> HostValues(const std::string& kind);

} // namespace Autocli

#pragma once

// The plug-in's commands are private to their areas; in-process tests reach them the way the
// front end does, through the registered tree.

#include <memory>
#include <string>

#include "quillets/AutoCli.h"

namespace TestSupport {

// The command at `path` (e.g. "storage hlfs snapshot list") of a tree registered now, under
// the current host's feature switches. Fails the test (and returns null) when there is none.
std::shared_ptr<Quillets::AutoCli::Command> RegisteredCommand(const std::string& path);

} // namespace TestSupport

#pragma once

#include <map>
#include <memory>
#include <string>

#include "quillets/AutoCli.h"

// Shell completion scripts made from the command tree as it stands, so they offer exactly
// the namespaces, commands and parameters this host has.
namespace Quillets::Cli {

// Parameters (by long name) whose values name something on the host, and what: the word
// that `autocli --list-values` takes to print the values the host has now.
using ValueSources = std::map<std::string, std::string>;

// The script for "bash" or "zsh"; "" for any other shell.
std::string CompletionScript(const std::string& shell, const std::shared_ptr<AutoCli::NamespaceNode>& root,
                             const ValueSources& sources);

} // namespace Quillets::Cli

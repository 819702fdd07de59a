#pragma once

#include <memory>
#include <string>

#include "framework/TreeWalk.h"
#include "quillets/AutoCli.h"
#include "quillets/CallSpec.h"

namespace Quillets::Cli {

// Help for the node at `path`: a namespace lists its children; a command shows its
// description, parameters, examples and result fields.
std::string HelpText(const CommandPath& path, const std::shared_ptr<AutoCli::NamespaceNode>& node);

std::string NamespaceHelp(const CommandPath& path, const AutoCli::NamespaceNode& node);
std::string CommandHelp(const CommandPath& path, AutoCli::Command& command);

// A parameter description with %ENUM% replaced by the allowed values of its enumeration.
std::string ExpandEnum(const CallSpec::ParameterSpec& parameter);

// ExpandEnum's text followed by "(required|optional[, from MIN to MAX][, repeatable])".
std::string ParameterDetails(const CallSpec::ParameterSpec& parameter);

} // namespace Quillets::Cli

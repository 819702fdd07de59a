#pragma once

#include <memory>
#include <string>

#include "quillets/AutoCli.h"

namespace Quillets::Cli {

// The manual page autocli(1) in man(7) markup, made from the tree: synopsis, global options,
// every command with its parameters, environment, files, exit status and examples.
std::string ManPage(const std::shared_ptr<AutoCli::NamespaceNode>& root);

// Text as roff shows it literally: escapes, dashes of option names, characters beyond
// ASCII, and a protected line start. `code` keeps every hyphen a minus sign.
std::string RoffText(const std::string& text, bool code = false);

} // namespace Quillets::Cli

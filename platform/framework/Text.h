#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

// Small text helpers shared by the parser, help and the renderers.
namespace Quillets::Cli::Text {

// Shows control characters as escapes (\n, \t, \r, \xHH) so that one value can never
// break a line of human-readable output; everything else is kept as it is.
std::string EscapeControl(const std::string& text);
// The same, appended to `out`.
void AppendEscaped(std::string& out, std::string_view text);
// DisplayWidth of the escaped text, without making it.
std::size_t EscapedWidth(std::string_view text);

// Columns taken on a terminal: UTF-8 code points, not bytes.
std::size_t DisplayWidth(const std::string& text);

std::string Trim(const std::string& text);

// Splits at every comma; empty entries are kept.
std::vector<std::string> SplitCommas(const std::string& text);

std::string Join(const std::vector<std::string>& parts, const std::string& separator);

} // namespace Quillets::Cli::Text

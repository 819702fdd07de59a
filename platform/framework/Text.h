#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

// Small text helpers shared by the parser, help and the renderers.
namespace Quillets::Cli::Text {

// Shows control characters as escapes (\n, \t, \r, \xHH) so that one value can never
// break a line of human-readable output, and each byte that is not UTF-8 as \xHH; every
// other character is kept as it is.
std::string EscapeControl(const std::string& text);
// The same, appended to `out`.
void AppendEscaped(std::string& out, std::string_view text);
// DisplayWidth of the escaped text, without making it.
std::size_t EscapedWidth(std::string_view text);

// Columns taken on a terminal: wide East Asian characters take two, combining marks none,
// a byte that is not UTF-8 one.
std::size_t DisplayWidth(const std::string& text);

// Decodes the UTF-8 sequence at text[pos] and moves past it; nothing (and one byte on) for
// a byte that does not start a well-formed sequence: overlong forms, surrogates and values
// past U+10FFFF are not well formed.
std::optional<char32_t> NextCodePoint(std::string_view text, std::size_t& pos);

std::string Trim(const std::string& text);

// Splits at every comma; empty entries are kept.
std::vector<std::string> SplitCommas(const std::string& text);

std::string Join(const std::vector<std::string>& parts, const std::string& separator);

} // namespace Quillets::Cli::Text

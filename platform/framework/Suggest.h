#pragma once

#include <optional>
#include <string>
#include <vector>

// "Did you mean ...?" for a word the command line did not know.
namespace Quillets::Cli {

// Edits (insert, delete, replace, swap two neighbours) that turn `a` into `b`, ignoring
// ASCII case; limit + 1 for anything beyond `limit`.
std::size_t EditDistance(const std::string& a, const std::string& b, std::size_t limit);

// The candidate the user most likely meant by `typed`, or nothing when none is close or
// two are equally close: the one candidate that starts with what was typed, else the
// closest within two edits (and fewer than half its length, so that short words are not
// matched by chance). Case is ignored.
std::optional<std::string> Suggest(const std::string& typed, const std::vector<std::string>& candidates);

// " Did you mean '<x>'?" for Suggest's answer, "" when it has none.
std::string DidYouMean(const std::string& typed, const std::vector<std::string>& candidates);

} // namespace Quillets::Cli

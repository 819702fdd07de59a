#include "framework/Suggest.h"

#include <algorithm>
#include <cctype>

#include "framework/Text.h"

namespace Quillets::Cli {

namespace {

char Lower(char c) { return static_cast<char>(std::tolower(static_cast<unsigned char>(c))); }

constexpr std::size_t kMaxEdits = 2;

bool StartsWithIgnoringCase(const std::string& text, const std::string& prefix)
{
    return text.size() >= prefix.size() &&
           std::equal(prefix.begin(), prefix.end(), text.begin(), [](char a, char b) { return Lower(a) == Lower(b); });
}

} // namespace

std::size_t EditDistance(const std::string& a, const std::string& b, std::size_t limit)
{
    const std::size_t n = a.size();
    const std::size_t m = b.size();
    if ((n > m ? n - m : m - n) > limit) {
        return limit + 1;
    }
    // Three rows of the optimal string alignment table: two back for a swap.
    std::vector<std::size_t> before(m + 1), previous(m + 1), current(m + 1);
    for (std::size_t j = 0; j <= m; ++j) {
        previous[j] = j;
    }
    for (std::size_t i = 1; i <= n; ++i) {
        current[0] = i;
        for (std::size_t j = 1; j <= m; ++j) {
            const std::size_t cost = Lower(a[i - 1]) == Lower(b[j - 1]) ? 0 : 1;
            current[j] = std::min({previous[j] + 1, current[j - 1] + 1, previous[j - 1] + cost});
            if (i > 1 && j > 1 && Lower(a[i - 1]) == Lower(b[j - 2]) && Lower(a[i - 2]) == Lower(b[j - 1])) {
                current[j] = std::min(current[j], before[j - 2] + 1);
            }
        }
        std::swap(before, previous);
        std::swap(previous, current);
    }
    return std::min(previous[m], limit + 1);
}

std::optional<std::string> Suggest(const std::string& typed, const std::vector<std::string>& candidates)
{
    if (typed.empty()) {
        return std::nullopt;
    }
    // The beginning of one word only is the strongest hint: "snap" is "snapshot", though
    // "unmap" is two edits away.
    std::optional<std::string> prefixed;
    bool ambiguous = false;
    for (const auto& candidate : candidates) {
        if (StartsWithIgnoringCase(candidate, typed) && candidate != prefixed) {
            ambiguous = prefixed.has_value();
            prefixed = candidate;
            if (ambiguous) {
                break;
            }
        }
    }
    if (prefixed && !ambiguous) {
        return prefixed;
    }
    std::optional<std::string> closest;
    std::size_t closestDistance = kMaxEdits + 1;
    bool tie = false;
    for (const auto& candidate : candidates) {
        if (candidate.empty() || candidate == typed) {
            continue;
        }
        const std::size_t distance = EditDistance(typed, candidate, kMaxEdits);
        if (distance > kMaxEdits || 2 * distance >= candidate.size()) {
            continue;
        }
        if (distance < closestDistance) {
            closest = candidate;
            closestDistance = distance;
            tie = false;
        } else if (distance == closestDistance && candidate != *closest) {
            tie = true;
        }
    }
    if (tie) {
        return std::nullopt;
    }
    return closest;
}

std::string DidYouMean(const std::string& typed, const std::vector<std::string>& candidates)
{
    const auto suggestion = Suggest(typed, candidates);
    return suggestion ? " Did you mean '" + Text::EscapeControl(*suggestion) + "'?" : std::string();
}

} // namespace Quillets::Cli

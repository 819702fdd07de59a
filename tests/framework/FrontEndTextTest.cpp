// Text as the front end shows it: terminal widths, escapes, suggestions and manual page markup.

#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <vector>

#include "framework/ManPage.h"
#include "framework/Suggest.h"
#include "framework/Text.h"

using namespace Quillets::Cli;

namespace {

struct WidthCase {
    const char* name;
    std::string text;
    std::string shown; // as a table cell prints it
    std::size_t width; // columns it takes on a terminal
};

void PrintTo(const WidthCase& c, std::ostream* os) { *os << c.name; }

class Widths : public ::testing::TestWithParam<WidthCase> {};

TEST_P(Widths, CellsShowAndMeasureAsATerminalDoes)
{
    const auto& c = GetParam();
    EXPECT_EQ(Text::EscapeControl(c.text), c.shown);
    EXPECT_EQ(Text::EscapedWidth(c.text), c.width);
    EXPECT_EQ(Text::DisplayWidth(c.shown), c.width);
}

INSTANTIATE_TEST_SUITE_P(EachKind, Widths,
                         ::testing::Values(WidthCase{"ascii", "plain", "plain", 5},
                                           WidthCase{"hangul_syllable", "\xea\xb0\x80", "\xea\xb0\x80", 2},
                                           WidthCase{"zero_width_space_none", "a\u200bb", "a\u200bb", 2},
                                           WidthCase{"tab_and_newline", "a\tb\n", "a\\tb\\n", 6},
                                           WidthCase{"c0_and_delete", std::string("\x01\x7f", 2), "\\x01\\x7f", 8},
                                           WidthCase{"c1_control_escaped", "\302\23331m", "\\xc2\\x9b31m", 11},
                                           WidthCase{"line_separator_escaped", "a\xe2\x80\xa8", "a\\xe2\\x80\\xa8", 13},
                                           WidthCase{"lone_continuation_byte", "a\x80z", "a\\x80z", 6},
                                           WidthCase{"truncated_sequence", "\xe6\x95", "\\xe6\\x95", 8},
                                           WidthCase{"overlong_slash", "\xc0\xaf", "\\xc0\\xaf", 8},
                                           WidthCase{"surrogate", "\xed\xa0\x80", "\\xed\\xa0\\x80", 12},
                                           WidthCase{"beyond_unicode", "\xf4\x90\x80\x80", "\\xf4\\x90\\x80\\x80", 16},
                                           WidthCase{"bad_lead_then_wide", "\xff\xe6\x95\xb0", "\\xff\xe6\x95\xb0", 6}),
                         [](const auto& info) { return std::string(info.param.name); });

struct SuggestCase {
    const char* name;
    std::string typed;
    std::vector<std::string> candidates;
    std::string expected; // "" for no suggestion
};

void PrintTo(const SuggestCase& c, std::ostream* os) { *os << c.name; }

class Suggestions : public ::testing::TestWithParam<SuggestCase> {};

TEST_P(Suggestions, OnlyAClearWinner)
{
    const auto& c = GetParam();
    EXPECT_EQ(Suggest(c.typed, c.candidates).value_or(""), c.expected);
}

const std::vector<std::string> kCommands{"list", "mount", "unmount", "rescan", "automount"};

INSTANTIATE_TEST_SUITE_P(
    NearAndFar, Suggestions,
    ::testing::Values(SuggestCase{"extra_letter", "mountt", kCommands, "mount"},
                      SuggestCase{"swapped_letters", "resacn", kCommands, "rescan"},
                      SuggestCase{"two_edits_in_a_long_word", "automnt", kCommands, "automount"},

                      SuggestCase{"unique_prefix_beats_distance", "un", kCommands, "unmount"},
                      SuggestCase{"ambiguous_prefix_falls_back_to_distance", "mo", {"mount", "move", "mo2"}, "mo2"},

                      SuggestCase{"two_edits_in_a_short_word", "lxxt", kCommands, ""},
                      SuggestCase{"all_letters_replaced", "ab", {"cd"}, ""},
                      SuggestCase{"equally_close", "zet", {"get", "set"}, ""},
                      SuggestCase{"closer_one_wins", "sets", {"get", "set"}, "set"},
                      SuggestCase{"nothing_typed", "", kCommands, ""}, SuggestCase{"no_candidates", "list", {}, ""},
                      SuggestCase{"same_word_twice_is_one", "lst", {"list", "list"}, "list"}),
    [](const auto& info) { return std::string(info.param.name); });

struct RoffCase {
    const char* name;
    std::string text;
    std::string roff;
};

void PrintTo(const RoffCase& c, std::ostream* os) { *os << c.name; }

class Roff : public ::testing::TestWithParam<RoffCase> {};

TEST_P(Roff, TextIsNeverMarkup) { EXPECT_EQ(RoffText(GetParam().text), GetParam().roff); }

INSTANTIATE_TEST_SUITE_P(
    Each, Roff,
    ::testing::Values(RoffCase{"plain", "Mount a volume.", "Mount a volume."},
                      RoffCase{"request_at_line_start", ".so /etc/passwd\n'br", "\\&.so /etc/passwd\n\\&'br"},
                      RoffCase{"backslash", "a\\fBb", "a\\efBb"},
                      RoffCase{"option_names_keep_minus", "use --volume-label (-l)", "use \\-\\-volume\\-label (\\-l)"},
                      RoffCase{"prose_hyphen_stays", "read-only", "read-only"},
                      RoffCase{"double_quote", "say \"x\"", "say \\(dqx\\(dq"},
                      RoffCase{"beyond_ascii", "caf\xc3\xa9 \xe6\x95\xb0", "caf\\[u00E9] \\[u6570]"},
                      RoffCase{"invalid_utf8", "a\xff", "a\\[uFFFD]"}, RoffCase{"control_character", "a\001b", "a b"}),
    [](const auto& info) { return std::string(info.param.name); });

} // namespace

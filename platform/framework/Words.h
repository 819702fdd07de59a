#pragma once

#include <cstddef>
#include <optional>
#include <string_view>

#include "quillets/CallSpec.h"

// The words the front end prints for enumerated values, each mapping kept as one table.
namespace Quillets::Cli {

template <class Enum>
struct Spelling {
    Enum value;
    const char* word;
};

// The word for `value`, or `otherwise` when the table has none.
template <class Enum, std::size_t N>
const char* WordFor(const Spelling<Enum> (&table)[N], Enum value, const char* otherwise)
{
    for (const auto& entry : table) {
        if (entry.value == value) {
            return entry.word;
        }
    }
    return otherwise;
}

// The value spelled exactly `word`, or nothing.
template <class Enum, std::size_t N>
std::optional<Enum> ValueFor(const Spelling<Enum> (&table)[N], std::string_view word)
{
    for (const auto& entry : table) {
        if (word == entry.word) {
            return entry.value;
        }
    }
    return std::nullopt;
}

// How a parameter type reads in each place that names it.
struct ParameterTypeWords {
    const char* described; // in messages: "an integer"
    const char* synopsis;  // after the name in help: " <long>"
    const char* manValue;  // the man page's italic value: "long"
};

// A type from outside the enumeration reads as unknown in messages and as a string elsewhere.
const ParameterTypeWords& WordsFor(CallSpec::ParameterType type);

} // namespace Quillets::Cli

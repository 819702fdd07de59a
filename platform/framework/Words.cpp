#include "framework/Words.h"

namespace Quillets::Cli {

using CallSpec::ParameterType;

const ParameterTypeWords& WordsFor(ParameterType type)
{
    struct Row {
        ParameterType type;
        ParameterTypeWords words;
    };
    static constexpr Row kRows[] = {
        {ParameterType::String, {"a string", " <str>", "str"}},
        {ParameterType::Int, {"an integer", " <long>", "long"}},
        {ParameterType::Bool, {"a boolean", " <bool>", "bool"}},
        {ParameterType::Flag, {"a flag", "", ""}},
        {ParameterType::StringList, {"a string list", " <str>[,<str>...]", "str[,str...]"}},
    };
    static constexpr ParameterTypeWords kUnknown{"an unknown type", " <str>", "str"};
    for (const auto& row : kRows) {
        if (row.type == type) {
            return row.words;
        }
    }
    return kUnknown;
}

} // namespace Quillets::Cli

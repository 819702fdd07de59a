#pragma once

#include <string>
#include <string_view>

namespace HostCtl {

extern const std::string emptyString;

namespace Misc {

// printf-style formatting into a std::string.
std::string StrPrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));

template <typename... Parts>
std::string StrCat(const Parts&... parts)
{
    std::string result;
    (result.append(std::string_view(parts)), ...);
    return result;
}

} // namespace Misc
} // namespace HostCtl

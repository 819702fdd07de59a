#include "framework/Text.h"

namespace Quillets::Cli::Text {

void AppendEscaped(std::string& out, std::string_view text)
{
    static const char* const kHex = "0123456789abcdef";
    for (const char c : text) {
        const auto byte = static_cast<unsigned char>(c);
        if (byte >= 0x20 && byte != 0x7f) {
            out += c;
        } else if (c == '\n') {
            out += "\\n";
        } else if (c == '\t') {
            out += "\\t";
        } else if (c == '\r') {
            out += "\\r";
        } else {
            out += "\\x";
            out += kHex[byte >> 4];
            out += kHex[byte & 0xf];
        }
    }
}

std::string EscapeControl(const std::string& text)
{
    std::string escaped;
    escaped.reserve(text.size());
    AppendEscaped(escaped, text);
    return escaped;
}

std::size_t EscapedWidth(std::string_view text)
{
    std::size_t width = 0;
    for (const char c : text) {
        const auto byte = static_cast<unsigned char>(c);
        if (byte < 0x20 || byte == 0x7f) {
            // Escapes are plain ASCII: \n, \t, \r take two columns, \xHH four.
            width += (c == '\n' || c == '\t' || c == '\r') ? 2 : 4;
        } else if ((byte & 0xc0) != 0x80) {
            ++width;
        }
    }
    return width;
}

std::size_t DisplayWidth(const std::string& text)
{
    std::size_t width = 0;
    for (const char c : text) {
        // Continuation bytes (10xxxxxx) belong to the code point already counted.
        if ((static_cast<unsigned char>(c) & 0xc0) != 0x80) {
            ++width;
        }
    }
    return width;
}

std::string Trim(const std::string& text)
{
    const auto first = text.find_first_not_of(" \t");
    if (first == std::string::npos) {
        return {};
    }
    const auto last = text.find_last_not_of(" \t");
    return text.substr(first, last - first + 1);
}

std::vector<std::string> SplitCommas(const std::string& text)
{
    std::vector<std::string> parts;
    std::size_t start = 0;
    while (true) {
        const auto comma = text.find(',', start);
        if (comma == std::string::npos) {
            parts.push_back(text.substr(start));
            return parts;
        }
        parts.push_back(text.substr(start, comma - start));
        start = comma + 1;
    }
}

std::string Join(const std::vector<std::string>& parts, const std::string& separator)
{
    std::string joined;
    for (std::size_t i = 0; i < parts.size(); ++i) {
        if (i != 0) {
            joined += separator;
        }
        joined += parts[i];
    }
    return joined;
}

} // namespace Quillets::Cli::Text

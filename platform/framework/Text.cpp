#include "framework/Text.h"

#include <locale.h>
#include <wchar.h>

#include <algorithm>

namespace Quillets::Cli::Text {

std::optional<char32_t> NextCodePoint(std::string_view text, std::size_t& pos)
{
    const auto byte = [&](std::size_t i) { return static_cast<unsigned char>(text[i]); };
    const unsigned char lead = byte(pos);
    std::size_t length = 0;
    char32_t value = 0;
    char32_t minimum = 0;
    if (lead < 0x80) {
        ++pos;
        return lead;
    }
    if ((lead & 0xe0) == 0xc0) {
        length = 2, value = lead & 0x1f, minimum = 0x80;
    } else if ((lead & 0xf0) == 0xe0) {
        length = 3, value = lead & 0x0f, minimum = 0x800;
    } else if ((lead & 0xf8) == 0xf0) {
        length = 4, value = lead & 0x07, minimum = 0x10000;
    } else {
        ++pos;
        return std::nullopt;
    }
    if (pos + length > text.size()) {
        ++pos;
        return std::nullopt;
    }
    for (std::size_t i = 1; i < length; ++i) {
        if ((byte(pos + i) & 0xc0) != 0x80) {
            ++pos;
            return std::nullopt;
        }
        value = (value << 6) | (byte(pos + i) & 0x3f);
    }
    if (value < minimum || value > 0x10ffff || (value >= 0xd800 && value <= 0xdfff)) {
        ++pos;
        return std::nullopt;
    }
    pos += length;
    return value;
}

namespace {

// Code points that a terminal may take as a command or a line break rather than as text.
bool IsControl(char32_t c) { return c < 0x20 || (c >= 0x7f && c <= 0x9f) || c == 0x2028 || c == 0x2029; }

// The terminal columns of a printable code point, from the C library's character tables
// in a UTF-8 locale of this thread only: wide East Asian characters take two, combining
// marks none. Without that locale every code point takes one column.
class WidthTable {
public:
    WidthTable() : locale_(::newlocale(LC_CTYPE_MASK, "C.UTF-8", locale_t{})) {}
    ~WidthTable()
    {
        if (locale_ != locale_t{}) {
            ::freelocale(locale_);
        }
    }
    WidthTable(const WidthTable&) = delete;
    WidthTable& operator=(const WidthTable&) = delete;

    static const WidthTable& Get()
    {
        static const WidthTable table;
        return table;
    }
    locale_t Locale() const { return locale_; }

private:
    locale_t locale_;
};

// Measures with the UTF-8 locale in effect on this thread, and restores the caller's.
class Measure {
public:
    Measure() : locale_(WidthTable::Get().Locale())
    {
        if (locale_ != locale_t{}) {
            previous_ = ::uselocale(locale_);
        }
    }
    ~Measure()
    {
        if (locale_ != locale_t{}) {
            ::uselocale(previous_);
        }
    }
    Measure(const Measure&) = delete;
    Measure& operator=(const Measure&) = delete;

    std::size_t Columns(char32_t c) const
    {
        if (locale_ == locale_t{} || c < 0x7f) {
            return 1;
        }
        const int width = ::wcwidth(static_cast<wchar_t>(c));
        // Characters the tables do not know (newer than they are) show as one column.
        return width < 0 ? 1 : static_cast<std::size_t>(width);
    }

private:
    locale_t locale_;
    locale_t previous_{};
};

// Printable ASCII, the common case, needs neither decoding nor escapes.
bool IsPlainAscii(std::string_view text)
{
    return std::all_of(text.begin(), text.end(), [](char c) {
        const auto byte = static_cast<unsigned char>(c);
        return byte >= 0x20 && byte < 0x7f;
    });
}

constexpr std::size_t kHexEscapeWidth = 4; // \xHH

void AppendHex(std::string& out, unsigned char byte)
{
    static const char* const kHex = "0123456789abcdef";
    out += "\\x";
    out += kHex[byte >> 4];
    out += kHex[byte & 0xf];
}

} // namespace

void AppendEscaped(std::string& out, std::string_view text)
{
    if (IsPlainAscii(text)) {
        out.append(text);
        return;
    }
    std::size_t pos = 0;
    while (pos < text.size()) {
        const std::size_t start = pos;
        const auto c = NextCodePoint(text, pos);
        if (c && !IsControl(*c)) {
            out.append(text.substr(start, pos - start));
        } else if (c == U'\n') {
            out += "\\n";
        } else if (c == U'\t') {
            out += "\\t";
        } else if (c == U'\r') {
            out += "\\r";
        } else {
            // Controls and bytes that are not UTF-8 show as the bytes they are.
            for (std::size_t i = start; i < pos; ++i) {
                AppendHex(out, static_cast<unsigned char>(text[i]));
            }
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
    if (IsPlainAscii(text)) {
        return text.size();
    }
    const Measure measure;
    std::size_t width = 0;
    std::size_t pos = 0;
    while (pos < text.size()) {
        const std::size_t start = pos;
        const auto c = NextCodePoint(text, pos);
        if (c && !IsControl(*c)) {
            width += measure.Columns(*c);
        } else if (c && (*c == U'\n' || *c == U'\t' || *c == U'\r')) {
            width += 2;
        } else {
            width += kHexEscapeWidth * (pos - start);
        }
    }
    return width;
}

std::size_t DisplayWidth(const std::string& text)
{
    const Measure measure;
    std::size_t width = 0;
    std::size_t pos = 0;
    while (pos < text.size()) {
        const auto c = NextCodePoint(text, pos);
        width += c ? measure.Columns(*c) : 1;
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

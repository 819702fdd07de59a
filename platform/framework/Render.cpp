#include "framework/Render.h"

#include <algorithm>
#include <charconv>

#include <nlohmann/json.hpp>

#include "framework/Suggest.h"
#include "framework/Text.h"
#include "framework/Words.h"

namespace Quillets::Cli {

using MetaObj::MetaBool;
using MetaObj::MetaInt;
using MetaObj::MetaList;
using MetaObj::MetaObject;
using MetaObj::MetaString;
using MetaObj::MetaStruct;
using MetaObj::MetaType;

std::optional<Formatter> ParseFormatter(const std::string& name)
{
    static constexpr Spelling<Formatter> kNames[] = {
        {Formatter::Table, "table"}, {Formatter::Simple, "simple"}, {Formatter::Json, "json"}, {Formatter::Csv, "csv"}};
    return ValueFor(kNames, name);
}

Formatter EffectiveFormatter(const OutputHints& hints, const OutputOptions& options)
{
    if (auto chosen = ParseFormatter(options.formatter)) {
        return *chosen;
    }
    return ParseFormatter(hints.defaultFormatter).value_or(Formatter::Simple);
}

namespace {

std::shared_ptr<MetaStruct> ShapeOfValue(const std::shared_ptr<MetaObject>& value)
{
    if (!value) {
        return nullptr;
    }
    if (value->GetType() == MetaType::Struct) {
        return std::dynamic_pointer_cast<MetaStruct>(value);
    }
    if (value->GetType() == MetaType::List) {
        auto list = std::dynamic_pointer_cast<MetaList>(value);
        if (!list) {
            return nullptr;
        }
        if (list->GetPrototype()) {
            return list->GetPrototype();
        }
        return list->GetElements().empty() ? nullptr : list->GetElements().front();
    }
    return nullptr;
}

// The rows of a result: a list's elements, or the one structure.
struct Rows {
    const std::shared_ptr<MetaStruct>* first = nullptr;
    std::size_t count = 0;
    std::shared_ptr<MetaStruct> single;

    // A single structure is its own row (looked up on each call: Rows may be moved).
    const std::shared_ptr<MetaStruct>* begin() const { return single ? &single : first; }
    const std::shared_ptr<MetaStruct>* end() const { return begin() + count; }
};

Rows RowsOf(const std::shared_ptr<MetaObject>& result)
{
    Rows rows;
    if (!result) {
        return rows;
    }
    if (result->GetType() == MetaType::List) {
        if (auto* list = dynamic_cast<const MetaList*>(result.get())) {
            rows.first = list->GetElements().data();
            rows.count = list->GetElements().size();
        }
    } else if (auto single = std::dynamic_pointer_cast<MetaStruct>(result)) {
        rows.single = std::move(single);
        rows.count = 1;
    }
    return rows;
}

// Every field title: the structure's, in its order, then any a row added beyond it.
std::vector<std::string> AllFields(const std::shared_ptr<MetaStruct>& shape, const Rows& rows)
{
    std::vector<std::string> titles;
    std::size_t lastCount = MetaStruct::npos;
    auto add = [&](const MetaStruct* structure) {
        if (!structure) {
            return;
        }
        const std::size_t count = structure->GetFieldCount();
        // Rows of one shape add nothing new: only their titles' positions need a look.
        if (count == lastCount && count <= titles.size()) {
            bool same = true;
            for (std::size_t i = 0; i < count && same; ++i) {
                same = structure->GetFieldTitle(i) == titles[i];
            }
            if (same) {
                return;
            }
        }
        lastCount = count;
        for (std::size_t i = 0; i < count; ++i) {
            const auto& title = structure->GetFieldTitle(i);
            if (std::find(titles.begin(), titles.end(), title) == titles.end()) {
                titles.push_back(title);
            }
        }
    };
    add(shape.get());
    for (const auto& row : rows) {
        add(row.get());
    }
    return titles;
}

// A "fields:" hint: titles separated by commas, blanks around them ignored. Titles the
// structure does not have are left out; so are repeats.
std::vector<std::string> HintedFields(const std::string& hint, const std::vector<std::string>& known)
{
    std::vector<std::string> titles;
    for (const auto& part : Text::SplitCommas(hint)) {
        const auto title = Text::Trim(part);
        if (std::find(known.begin(), known.end(), title) != known.end() &&
            std::find(titles.begin(), titles.end(), title) == titles.end()) {
            titles.push_back(title);
        }
    }
    return titles;
}

const std::string* FindHint(const OutputHints& hints, const std::string& key)
{
    auto found = hints.parameters.find(key);
    return found == hints.parameters.end() ? nullptr : &found->second;
}

} // namespace

std::shared_ptr<MetaStruct> RowShape(const std::shared_ptr<MetaObject>& result,
                                     const std::shared_ptr<MetaObject>& declared)
{
    if (auto shape = ShapeOfValue(declared)) {
        return shape;
    }
    return ShapeOfValue(result);
}

std::string CheckFieldSelection(const std::shared_ptr<MetaObject>& declared, const std::vector<std::string>& fields)
{
    const auto shape = ShapeOfValue(declared);
    if (!shape) {
        return "this command's result has no fields to choose from.";
    }
    const auto known = AllFields(shape, Rows{});
    std::vector<std::string> seen;
    for (const auto& title : fields) {
        if (std::find(known.begin(), known.end(), title) == known.end()) {
            return "unknown field '" + Text::EscapeControl(title) + "'; the fields of " + shape->GetName() +
                   " are: " + Text::Join(known, ", ") + "." + DidYouMean(title, known);
        }
        if (std::find(seen.begin(), seen.end(), title) != seen.end()) {
            return "field '" + Text::EscapeControl(title) + "' is chosen twice.";
        }
        seen.push_back(title);
    }
    return {};
}

namespace {

// What the formatters print: the columns and where each column's value sits in a row.
struct Layout {
    enum class Shape { Nothing, Bool, Scalar, Single, List };

    Shape shape = Shape::Nothing;
    std::shared_ptr<MetaStruct> shape_;
    Rows rows;
    std::vector<std::string> titles;
    std::vector<std::string> units; // "" for none
    const std::string* header = nullptr;
};

// One value as printed: its kind and its text (numbers are written into `digits`).
struct CellText {
    MetaType type = MetaType::String;
    bool boolean = false;
    std::int64_t number = 0;
    std::string_view text;
    char digits[24];

    CellText() = default;
    CellText(const CellText&) = delete;
    CellText& operator=(const CellText&) = delete;

    void From(const MetaStruct::FieldRef& ref)
    {
        type = ref.type;
        boolean = ref.boolean;
        number = ref.number;
        switch (type) {
        case MetaType::Bool:
            text = boolean ? "true" : "false";
            break;
        case MetaType::Int: {
            const auto end = std::to_chars(digits, digits + sizeof digits, number).ptr;
            text = std::string_view(digits, static_cast<std::size_t>(end - digits));
            break;
        }
        case MetaType::String:
            text = ref.text ? std::string_view(*ref.text) : std::string_view();
            break;
        default:
            // Structures hold only plain values; anything else shows as empty text.
            type = MetaType::String;
            text = {};
            break;
        }
    }
};

// Reads the cells of rows column by column; rows of one shape find their fields at once.
class CellReader {
public:
    explicit CellReader(const Layout& layout) : layout_(layout), hints_(layout.titles.size(), 0) {}

    // A field the row lacks shows the declared structure's empty value of its kind.
    void Read(const MetaStruct* row, std::size_t column, CellText& cell)
    {
        const auto& title = layout_.titles[column];
        if (row) {
            const std::size_t at = row->FindField(title, hints_[column]);
            if (at != MetaStruct::npos) {
                hints_[column] = at;
                cell.From(row->GetFieldRef(at));
                return;
            }
        }
        if (layout_.shape_) {
            const std::size_t at = layout_.shape_->FindField(title);
            if (at != MetaStruct::npos) {
                cell.From(layout_.shape_->GetFieldRef(at));
                return;
            }
        }
        cell.From(MetaStruct::FieldRef{});
    }

private:
    const Layout& layout_;
    std::vector<std::size_t> hints_;
};

Layout Describe(const std::shared_ptr<MetaObject>& result, const std::shared_ptr<MetaObject>& declared,
                const OutputHints& hints, const OutputOptions& options, Formatter formatter)
{
    Layout layout;
    if (!result) {
        return layout;
    }
    switch (result->GetType()) {
    case MetaType::Bool:
        layout.shape = Layout::Shape::Bool;
        return layout;
    case MetaType::Int:
    case MetaType::String:
        layout.shape = Layout::Shape::Scalar;
        return layout;
    case MetaType::Struct:
        layout.shape = Layout::Shape::Single;
        break;
    case MetaType::List:
        layout.shape = Layout::Shape::List;
        break;
    }

    layout.shape_ = RowShape(result, declared);
    layout.rows = RowsOf(result);
    const auto known = AllFields(layout.shape_, layout.rows);
    const std::string structName = layout.shape_ ? layout.shape_->GetName() : std::string();

    auto& titles = layout.titles;
    if (options.fields) {
        for (const auto& title : *options.fields) {
            if (std::find(titles.begin(), titles.end(), title) == titles.end()) {
                titles.push_back(title);
            }
        }
    } else if (const auto* hint = FindHint(hints, "fields:" + structName); hint && formatter != Formatter::Json) {
        titles = HintedFields(*hint, known);
    }
    if (titles.empty()) {
        titles = known;
    }
    for (const auto& title : titles) {
        const auto* unit = FindHint(hints, "units:" + structName + "." + title);
        layout.units.push_back(unit ? *unit : std::string());
    }
    layout.header = FindHint(hints, "header:" + structName);
    return layout;
}

// The value of a scalar result, as a cell.
void ScalarCell(const MetaObject& result, CellText& cell, std::string& text)
{
    MetaStruct::FieldRef ref;
    ref.type = result.GetType();
    if (ref.type == MetaType::Int) {
        ref.number = static_cast<const MetaInt&>(result).GetValue();
    } else {
        text = static_cast<const MetaString&>(result).GetValue();
        ref.text = &text;
    }
    cell.From(ref);
}

// Replaces every %Field Title% by that field's value; unknown titles stay as written.
std::string ExpandHeading(const std::string& pattern, const MetaStruct* row)
{
    std::string heading;
    std::size_t pos = 0;
    CellText cell;
    while (pos < pattern.size()) {
        const auto open = pattern.find('%', pos);
        if (open == std::string::npos) {
            break;
        }
        const auto close = pattern.find('%', open + 1);
        if (close == std::string::npos) {
            break;
        }
        const auto title = pattern.substr(open + 1, close - open - 1);
        heading += pattern.substr(pos, open - pos);
        const std::size_t at = row ? row->FindField(title) : MetaStruct::npos;
        if (at != MetaStruct::npos) {
            cell.From(row->GetFieldRef(at));
            heading += cell.text;
            pos = close + 1;
        } else {
            heading += '%';
            pos = open + 1;
        }
    }
    heading += pattern.substr(pos);
    return heading;
}

// Collects printed text and hands it on in large pieces.
class Printer {
public:
    explicit Printer(const TextSink& sink) : sink_(sink) { buffer_.reserve(kChunk + 4096); }
    ~Printer() { Flush(); }
    Printer(const Printer&) = delete;
    Printer& operator=(const Printer&) = delete;

    std::string& Text() { return buffer_; }
    // Call after each line: passes the text on once enough has gathered.
    void Line()
    {
        if (buffer_.size() >= kChunk) {
            Flush();
        }
    }
    void Flush()
    {
        if (!buffer_.empty()) {
            sink_(buffer_);
            buffer_.clear();
        }
    }

private:
    static constexpr std::size_t kChunk = std::size_t{64} * 1024;
    const TextSink& sink_;
    std::string buffer_;
};

void PrintTable(Printer& printer, const Layout& layout, bool showHeader)
{
    const std::size_t count = layout.titles.size();
    if (count == 0) {
        return;
    }
    // First pass: the width of every column, measured without keeping any cell.
    std::vector<std::size_t> widths(count, 0);
    if (showHeader) {
        for (std::size_t i = 0; i < count; ++i) {
            widths[i] = Text::EscapedWidth(layout.titles[i]);
        }
    }
    CellReader reader(layout);
    CellText cell;
    for (const auto& row : layout.rows) {
        for (std::size_t i = 0; i < count; ++i) {
            reader.Read(row.get(), i, cell);
            widths[i] = std::max(widths[i], Text::EscapedWidth(cell.text));
        }
    }

    std::string& out = printer.Text();
    // Cells are padded to their column's width; a line carries no blanks at its end.
    auto emit = [&](auto&& cellText) {
        const std::size_t start = out.size();
        for (std::size_t i = 0; i < count; ++i) {
            if (i != 0) {
                out += "  ";
            }
            const std::string_view text = cellText(i);
            Text::AppendEscaped(out, text);
            out.append(widths[i] - Text::EscapedWidth(text), ' ');
        }
        while (out.size() > start && out.back() == ' ') {
            out.pop_back();
        }
        out += '\n';
        printer.Line();
    };
    if (showHeader) {
        emit([&](std::size_t i) { return std::string_view(layout.titles[i]); });
        std::string dashes;
        emit([&](std::size_t i) {
            dashes.assign(widths[i], '-');
            return std::string_view(dashes);
        });
    }
    for (const auto& row : layout.rows) {
        emit([&](std::size_t i) {
            reader.Read(row.get(), i, cell);
            return cell.text;
        });
    }
}

void PrintSimple(Printer& printer, const Layout& layout)
{
    std::string& out = printer.Text();
    CellReader reader(layout);
    CellText cell;
    bool first = true;
    for (const auto& row : layout.rows) {
        if (!first) {
            out += '\n';
        }
        first = false;
        std::string_view indent = "   ";
        if (layout.header) {
            Text::AppendEscaped(out, ExpandHeading(*layout.header, row.get()));
            out += '\n';
            indent = "      ";
        }
        for (std::size_t i = 0; i < layout.titles.size(); ++i) {
            reader.Read(row.get(), i, cell);
            out += indent;
            Text::AppendEscaped(out, layout.titles[i]);
            out += ": ";
            Text::AppendEscaped(out, cell.text);
            if (!layout.units[i].empty()) {
                out += ' ';
                out += layout.units[i];
            }
            out += '\n';
        }
        printer.Line();
    }
}

// json prints one value, indented by two blanks, object keys in column order; text
// that is not valid UTF-8 has its bad bytes replaced, so the output always parses.
using Json = nlohmann::ordered_json;

Json CellJson(const CellText& cell)
{
    switch (cell.type) {
    case MetaType::Bool:
        return cell.boolean;
    case MetaType::Int:
        return cell.number;
    default:
        return std::string(cell.text);
    }
}

std::string DumpJson(const Json& value) { return value.dump(2, ' ', false, nlohmann::json::error_handler_t::replace); }

void PrintJson(Printer& printer, const Layout& layout, const MetaObject& result)
{
    std::string& out = printer.Text();
    CellReader reader(layout);
    CellText cell;
    auto rowJson = [&](const MetaStruct* row) {
        Json object = Json::object();
        for (std::size_t i = 0; i < layout.titles.size(); ++i) {
            reader.Read(row, i, cell);
            object[layout.titles[i]] = CellJson(cell);
        }
        return object;
    };

    switch (layout.shape) {
    case Layout::Shape::Nothing:
        return;
    case Layout::Shape::Bool:
        out += static_cast<const MetaBool&>(result).GetValue() ? "true" : "false";
        break;
    case Layout::Shape::Scalar: {
        std::string text;
        ScalarCell(result, cell, text);
        out += DumpJson(CellJson(cell));
        break;
    }
    case Layout::Shape::Single:
        out += DumpJson(layout.rows.count == 0 ? Json::object() : rowJson(layout.rows.begin()->get()));
        break;
    case Layout::Shape::List:
        if (layout.rows.count == 0) {
            out += "[]";
            break;
        }
        // The array is written element by element, each indented one level.
        out += "[\n";
        for (const auto& row : layout.rows) {
            if (&row != layout.rows.begin()) {
                out += ",\n";
            }
            out += "  ";
            for (const char c : DumpJson(rowJson(row.get()))) {
                out += c;
                if (c == '\n') {
                    out += "  ";
                }
            }
            printer.Line();
        }
        out += "\n]";
        break;
    }
    out += '\n';
}

// RFC 4180 quoting; lines end in a plain line feed, as scripts on this host expect.
void AppendCsvField(std::string& out, std::string_view text)
{
    if (text.find_first_of(",\"\r\n") == std::string_view::npos) {
        out += text;
        return;
    }
    out += '"';
    for (const char c : text) {
        if (c == '"') {
            out += '"';
        }
        out += c;
    }
    out += '"';
}

void PrintCsv(Printer& printer, const Layout& layout, bool showHeader)
{
    const std::size_t count = layout.titles.size();
    if (count == 0) {
        return;
    }
    std::string& out = printer.Text();
    auto emit = [&](auto&& cellText) {
        for (std::size_t i = 0; i < count; ++i) {
            if (i != 0) {
                out += ',';
            }
            AppendCsvField(out, cellText(i));
        }
        out += '\n';
        printer.Line();
    };
    if (showHeader) {
        emit([&](std::size_t i) { return std::string_view(layout.titles[i]); });
    }
    CellReader reader(layout);
    CellText cell;
    for (const auto& row : layout.rows) {
        emit([&](std::size_t i) {
            reader.Read(row.get(), i, cell);
            return cell.text;
        });
    }
}

} // namespace

void RenderResultTo(const TextSink& sink, const std::shared_ptr<MetaObject>& result,
                    const std::shared_ptr<MetaObject>& declared, const OutputHints& hints, const OutputOptions& options)
{
    const Formatter formatter = EffectiveFormatter(hints, options);
    const Layout layout = Describe(result, declared, hints, options, formatter);
    if (layout.shape == Layout::Shape::Nothing) {
        return;
    }
    Printer printer(sink);
    if (formatter == Formatter::Json) {
        PrintJson(printer, layout, *result);
        return;
    }
    if (layout.shape == Layout::Shape::Scalar) {
        CellText cell;
        std::string text;
        ScalarCell(*result, cell, text);
        if (formatter == Formatter::Csv) {
            AppendCsvField(printer.Text(), cell.text);
        } else {
            Text::AppendEscaped(printer.Text(), cell.text);
        }
        printer.Text() += '\n';
        return;
    }
    if (layout.shape == Layout::Shape::Bool) {
        return;
    }
    switch (formatter) {
    case Formatter::Table:
        PrintTable(printer, layout, options.showHeader);
        break;
    case Formatter::Simple:
        PrintSimple(printer, layout);
        break;
    case Formatter::Csv:
        PrintCsv(printer, layout, options.showHeader);
        break;
    case Formatter::Json:
        break;
    }
}

std::string RenderResult(const std::shared_ptr<MetaObject>& result, const std::shared_ptr<MetaObject>& declared,
                         const OutputHints& hints, const OutputOptions& options)
{
    std::string out;
    RenderResultTo([&](std::string_view text) { out += text; }, result, declared, hints, options);
    return out;
}

} // namespace Quillets::Cli

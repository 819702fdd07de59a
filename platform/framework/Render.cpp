#include "framework/Render.h"

#include <algorithm>

#include <nlohmann/json.hpp>

#include "framework/Text.h"

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
    if (name == "table") {
        return Formatter::Table;
    }
    if (name == "simple") {
        return Formatter::Simple;
    }
    if (name == "json") {
        return Formatter::Json;
    }
    if (name == "csv") {
        return Formatter::Csv;
    }
    return std::nullopt;
}

const char* FormatterName(Formatter formatter)
{
    switch (formatter) {
    case Formatter::Table:
        return "table";
    case Formatter::Simple:
        return "simple";
    case Formatter::Json:
        return "json";
    case Formatter::Csv:
        return "csv";
    }
    return "simple";
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
std::vector<std::shared_ptr<MetaStruct>> RowsOf(const std::shared_ptr<MetaObject>& result)
{
    if (auto list = std::dynamic_pointer_cast<MetaList>(result)) {
        return list->GetElements();
    }
    if (auto single = std::dynamic_pointer_cast<MetaStruct>(result)) {
        return {single};
    }
    return {};
}

// Every field title: the structure's, in its order, then any a row added beyond it.
std::vector<std::string> AllFields(const std::shared_ptr<MetaStruct>& shape,
                                   const std::vector<std::shared_ptr<MetaStruct>>& rows)
{
    std::vector<std::string> titles;
    auto add = [&](const std::shared_ptr<MetaStruct>& structure) {
        if (!structure) {
            return;
        }
        for (const auto& field : structure->GetFields()) {
            if (std::find(titles.begin(), titles.end(), field.first) == titles.end()) {
                titles.push_back(field.first);
            }
        }
    };
    add(shape);
    for (const auto& row : rows) {
        add(row);
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

Cell MakeCell(const std::shared_ptr<MetaObject>& value)
{
    Cell cell;
    if (!value) {
        return cell;
    }
    cell.type = value->GetType();
    switch (cell.type) {
    case MetaType::Bool:
        cell.boolean = static_cast<const MetaBool&>(*value).GetValue();
        cell.text = cell.boolean ? "true" : "false";
        break;
    case MetaType::Int:
        cell.number = static_cast<const MetaInt&>(*value).GetValue();
        cell.text = std::to_string(cell.number);
        break;
    case MetaType::String:
        cell.text = static_cast<const MetaString&>(*value).GetValue();
        break;
    default:
        // Structures hold only plain values; anything else shows as empty text.
        cell.type = MetaType::String;
        break;
    }
    return cell;
}

// A field the row lacks shows the declared structure's empty value of its kind.
Cell CellOf(const std::shared_ptr<MetaStruct>& row, const std::shared_ptr<MetaStruct>& shape, const std::string& title)
{
    auto value = row ? row->GetField(title) : nullptr;
    if (!value && shape) {
        value = shape->GetField(title);
    }
    return MakeCell(value);
}

// Replaces every %Field Title% by that field's value; unknown titles stay as written.
std::string ExpandHeading(const std::string& pattern, const std::shared_ptr<MetaStruct>& row)
{
    std::string heading;
    std::size_t pos = 0;
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
        if (row && row->HasField(title)) {
            heading += MakeCell(row->GetField(title)).text;
            pos = close + 1;
        } else {
            heading += '%';
            pos = open + 1;
        }
    }
    heading += pattern.substr(pos);
    return heading;
}

const std::string* FindHint(const OutputHints& hints, const std::string& key)
{
    auto found = hints.parameters.find(key);
    return found == hints.parameters.end() ? nullptr : &found->second;
}

std::string RightTrim(std::string line)
{
    while (!line.empty() && line.back() == ' ') {
        line.pop_back();
    }
    return line;
}

} // namespace

std::shared_ptr<MetaStruct> RowShape(const std::shared_ptr<MetaObject>& result, const std::shared_ptr<MetaObject>& declared)
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
        return "this command's result has no fields to choose from";
    }
    const auto known = AllFields(shape, {});
    std::vector<std::string> seen;
    for (const auto& title : fields) {
        if (std::find(known.begin(), known.end(), title) == known.end()) {
            return "unknown field '" + Text::EscapeControl(title) + "'; the fields of " + shape->GetName() + " are: " +
                   Text::Join(known, ", ");
        }
        if (std::find(seen.begin(), seen.end(), title) != seen.end()) {
            return "field '" + title + "' is chosen twice";
        }
        seen.push_back(title);
    }
    return {};
}

ResultView BuildView(const std::shared_ptr<MetaObject>& result, const std::shared_ptr<MetaObject>& declared,
                     const OutputHints& hints, const OutputOptions& options, Formatter formatter)
{
    ResultView view;
    if (!result) {
        return view;
    }
    switch (result->GetType()) {
    case MetaType::Bool:
        view.shape = ResultView::Shape::Bool;
        view.boolValue = static_cast<const MetaBool&>(*result).GetValue();
        return view;
    case MetaType::Int:
    case MetaType::String:
        view.shape = ResultView::Shape::Scalar;
        view.scalar = MakeCell(result);
        return view;
    case MetaType::Struct:
        view.shape = ResultView::Shape::Single;
        break;
    case MetaType::List:
        view.shape = ResultView::Shape::List;
        break;
    }

    const auto shape = RowShape(result, declared);
    const auto rows = RowsOf(result);
    const auto known = AllFields(shape, rows);
    const std::string structName = shape ? shape->GetName() : std::string();

    std::vector<std::string> titles;
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
        Column column{title, {}};
        if (const auto* unit = FindHint(hints, "units:" + structName + "." + title)) {
            column.unit = *unit;
        }
        view.columns.push_back(std::move(column));
    }

    const auto* header = FindHint(hints, "header:" + structName);
    for (const auto& row : rows) {
        ResultView::Row line;
        if (header) {
            line.heading = ExpandHeading(*header, row);
        }
        for (const auto& title : titles) {
            line.cells.push_back(CellOf(row, shape, title));
        }
        view.rows.push_back(std::move(line));
    }
    return view;
}

std::string RenderTable(const ResultView& view, bool showHeader)
{
    if (view.shape == ResultView::Shape::Scalar) {
        return Text::EscapeControl(view.scalar.text) + "\n";
    }
    if ((view.shape != ResultView::Shape::Single && view.shape != ResultView::Shape::List) || view.columns.empty()) {
        return {};
    }
    const std::size_t count = view.columns.size();
    std::vector<std::vector<std::string>> cells;
    for (const auto& row : view.rows) {
        std::vector<std::string> line;
        for (const auto& cell : row.cells) {
            line.push_back(Text::EscapeControl(cell.text));
        }
        cells.push_back(std::move(line));
    }
    std::vector<std::string> titles;
    for (const auto& column : view.columns) {
        titles.push_back(Text::EscapeControl(column.title));
    }
    std::vector<std::size_t> widths(count, 0);
    auto measure = [&](const std::vector<std::string>& line) {
        for (std::size_t i = 0; i < count; ++i) {
            widths[i] = std::max(widths[i], Text::DisplayWidth(line[i]));
        }
    };
    if (showHeader) {
        measure(titles);
    }
    for (const auto& line : cells) {
        measure(line);
    }

    std::string out;
    auto emit = [&](const std::vector<std::string>& line) {
        std::string text;
        for (std::size_t i = 0; i < count; ++i) {
            if (i != 0) {
                text += "  ";
            }
            text += line[i];
            text.append(widths[i] - Text::DisplayWidth(line[i]), ' ');
        }
        out += RightTrim(std::move(text)) + "\n";
    };
    if (showHeader) {
        emit(titles);
        std::vector<std::string> dashes;
        for (const auto width : widths) {
            dashes.emplace_back(width, '-');
        }
        emit(dashes);
    }
    for (const auto& line : cells) {
        emit(line);
    }
    return out;
}

std::string RenderSimple(const ResultView& view)
{
    if (view.shape == ResultView::Shape::Scalar) {
        return Text::EscapeControl(view.scalar.text) + "\n";
    }
    if (view.shape != ResultView::Shape::Single && view.shape != ResultView::Shape::List) {
        return {};
    }
    std::string out;
    bool first = true;
    for (const auto& row : view.rows) {
        if (!first) {
            out += "\n";
        }
        first = false;
        std::string indent = "   ";
        if (row.heading) {
            out += Text::EscapeControl(*row.heading) + "\n";
            indent += "   ";
        }
        for (std::size_t i = 0; i < view.columns.size(); ++i) {
            const auto& column = view.columns[i];
            std::string line = indent + Text::EscapeControl(column.title) + ": " + Text::EscapeControl(row.cells[i].text);
            if (!column.unit.empty()) {
                line += " " + column.unit;
            }
            out += line + "\n";
        }
    }
    return out;
}

// json prints one value, indented by two blanks, object keys in column order; text
// that is not valid UTF-8 has its bad bytes replaced, so the output always parses.
std::string RenderJson(const ResultView& view)
{
    using Json = nlohmann::ordered_json;
    auto cellJson = [](const Cell& cell) -> Json {
        switch (cell.type) {
        case MetaType::Bool:
            return cell.boolean;
        case MetaType::Int:
            return cell.number;
        default:
            return cell.text;
        }
    };
    auto rowJson = [&](const ResultView::Row& row) {
        Json object = Json::object();
        for (std::size_t i = 0; i < view.columns.size(); ++i) {
            object[view.columns[i].title] = cellJson(row.cells[i]);
        }
        return object;
    };

    Json value;
    switch (view.shape) {
    case ResultView::Shape::Nothing:
        return {};
    case ResultView::Shape::Bool:
        value = view.boolValue;
        break;
    case ResultView::Shape::Scalar:
        value = cellJson(view.scalar);
        break;
    case ResultView::Shape::Single:
        value = view.rows.empty() ? Json::object() : rowJson(view.rows.front());
        break;
    case ResultView::Shape::List:
        value = Json::array();
        for (const auto& row : view.rows) {
            value.push_back(rowJson(row));
        }
        break;
    }
    return value.dump(2, ' ', false, nlohmann::json::error_handler_t::replace) + "\n";
}

namespace {

// RFC 4180 quoting; lines end in a plain line feed, as scripts on this host expect.
std::string CsvField(const std::string& text)
{
    if (text.find_first_of(",\"\r\n") == std::string::npos) {
        return text;
    }
    std::string quoted = "\"";
    for (const char c : text) {
        if (c == '"') {
            quoted += '"';
        }
        quoted += c;
    }
    return quoted + "\"";
}

} // namespace

std::string RenderCsv(const ResultView& view, bool showHeader)
{
    if (view.shape == ResultView::Shape::Scalar) {
        return CsvField(view.scalar.text) + "\n";
    }
    if ((view.shape != ResultView::Shape::Single && view.shape != ResultView::Shape::List) || view.columns.empty()) {
        return {};
    }
    std::string out;
    auto emit = [&](auto&& textOf) {
        for (std::size_t i = 0; i < view.columns.size(); ++i) {
            if (i != 0) {
                out += ",";
            }
            out += CsvField(textOf(i));
        }
        out += "\n";
    };
    if (showHeader) {
        emit([&](std::size_t i) -> const std::string& { return view.columns[i].title; });
    }
    for (const auto& row : view.rows) {
        emit([&](std::size_t i) -> const std::string& { return row.cells[i].text; });
    }
    return out;
}

std::string RenderResult(const std::shared_ptr<MetaObject>& result, const std::shared_ptr<MetaObject>& declared,
                         const OutputHints& hints, const OutputOptions& options)
{
    const Formatter formatter = EffectiveFormatter(hints, options);
    const ResultView view = BuildView(result, declared, hints, options, formatter);
    switch (formatter) {
    case Formatter::Table:
        return RenderTable(view, options.showHeader);
    case Formatter::Simple:
        return RenderSimple(view);
    case Formatter::Json:
        return RenderJson(view);
    case Formatter::Csv:
        return RenderCsv(view, options.showHeader);
    }
    return {};
}

} // namespace Quillets::Cli

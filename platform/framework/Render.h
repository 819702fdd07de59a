#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "quillets/MetaObj.h"

// Turning a command's result into text. The renderers know no command: they work from
// the result, the declared output structure and the presentation hints only.
//
// Each result is first described once as a ResultView (its shape, its columns in display
// order with their units, and its rows of cells); every formatter prints from that view.
namespace Quillets::Cli {

enum class Formatter { Table, Simple, Json, Csv };

// "table", "simple", "json" or "csv"; nothing for any other name.
std::optional<Formatter> ParseFormatter(const std::string& name);
const char* FormatterName(Formatter formatter);

// What the command declared about its presentation (CommandSpec's defaults).
struct OutputHints {
    std::string defaultFormatter;                  // "" when none was declared
    std::map<std::string, std::string> parameters; // "fields:S", "header:S", "units:S.F"
};

// What the user asked for with --formatter and --format-param.
struct OutputOptions {
    std::string formatter; // "" for the command's default, else simple
    std::optional<std::vector<std::string>> fields;
    bool showHeader = true;
};

struct Cell {
    MetaObj::MetaType type = MetaObj::MetaType::String;
    std::string text; // strings; also the printed form of every kind
    bool boolean = false;
    std::int64_t number = 0;
};

struct Column {
    std::string title;
    std::string unit; // from a "units:" hint, "" for none
};

struct ResultView {
    enum class Shape { Nothing, Bool, Scalar, Single, List };
    struct Row {
        std::optional<std::string> heading; // from a "header:" hint
        std::vector<Cell> cells;            // one per column
    };

    Shape shape = Shape::Nothing;
    bool boolValue = false;
    Cell scalar;
    std::vector<Column> columns;
    std::vector<Row> rows;
};

// The formatter that applies: the user's, else the command's default, else simple.
// An unknown default falls back to simple; the user's name must have been checked.
Formatter EffectiveFormatter(const OutputHints& hints, const OutputOptions& options);

// The structure that describes the rows: the declared one (a list's prototype, or the
// structure itself), else the shape of the result. Null for booleans and nothing.
std::shared_ptr<MetaObj::MetaStruct> RowShape(const std::shared_ptr<MetaObj::MetaObject>& result,
                                              const std::shared_ptr<MetaObj::MetaObject>& declared);

// Checks the user's field selection against the declared result before anything runs.
// Returns "" when it is usable, else what is wrong with it.
std::string CheckFieldSelection(const std::shared_ptr<MetaObj::MetaObject>& declared,
                                const std::vector<std::string>& fields);

// Describes `result` for `formatter`: columns come from the user's fields, else (except
// for json, which shows every field) the "fields:" hint, else every field in structure order.
ResultView BuildView(const std::shared_ptr<MetaObj::MetaObject>& result,
                     const std::shared_ptr<MetaObj::MetaObject>& declared, const OutputHints& hints,
                     const OutputOptions& options, Formatter formatter);

std::string RenderTable(const ResultView& view, bool showHeader);
std::string RenderSimple(const ResultView& view);
std::string RenderJson(const ResultView& view);
std::string RenderCsv(const ResultView& view, bool showHeader);

// Everything autocli prints on standard output for a result ("" when nothing).
std::string RenderResult(const std::shared_ptr<MetaObj::MetaObject>& result,
                         const std::shared_ptr<MetaObj::MetaObject>& declared, const OutputHints& hints,
                         const OutputOptions& options);

} // namespace Quillets::Cli

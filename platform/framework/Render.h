#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "quillets/MetaObj.h"

// Turning a command's result into text. The renderers know no command: they work from
// the result, the declared output structure and the presentation hints only.
//
// Each result is first described by its columns (display order, units) and its rows; every
// formatter then prints the rows one by one, reading each cell where the result holds it.
namespace Quillets::Cli {

enum class Formatter { Table, Simple, Json, Csv };

// "table", "simple", "json" or "csv"; nothing for any other name.
std::optional<Formatter> ParseFormatter(const std::string& name);

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

// The formatter that applies: the user's, else the command's default, else simple.
// An unknown default falls back to simple; the user's name must have been checked.
Formatter EffectiveFormatter(const OutputHints& hints, const OutputOptions& options);

// The structure that describes the rows: the declared one (a list's prototype, or the
// structure itself), else the shape of the result. Null for booleans and nothing.
std::shared_ptr<MetaObj::MetaStruct> RowShape(const std::shared_ptr<MetaObj::MetaObject>& result,
                                              const std::shared_ptr<MetaObj::MetaObject>& declared);

// Checks the user's field selection against the declared result before anything runs.
// Returns "" when it is usable, else what is wrong with it (sentences, with a suggestion for
// a mistyped title).
std::string CheckFieldSelection(const std::shared_ptr<MetaObj::MetaObject>& declared,
                                const std::vector<std::string>& fields);

// Receives printed text piece by piece, in order.
using TextSink = std::function<void(std::string_view)>;

// Prints a result to `sink` as it goes, so that a large result is never held as text.
// Columns come from the user's fields, else (except for json, which shows every field) the
// "fields:" hint, else every field in structure order.
void RenderResultTo(const TextSink& sink, const std::shared_ptr<MetaObj::MetaObject>& result,
                    const std::shared_ptr<MetaObj::MetaObject>& declared, const OutputHints& hints,
                    const OutputOptions& options);

// Everything autocli prints on standard output for a result ("" when nothing).
std::string RenderResult(const std::shared_ptr<MetaObj::MetaObject>& result,
                         const std::shared_ptr<MetaObj::MetaObject>& declared, const OutputHints& hints,
                         const OutputOptions& options);

} // namespace Quillets::Cli

#pragma once

// Column tables: every structured result of a command is described once, column by column.
// The result's structure, its "fields:" and "units:" hints and the rows all come from the
// table, so a title is written in one place and a row cannot grow a field nobody declared.

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

enum class ColumnType { String, Int, Bool };

struct ColumnOptions {
    const char* unit = nullptr;                    // the "units:" hint, if any
    bool shown = true;                             // part of the default view ("fields:" hint)
    std::optional<Feature> feature = std::nullopt; // the column exists only while this switch is on
    int shownAfter = -1;                           // in the default view, placed right after this field
};

// One column. `field` is the command's own number for it (an enumerator): commands fill rows
// by these numbers, never by title. Tables of one command family may share the numbers.
struct Column {
    int field;
    const char* title;
    ColumnType type = ColumnType::String;
    ColumnOptions options = {};
};

class RowShape;

class ColumnTable {
public:
    // `fieldsHint`: declare the default view; `header`: the "header:" hint, if any. A field
    // number used twice throws std::logic_error.
    ColumnTable(const char* structure, std::vector<Column> columns, bool fieldsHint = true,
                const char* header = nullptr);

    const char* Structure() const { return structure_; }
    // The columns as the feature switches are now; every row made from it has that shape.
    RowShape Shape() const;
    // Declares the table's output hints on `command` (switches read now).
    void DeclareHints(CommandSpec& command) const;

private:
    const char* structure_;
    std::vector<Column> columns_;
    bool fieldsHint_;
    const char* header_;
};

// One structure being filled. Setting a field the shape does not have, or with a value of
// another type, is a programming error and throws std::logic_error.
class Row {
public:
    Row& Set(int field, bool value);
    Row& Set(int field, long value);
    Row& Set(int field, int value) { return Set(field, static_cast<long>(value)); }
    Row& Set(int field, const std::string& value);
    Row& Set(int field, const char* value) { return Set(field, std::string(value)); }
    // Sets `field` to `read()` only while the shape has it: a switched-off column never asks
    // the host.
    template <typename Read>
    Row& SetIfPresent(int field, Read&& read);

    const std::shared_ptr<MetaStruct>& Structure() const { return structure_; }

private:
    friend class RowShape;
    Row(const RowShape& shape, std::shared_ptr<MetaStruct> structure) : shape_(&shape), structure_(std::move(structure))
    {
    }
    const Column& Expect(int field, ColumnType type) const;

    const RowShape* shape_;
    std::shared_ptr<MetaStruct> structure_;
};

class RowShape {
public:
    // A structure holding every column of the shape at its empty value.
    std::shared_ptr<MetaStruct> Empty() const;
    Row NewRow() const { return Row(*this, Empty()); }
    bool Has(int field) const { return Find(field) != nullptr; }
    const Column* Find(int field) const;
    // An empty list of rows of this shape.
    std::shared_ptr<MetaList> EmptyList() const;
    // The columns in structure order.
    const std::vector<const Column*>& Columns() const { return columns_; }

private:
    friend class ColumnTable;
    const ColumnTable* table_ = nullptr;
    std::vector<const Column*> columns_;
};

template <typename Read>
Row& Row::SetIfPresent(int field, Read&& read)
{
    if (shape_->Has(field)) {
        Set(field, read());
    }
    return *this;
}

} // namespace OrvaneCli::FileSystem

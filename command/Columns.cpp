#include "command/Columns.h"

#include <cstring>
#include <stdexcept>

namespace OrvaneCli::FileSystem {

namespace {

bool Present(const Column& column) { return !column.feature || IsFeatureEnabled(*column.feature); }

} // namespace

ColumnTable::ColumnTable(const char* structure, std::vector<Column> columns, bool fieldsHint, const char* header)
    : structure_(structure), columns_(std::move(columns)), fieldsHint_(fieldsHint), header_(header)
{
}

RowShape ColumnTable::Shape() const
{
    RowShape shape;
    shape.table_ = this;
    for (const Column& column : columns_) {
        if (Present(column)) {
            shape.columns_.push_back(&column);
        }
    }
    return shape;
}

void ColumnTable::DeclareHints(CommandSpec& command) const
{
    const RowShape shape = Shape();
    std::vector<std::string> view;
    std::vector<const Column*> placedLater;
    for (const Column* column : shape.columns_) {
        if (column->shown && column->shownAfter == nullptr) {
            view.emplace_back(column->title);
        } else if (column->shown) {
            placedLater.push_back(column);
        }
    }
    for (const Column* column : placedLater) {
        auto anchor = view.begin();
        while (anchor != view.end() && *anchor != column->shownAfter) {
            ++anchor;
        }
        if (anchor == view.end()) {
            throw std::logic_error(std::string("column '") + column->title + "' is placed after a column not shown");
        }
        view.insert(anchor + 1, column->title);
    }
    if (fieldsHint_) {
        command.SetDefaultOutputParameter(std::string("fields:") + structure_, JoinWithCommas(view));
    }
    if (header_ != nullptr) {
        command.SetDefaultOutputParameter(std::string("header:") + structure_, header_);
    }
    for (const Column* column : shape.columns_) {
        if (column->unit != nullptr) {
            command.SetDefaultOutputParameter(std::string("units:") + structure_ + "." + column->title, column->unit);
        }
    }
}

const Column* RowShape::Find(const char* title) const
{
    for (const Column* column : columns_) {
        if (std::strcmp(column->title, title) == 0) {
            return column;
        }
    }
    return nullptr;
}

std::shared_ptr<MetaStruct> RowShape::Empty() const
{
    auto structure = MetaStruct::New(table_->Structure());
    for (const Column* column : columns_) {
        switch (column->type) {
        case ColumnType::String:
            structure->SetField(column->title, MetaString::New());
            break;
        case ColumnType::Int:
            structure->SetField(column->title, MetaInt::New());
            break;
        case ColumnType::Bool:
            structure->SetField(column->title, MetaBool::New());
            break;
        }
    }
    return structure;
}

std::shared_ptr<MetaList> RowShape::EmptyList() const { return MetaList::New(MetaType::Struct, Empty()); }

const Column& Row::Expect(const char* title, ColumnType type) const
{
    const Column* column = shape_->Find(title);
    if (column == nullptr) {
        throw std::logic_error(std::string("field '") + title + "' is not a column of this result");
    }
    if (column->type != type) {
        throw std::logic_error(std::string("field '") + title + "' is given a value of another type");
    }
    return *column;
}

Row& Row::Set(const char* title, bool value)
{
    structure_->SetField(Expect(title, ColumnType::Bool).title, value);
    return *this;
}

Row& Row::Set(const char* title, long value)
{
    structure_->SetField(Expect(title, ColumnType::Int).title, value);
    return *this;
}

Row& Row::Set(const char* title, const std::string& value)
{
    structure_->SetField(Expect(title, ColumnType::String).title, value);
    return *this;
}

} // namespace OrvaneCli::FileSystem

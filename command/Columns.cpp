#include "command/Columns.h"

#include <stdexcept>

namespace OrvaneCli::FileSystem {

namespace {

bool Present(const Column& column) { return !column.options.feature || IsFeatureEnabled(*column.options.feature); }

} // namespace

ColumnTable::ColumnTable(const char* structure, std::vector<Column> columns, bool fieldsHint, const char* header)
    : structure_(structure), columns_(std::move(columns)), fieldsHint_(fieldsHint), header_(header)
{
    for (std::size_t i = 0; i < columns_.size(); ++i) {
        for (std::size_t j = 0; j < i; ++j) {
            if (columns_[i].field == columns_[j].field) {
                throw std::logic_error(std::string("columns '") + columns_[j].title + "' and '" + columns_[i].title +
                                       "' of " + structure + " share a field number");
            }
        }
    }
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
        if (column->options.shown && column->options.shownAfter < 0) {
            view.emplace_back(column->title);
        } else if (column->options.shown) {
            placedLater.push_back(column);
        }
    }
    for (const Column* column : placedLater) {
        const Column* after = shape.Find(column->options.shownAfter);
        auto anchor = view.begin();
        while (after != nullptr && anchor != view.end() && *anchor != after->title) {
            ++anchor;
        }
        if (after == nullptr || anchor == view.end()) {
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
        if (column->options.unit != nullptr) {
            command.SetDefaultOutputParameter(std::string("units:") + structure_ + "." + column->title,
                                              column->options.unit);
        }
    }
}

const Column* RowShape::Find(int field) const
{
    for (const Column* column : columns_) {
        if (column->field == field) {
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

const Column& Row::Expect(int field, ColumnType type) const
{
    const Column* column = shape_->Find(field);
    if (column == nullptr) {
        throw std::logic_error("field " + std::to_string(field) + " is not a column of " + structure_->GetName() +
                               " as the switches are");
    }
    if (column->type != type) {
        throw std::logic_error(std::string("field '") + column->title + "' is given a value of another type");
    }
    return *column;
}

Row& Row::Set(int field, bool value)
{
    structure_->SetField(Expect(field, ColumnType::Bool).title, value);
    return *this;
}

Row& Row::Set(int field, long value)
{
    structure_->SetField(Expect(field, ColumnType::Int).title, value);
    return *this;
}

Row& Row::Set(int field, const std::string& value)
{
    structure_->SetField(Expect(field, ColumnType::String).title, value);
    return *this;
}

} // namespace OrvaneCli::FileSystem

#include "quillets/MetaObj.h"

#include <algorithm>
#include <atomic>
#include <mutex>
#include <tuple>
#include <unordered_map>

namespace Quillets::MetaObj {

MetaObject::~MetaObject() = default;

namespace {

// A new scalar holding `value`; each class passes its own field, so this one place fills them all.
template <class Meta, class Field, class Value>
std::shared_ptr<Meta> Holding(Field Meta::*field, Value value)
{
    auto object = std::make_shared<Meta>();
    (*object).*field = std::move(value);
    return object;
}

} // namespace

std::shared_ptr<MetaBool> MetaBool::New() { return std::make_shared<MetaBool>(); }
std::shared_ptr<MetaBool> MetaBool::New(bool value) { return Holding(&MetaBool::value_, value); }
MetaType MetaBool::GetType() const { return MetaType::Bool; }

std::shared_ptr<MetaInt> MetaInt::New() { return std::make_shared<MetaInt>(); }
std::shared_ptr<MetaInt> MetaInt::New(long value) { return Holding(&MetaInt::value_, value); }
MetaType MetaInt::GetType() const { return MetaType::Int; }

std::shared_ptr<MetaString> MetaString::New() { return std::make_shared<MetaString>(); }
std::shared_ptr<MetaString> MetaString::New(std::string value)
{
    return Holding(&MetaString::value_, std::move(value));
}
MetaType MetaString::GetType() const { return MetaType::String; }

// Structure names and field titles, each kept once for the life of the process (the table
// is never torn down, so structures may be read until the very end). A structure name also
// remembers how many fields its structures grew to, so the next one reserves room at once.
struct MetaStruct::NameEntry {
    std::atomic<std::size_t> fieldCount{0};
};

namespace {

struct NameTable {
    std::mutex lock;
    std::unordered_map<std::string, void*> entries; // each a structure name's entry
};

NameTable& Names()
{
    static NameTable* table = new NameTable;
    return *table;
}

template <typename Entry>
std::pair<const std::string*, Entry*> Intern(const std::string& text)
{
    auto& table = Names();
    std::lock_guard<std::mutex> guard(table.lock);
    auto found = table.entries.find(text);
    if (found == table.entries.end()) {
        found = table.entries.emplace(text, new Entry).first;
    }
    return {&found->first, static_cast<Entry*>(found->second)};
}

} // namespace

// The parameter's type is the published interface's.
std::shared_ptr<MetaStruct> MetaStruct::New(std::string structureName) // NOLINT(performance-unnecessary-value-param)
{
    auto object = std::make_shared<MetaStruct>();
    std::tie(object->name_, object->entry_) = Intern<NameEntry>(structureName);
    object->fields_.reserve(object->entry_->fieldCount.load(std::memory_order_relaxed));
    return object;
}

MetaType MetaStruct::GetType() const { return MetaType::Struct; }

void MetaStruct::Put(const std::string& field, Value value)
{
    objectsCurrent_ = false;
    objects_.clear();
    for (auto& entry : fields_) {
        if (*entry.title == field) {
            entry.value = std::move(value);
            return;
        }
    }
    fields_.push_back(Field{Intern<NameEntry>(field).first, std::move(value)});
    if (entry_ && entry_->fieldCount.load(std::memory_order_relaxed) < fields_.size()) {
        entry_->fieldCount.store(fields_.size(), std::memory_order_relaxed);
    }
}

void MetaStruct::SetField(const std::string& field, bool value) { Put(field, Value(value)); }
void MetaStruct::SetField(const std::string& field, int value) { Put(field, Value(std::int64_t{value})); }
void MetaStruct::SetField(const std::string& field, long value) { Put(field, Value(std::int64_t{value})); }
void MetaStruct::SetField(const std::string& field, const std::string& value) { Put(field, Value(value)); }
void MetaStruct::SetField(const std::string& field, const char* value)
{
    Put(field, Value(value ? std::string(value) : std::string()));
}
// A null value keeps the field's shape: it becomes the empty value of its kind.
void MetaStruct::SetField(const std::string& field, std::shared_ptr<MetaBool> value)
{
    Put(field, value ? Value(std::shared_ptr<MetaObject>(std::move(value))) : Value(false));
}
void MetaStruct::SetField(const std::string& field, std::shared_ptr<MetaInt> value)
{
    Put(field, value ? Value(std::shared_ptr<MetaObject>(std::move(value))) : Value(std::int64_t{0}));
}
void MetaStruct::SetField(const std::string& field, std::shared_ptr<MetaString> value)
{
    Put(field, value ? Value(std::shared_ptr<MetaObject>(std::move(value))) : Value(std::string()));
}

std::size_t MetaStruct::FindField(const std::string& field, std::size_t hint) const
{
    if (hint < fields_.size() && *fields_[hint].title == field) {
        return hint;
    }
    for (std::size_t i = 0; i < fields_.size(); ++i) {
        if (*fields_[i].title == field) {
            return i;
        }
    }
    return npos;
}

bool MetaStruct::HasField(const std::string& field) const { return FindField(field) != npos; }

MetaStruct::FieldRef MetaStruct::GetFieldRef(std::size_t index) const
{
    FieldRef ref;
    const Value& value = fields_[index].value;
    switch (value.index()) {
    case 0:
        ref.type = MetaType::Bool;
        ref.boolean = std::get<bool>(value);
        break;
    case 1:
        ref.type = MetaType::Int;
        ref.number = std::get<std::int64_t>(value);
        break;
    case 2:
        ref.text = &std::get<std::string>(value);
        break;
    default: {
        const MetaObject* object = std::get<std::shared_ptr<MetaObject>>(value).get();
        ref.type = object->GetType();
        if (ref.type == MetaType::Bool) {
            ref.boolean = static_cast<const MetaBool*>(object)->GetValue();
        } else if (ref.type == MetaType::Int) {
            ref.number = static_cast<const MetaInt*>(object)->GetValue();
        } else if (ref.type == MetaType::String) {
            ref.text = &static_cast<const MetaString*>(object)->GetValue();
        } else {
            ref.object = object;
        }
        break;
    }
    }
    return ref;
}

namespace {

std::shared_ptr<MetaObject> ObjectOf(
    const std::variant<bool, std::int64_t, std::string, std::shared_ptr<MetaObject>>& value)
{
    switch (value.index()) {
    case 0:
        return MetaBool::New(std::get<bool>(value));
    case 1:
        return MetaInt::New(static_cast<long>(std::get<std::int64_t>(value)));
    case 2:
        return MetaString::New(std::get<std::string>(value));
    default:
        return std::get<std::shared_ptr<MetaObject>>(value);
    }
}

} // namespace

std::shared_ptr<MetaObject> MetaStruct::GetField(const std::string& field) const
{
    const std::size_t index = FindField(field);
    if (index == npos) {
        return nullptr;
    }
    return GetFields()[index].second;
}

const std::vector<std::pair<std::string, std::shared_ptr<MetaObject>>>& MetaStruct::GetFields() const
{
    if (!objectsCurrent_) {
        objects_.clear();
        objects_.reserve(fields_.size());
        for (const auto& entry : fields_) {
            objects_.emplace_back(*entry.title, ObjectOf(entry.value));
        }
        objectsCurrent_ = true;
    }
    return objects_;
}

std::shared_ptr<MetaList> MetaList::New(MetaType elementType, std::shared_ptr<MetaStruct> prototype)
{
    auto object = std::make_shared<MetaList>();
    object->elementType_ = elementType;
    object->prototype_ = std::move(prototype);
    return object;
}

MetaType MetaList::GetType() const { return MetaType::List; }

void MetaList::Add(std::shared_ptr<MetaStruct> element)
{
    if (element) {
        elements_.push_back(std::move(element));
    }
}

} // namespace Quillets::MetaObj

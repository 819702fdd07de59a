#include "quillets/MetaObj.h"

#include <algorithm>

namespace Quillets::MetaObj {

MetaObject::~MetaObject() = default;

std::shared_ptr<MetaBool> MetaBool::New() { return std::make_shared<MetaBool>(); }

std::shared_ptr<MetaBool> MetaBool::New(bool value)
{
    auto object = std::make_shared<MetaBool>();
    object->value_ = value;
    return object;
}

MetaType MetaBool::GetType() const { return MetaType::Bool; }

std::shared_ptr<MetaInt> MetaInt::New() { return std::make_shared<MetaInt>(); }

std::shared_ptr<MetaInt> MetaInt::New(long value)
{
    auto object = std::make_shared<MetaInt>();
    object->value_ = value;
    return object;
}

MetaType MetaInt::GetType() const { return MetaType::Int; }

std::shared_ptr<MetaString> MetaString::New() { return std::make_shared<MetaString>(); }

std::shared_ptr<MetaString> MetaString::New(std::string value)
{
    auto object = std::make_shared<MetaString>();
    object->value_ = std::move(value);
    return object;
}

MetaType MetaString::GetType() const { return MetaType::String; }

std::shared_ptr<MetaStruct> MetaStruct::New(std::string structureName)
{
    auto object = std::make_shared<MetaStruct>();
    object->name_ = std::move(structureName);
    return object;
}

MetaType MetaStruct::GetType() const { return MetaType::Struct; }

void MetaStruct::Put(const std::string& field, std::shared_ptr<MetaObject> value)
{
    auto existing = std::find_if(fields_.begin(), fields_.end(), [&](const auto& entry) { return entry.first == field; });
    if (existing != fields_.end()) {
        existing->second = std::move(value);
        return;
    }
    fields_.emplace_back(field, std::move(value));
}

void MetaStruct::SetField(const std::string& field, bool value) { Put(field, MetaBool::New(value)); }
void MetaStruct::SetField(const std::string& field, int value) { Put(field, MetaInt::New(value)); }
void MetaStruct::SetField(const std::string& field, long value) { Put(field, MetaInt::New(value)); }
void MetaStruct::SetField(const std::string& field, const std::string& value) { Put(field, MetaString::New(value)); }
void MetaStruct::SetField(const std::string& field, const char* value)
{
    Put(field, MetaString::New(value ? std::string(value) : std::string()));
}
// A null value keeps the field's shape: it becomes the empty value of its kind.
void MetaStruct::SetField(const std::string& field, std::shared_ptr<MetaBool> value)
{
    Put(field, value ? std::move(value) : MetaBool::New());
}
void MetaStruct::SetField(const std::string& field, std::shared_ptr<MetaInt> value)
{
    Put(field, value ? std::move(value) : MetaInt::New());
}
void MetaStruct::SetField(const std::string& field, std::shared_ptr<MetaString> value)
{
    Put(field, value ? std::move(value) : MetaString::New());
}

bool MetaStruct::HasField(const std::string& field) const
{
    return std::any_of(fields_.begin(), fields_.end(), [&](const auto& entry) { return entry.first == field; });
}

std::shared_ptr<MetaObject> MetaStruct::GetField(const std::string& field) const
{
    for (const auto& entry : fields_) {
        if (entry.first == field) {
            return entry.second;
        }
    }
    return nullptr;
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

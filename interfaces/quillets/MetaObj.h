#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <variant>
#include <vector>

namespace Quillets::MetaObj {

enum class MetaType { Bool = 0, Int = 1, String = 2, Struct = 3, List = 4 };

// A typed result value. Values made without an argument are "empty": they hold
// the type's default (false, 0, "") until the command fills them.
class MetaObject {
public:
    virtual ~MetaObject();
    virtual MetaType GetType() const = 0;
};

class MetaBool : public MetaObject {
public:
    static std::shared_ptr<MetaBool> New();
    static std::shared_ptr<MetaBool> New(bool value);
    MetaType GetType() const override;
    bool GetValue() const { return value_; }

private:
    bool value_ = false;
};

class MetaInt : public MetaObject {
public:
    static std::shared_ptr<MetaInt> New();
    static std::shared_ptr<MetaInt> New(long value);
    MetaType GetType() const override;
    std::int64_t GetValue() const { return value_; }

private:
    std::int64_t value_ = 0;
};

class MetaString : public MetaObject {
public:
    static std::shared_ptr<MetaString> New();
    static std::shared_ptr<MetaString> New(std::string value);
    MetaType GetType() const override;
    const std::string& GetValue() const { return value_; }

private:
    std::string value_;
};

// A named structure whose fields keep the order in which they were first set.
// Setting an existing field replaces its value in place.
class MetaStruct : public MetaObject {
public:
    static std::shared_ptr<MetaStruct> New(std::string structureName);
    MetaType GetType() const override;

    void SetField(const std::string& field, bool value);
    void SetField(const std::string& field, int value);
    void SetField(const std::string& field, long value);
    void SetField(const std::string& field, const std::string& value);
    void SetField(const std::string& field, const char* value);
    void SetField(const std::string& field, std::shared_ptr<MetaBool> value);
    void SetField(const std::string& field, std::shared_ptr<MetaInt> value);
    void SetField(const std::string& field, std::shared_ptr<MetaString> value);

    const std::string& GetName() const { return *name_; }
    bool HasField(const std::string& field) const;
    // The field's value, or an empty pointer when the structure has no such field.
    std::shared_ptr<MetaObject> GetField(const std::string& field) const;
    // Every field as a title and a value object. Made when first asked for after a change;
    // prefer the look-ups below where many structures are read.
    const std::vector<std::pair<std::string, std::shared_ptr<MetaObject>>>& GetFields() const;

    // A field's value seen in place, without an object being made for it.
    struct FieldRef {
        MetaType type = MetaType::String;   // String also for a field that is not there
        bool boolean = false;               // Bool
        std::int64_t number = 0;            // Int
        const std::string* text = nullptr;  // String; null when the field is not there
        const MetaObject* object = nullptr; // any other kind of value
    };
    static constexpr std::size_t npos = static_cast<std::size_t>(-1);
    std::size_t GetFieldCount() const { return fields_.size(); }
    const std::string& GetFieldTitle(std::size_t index) const { return *fields_[index].title; }
    FieldRef GetFieldRef(std::size_t index) const;
    // The position of a field, or npos; `hint` is looked at first (rows of one shape share positions).
    std::size_t FindField(const std::string& field, std::size_t hint = 0) const;

private:
    // Rows of a large result hold their plain values in place, and every title and structure
    // name is kept once per process: a result of many rows stays small.
    // Values given as objects keep their identity.
    using Value = std::variant<bool, std::int64_t, std::string, std::shared_ptr<MetaObject>>;
    struct Field {
        const std::string* title;
        Value value;
    };
    struct NameEntry;

    void Put(const std::string& field, Value value);

    const std::string* name_ = nullptr;
    NameEntry* entry_ = nullptr;
    std::vector<Field> fields_;
    mutable std::vector<std::pair<std::string, std::shared_ptr<MetaObject>>> objects_;
    mutable bool objectsCurrent_ = false;
};

// A list of structures that all share the prototype's shape.
class MetaList : public MetaObject {
public:
    static std::shared_ptr<MetaList> New(MetaType elementType, std::shared_ptr<MetaStruct> prototype);
    MetaType GetType() const override;

    void Add(std::shared_ptr<MetaStruct> element);
    MetaType GetElementType() const { return elementType_; }
    const std::shared_ptr<MetaStruct>& GetPrototype() const { return prototype_; }
    const std::vector<std::shared_ptr<MetaStruct>>& GetElements() const { return elements_; }

private:
    MetaType elementType_ = MetaType::Struct;
    std::shared_ptr<MetaStruct> prototype_;
    std::vector<std::shared_ptr<MetaStruct>> elements_;
};

} // namespace Quillets::MetaObj

#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
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

    const std::string& GetName() const { return name_; }
    bool HasField(const std::string& field) const;
    // The field's value, or an empty pointer when the structure has no such field.
    std::shared_ptr<MetaObject> GetField(const std::string& field) const;
    const std::vector<std::pair<std::string, std::shared_ptr<MetaObject>>>& GetFields() const { return fields_; }

private:
    void Put(const std::string& field, std::shared_ptr<MetaObject> value);

    std::string name_;
    std::vector<std::pair<std::string, std::shared_ptr<MetaObject>>> fields_;
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

// Typed result values of a command: structures, lists and scalars, held by shared pointers.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "Visibility.h"

namespace Kalmor {
namespace MetaObj {

// Element and value kinds. A list's element kind is fixed when the list is made.
enum MetaType {
    META_BOOL = 0,
    META_INT = 1,
    META_STRING = 2,
    META_STRUCT = 3,
    META_LIST = 4,
};

class KALMOR_API MetaObject {
  public:
    virtual ~MetaObject();
    virtual MetaType GetType() const = 0;
};

// A scalar made without a value is "empty": templates use it, formatters show it blank.
class KALMOR_API MetaString : public MetaObject {
  public:
    static std::shared_ptr<MetaString> New();
    static std::shared_ptr<MetaString> New(const std::string& value);
    MetaType GetType() const override;
    bool HasValue() const { return hasValue_; }
    const std::string& GetValue() const { return value_; }

  private:
    bool hasValue_ = false;
    std::string value_;
};

class KALMOR_API MetaInt : public MetaObject {
  public:
    static std::shared_ptr<MetaInt> New();
    static std::shared_ptr<MetaInt> New(int64_t value);
    MetaType GetType() const override;
    bool HasValue() const { return hasValue_; }
    int64_t GetValue() const { return value_; }

  private:
    bool hasValue_ = false;
    int64_t value_ = 0;
};

class KALMOR_API MetaBool : public MetaObject {
  public:
    static std::shared_ptr<MetaBool> New();
    static std::shared_ptr<MetaBool> New(bool value);
    MetaType GetType() const override;
    bool HasValue() const { return hasValue_; }
    bool GetValue() const { return value_; }

  private:
    bool hasValue_ = false;
    bool value_ = false;
};

class MetaList;

// A named structure of named, typed fields, kept in the order they were first set.
class KALMOR_API MetaStruct : public MetaObject {
  public:
    struct Field {
        std::string name;
        std::shared_ptr<MetaObject> value;
        std::string documentation;
    };

    // The documentation text that commands give to every field.
    static const std::string _docEmpty;

    static std::shared_ptr<MetaStruct> New(const std::string& name);
    MetaType GetType() const override;
    const std::string& GetName() const { return name_; }

    // Sets a field. A field set again keeps its place and takes the new value.
    void SetField(const std::string& field, const std::shared_ptr<MetaString>& value,
                  const std::string& documentation);
    void SetField(const std::string& field, const std::shared_ptr<MetaInt>& value,
                  const std::string& documentation);
    void SetField(const std::string& field, const std::shared_ptr<MetaBool>& value,
                  const std::string& documentation);
    void SetField(const std::string& field, const std::shared_ptr<MetaList>& value,
                  const std::string& documentation);

    const std::vector<Field>& GetFields() const { return fields_; }
    // Returns the field's value, or nullptr when the structure has no such field.
    std::shared_ptr<MetaObject> GetField(const std::string& field) const;

  private:
    void SetAny(const std::string& field, std::shared_ptr<MetaObject> value,
                const std::string& documentation);

    std::string name_;
    std::vector<Field> fields_;
};

// A list whose elements all have one kind: texts (META_STRING) or structures (META_STRUCT,
// made with an empty template structure that describes the elements).
class KALMOR_API MetaList : public MetaObject {
  public:
    static std::shared_ptr<MetaList> New(MetaType elementType);
    static std::shared_ptr<MetaList> New(MetaType elementType,
                                         std::shared_ptr<MetaObject> elementTemplate);
    MetaType GetType() const override;
    MetaType GetElementType() const { return elementType_; }
    // The element template, or nullptr for lists made without one.
    const std::shared_ptr<MetaObject>& GetTemplate() const { return template_; }

    void Reserve(size_t count);
    // Appends a text; throws std::logic_error unless the elements are texts.
    void Add(const std::string& value);
    // Appends a structure; throws std::logic_error unless the elements are structures.
    void Add(const std::shared_ptr<MetaStruct>& value);

    const std::vector<std::shared_ptr<MetaObject>>& GetElements() const { return elements_; }
    size_t Size() const { return elements_.size(); }

  private:
    MetaType elementType_ = META_STRING;
    std::shared_ptr<MetaObject> template_;
    std::vector<std::shared_ptr<MetaObject>> elements_;
};

}  // namespace MetaObj
}  // namespace Kalmor

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
// Scalars never change once made, so New() may hand out one object to many callers (every
// empty scalar of a kind, every true and every false are one object each).
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
//
// Structures made one after another with the same fields (the rows of a listing) share one
// immutable list of field names and documentation texts instead of each copying it.
class KALMOR_API MetaStruct : public MetaObject {
  public:
    // One field: views into the structure, valid while it lives and is not changed.
    struct Field {
        const std::string& name;
        const std::shared_ptr<MetaObject>& value;
        const std::string& documentation;
    };

    // The fields in order, as a range of Field views.
    class FieldRange {
      public:
        class Iterator {
          public:
            Iterator(const MetaStruct* structure, size_t index)
                : structure_(structure), index_(index) {}
            Field operator*() const { return structure_->FieldAt(index_); }
            Iterator& operator++() {
                ++index_;
                return *this;
            }
            bool operator!=(const Iterator& other) const { return index_ != other.index_; }

          private:
            const MetaStruct* structure_;
            size_t index_;
        };

        explicit FieldRange(const MetaStruct* structure) : structure_(structure) {}
        Iterator begin() const { return Iterator(structure_, 0); }
        Iterator end() const { return Iterator(structure_, size()); }
        size_t size() const { return structure_->FieldCount(); }
        bool empty() const { return size() == 0; }
        Field operator[](size_t index) const { return structure_->FieldAt(index); }

      private:
        const MetaStruct* structure_;
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

    FieldRange GetFields() const { return FieldRange(this); }
    size_t FieldCount() const { return values_.size(); }
    // The field at that position; `index` must be below FieldCount().
    Field FieldAt(size_t index) const;
    // Returns the field's value, or nullptr when the structure has no such field.
    std::shared_ptr<MetaObject> GetField(const std::string& field) const;
    // The position of the field of that name, or FieldCount() when there is none.
    size_t FindField(const std::string& field) const;
    // Whether the other structure has the same field names in the same order: true at once
    // for structures that share their names.
    bool HasFieldsOf(const MetaStruct& other) const;

    // Lets structures made later with this name share this one's field names (a list does
    // so for its template and every structure added to it). The structure stays changeable.
    void ShareLayout() const;

    struct Layout;

  private:
    void SetAny(const std::string& field, std::shared_ptr<MetaObject> value,
                const std::string& documentation);

    std::string name_;
    // The names and documentation of the fields, in order; it may hold more entries than
    // this structure has fields when it is shared with a structure that has more.
    std::shared_ptr<Layout> layout_;
    std::vector<std::shared_ptr<MetaObject>> values_;
    // Where a field set again is looked for first: after the one set last.
    size_t next_ = 0;
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

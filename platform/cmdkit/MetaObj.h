// Typed result objects that commands hand to the framework for formatting.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace CmdKit::MetaObj {

// Kind codes; a MetaList's element type uses the same codes (2 strings, 3 structures).
enum MetaObjectType : int {
    META_INT = 0,
    META_BOOL = 1,
    META_STRING = 2,
    META_STRUCT = 3,
    META_LIST = 4,
};

class MetaObject {
  public:
    virtual ~MetaObject() = default;
    virtual MetaObjectType GetMetaType() const = 0;

  protected:
    MetaObject() = default;
};

class MetaString : public MetaObject {
  public:
    static std::shared_ptr<MetaString> New();
    static std::shared_ptr<MetaString> New(const std::string& text);
    MetaObjectType GetMetaType() const override { return META_STRING; }
    const std::string& GetValue() const { return value_; }
    void SetValue(const std::string& text) { value_ = text; }

  private:
    std::string value_;
};

// An integer that may have no value (printed as empty, or null in JSON).
class MetaInt : public MetaObject {
  public:
    static std::shared_ptr<MetaInt> New();
    static std::shared_ptr<MetaInt> New(long value);
    MetaObjectType GetMetaType() const override { return META_INT; }
    bool HasValue() const { return value_.has_value(); }
    long GetValue() const { return value_.value_or(0); }
    void SetValue(long value) { value_ = value; }

  private:
    std::optional<long> value_;
};

class MetaBool : public MetaObject {
  public:
    static std::shared_ptr<MetaBool> New();
    static std::shared_ptr<MetaBool> New(bool value);
    MetaObjectType GetMetaType() const override { return META_BOOL; }
    bool GetValue() const { return value_; }
    void SetValue(bool value) { value_ = value; }

  private:
    bool value_ = false;
};

class MetaList;

// A named structure of labelled fields; field order is insertion order, a field set
// again keeps its place.
class MetaStruct : public MetaObject {
  public:
    struct Field {
        std::string name;
        std::shared_ptr<MetaObject> value;
        std::string description;
    };

    static const std::string _docEmpty;

    static std::shared_ptr<MetaStruct> New(const std::string& name);
    MetaObjectType GetMetaType() const override { return META_STRUCT; }

    void SetField(const std::string& name, const std::string& value, const std::string& doc);
    void SetField(const std::string& name, const char* value, const std::string& doc);
    void SetField(const std::string& name, int value, const std::string& doc);
    void SetField(const std::string& name, long value, const std::string& doc);
    void SetField(const std::string& name, bool value, const std::string& doc);
    void SetField(const std::string& name, const std::vector<std::string>& value,
                  const std::string& doc);
    void SetField(const std::string& name, std::shared_ptr<MetaString> value,
                  const std::string& doc);
    void SetField(const std::string& name, std::shared_ptr<MetaInt> value, const std::string& doc);
    void SetField(const std::string& name, std::shared_ptr<MetaBool> value, const std::string& doc);
    void SetField(const std::string& name, std::shared_ptr<MetaList> value, const std::string& doc);
    void SetField(const std::string& name, std::shared_ptr<MetaStruct> value,
                  const std::string& doc);

    const std::string& GetName() const { return name_; }
    const std::vector<Field>& GetFields() const { return fields_; }
    // The field's value, or null when the structure has no such field.
    std::shared_ptr<MetaObject> GetField(const std::string& name) const;
    // As GetField, without taking a reference: valid while the structure keeps the field.
    const MetaObject* FindField(const std::string& name) const;

  private:
    explicit MetaStruct(std::string name) : name_(std::move(name)) {}
    void Put(const std::string& name, std::shared_ptr<MetaObject> value, const std::string& doc);

    std::string name_;
    std::vector<Field> fields_;
};

// The rows of a listing read while it is printed, so that a listing of any length is printed in
// the memory of one row. A formatter walks them once, or twice (a table measures its columns
// first); every walk yields the same rows.
class RowSource {
  public:
    virtual ~RowSource() = default;
    virtual void Each(const std::function<void(std::shared_ptr<MetaStruct>)>& row) = 0;
};

// Thrown by a row source that cannot read its rows; the text is the command's error message.
class RowError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

class MetaList : public MetaObject {
  public:
    // elementType: META_STRING or META_STRUCT (with a prototype describing the rows).
    static std::shared_ptr<MetaList> New(int elementType);
    static std::shared_ptr<MetaList> New(int elementType, std::shared_ptr<MetaStruct> prototype);
    // A list of structures shaped like `prototype` (which names every field), read from `rows`
    // when it is walked.
    static std::shared_ptr<MetaList> New(std::shared_ptr<MetaStruct> prototype,
                                         std::shared_ptr<RowSource> rows);
    MetaObjectType GetMetaType() const override { return META_LIST; }

    void Add(const std::string& text);
    void Add(std::shared_ptr<MetaString> text);
    void Add(std::shared_ptr<MetaStruct> row);
    void Reserve(size_t n) { elements_.reserve(n); }

    int GetElementType() const { return elementType_; }
    const std::shared_ptr<MetaStruct>& GetPrototype() const { return prototype_; }
    // Every element, one at a time: a list read from a row source holds none of them.
    void ForEach(const std::function<void(const MetaObject&)>& element) const;
    bool IsStreamed() const { return rows_ != nullptr; }
    // Every element at once; a list read from a row source reads them all, once.
    const std::vector<std::shared_ptr<MetaObject>>& GetElements() const;
    size_t Size() const { return GetElements().size(); }

  private:
    MetaList(int elementType, std::shared_ptr<MetaStruct> prototype)
        : elementType_(elementType), prototype_(std::move(prototype)) {}

    int elementType_;
    std::shared_ptr<MetaStruct> prototype_;
    mutable std::vector<std::shared_ptr<MetaObject>> elements_;
    mutable std::shared_ptr<RowSource> rows_;
};

}  // namespace CmdKit::MetaObj

// Result objects: structures, lists and scalars.
#include "cmdkit/MetaObj.h"

#include <algorithm>
#include <memory>

#include "cmdkit/CmdKitException.h"

namespace CmdKit::MetaObj {

const std::string MetaStruct::_docEmpty;

// Scalars are made with their reference count in one allocation: a listing makes one for every
// field of every row.
std::shared_ptr<MetaString> MetaString::New() {
    return std::make_shared<MetaString>();
}

std::shared_ptr<MetaString> MetaString::New(const std::string& text) {
    auto object = New();
    object->SetValue(text);
    return object;
}

std::shared_ptr<MetaInt> MetaInt::New() {
    return std::make_shared<MetaInt>();
}

std::shared_ptr<MetaInt> MetaInt::New(long value) {
    auto object = New();
    object->SetValue(value);
    return object;
}

std::shared_ptr<MetaBool> MetaBool::New() {
    return std::make_shared<MetaBool>();
}

std::shared_ptr<MetaBool> MetaBool::New(bool value) {
    auto object = New();
    object->SetValue(value);
    return object;
}

std::shared_ptr<MetaStruct> MetaStruct::New(const std::string& name) {
    return std::shared_ptr<MetaStruct>(new MetaStruct(name));
}

void MetaStruct::Put(const std::string& name, std::shared_ptr<MetaObject> value,
                     const std::string& doc) {
    for (auto& field : fields_) {
        if (field.name == name) {
            field.value = std::move(value);
            field.description = doc;
            return;
        }
    }
    // Rows usually have several fields: start with eight, then grow by half.
    if (fields_.size() == fields_.capacity()) {
        fields_.reserve(std::max<size_t>(8, fields_.size() + fields_.size() / 2));
    }
    fields_.push_back(Field{name, std::move(value), doc});
}

void MetaStruct::SetField(const std::string& name, const std::string& value,
                          const std::string& doc) {
    Put(name, MetaString::New(value), doc);
}

void MetaStruct::SetField(const std::string& name, const char* value, const std::string& doc) {
    Put(name, MetaString::New(value ? value : ""), doc);
}

void MetaStruct::SetField(const std::string& name, int value, const std::string& doc) {
    Put(name, MetaInt::New(static_cast<long>(value)), doc);
}

void MetaStruct::SetField(const std::string& name, long value, const std::string& doc) {
    Put(name, MetaInt::New(value), doc);
}

void MetaStruct::SetField(const std::string& name, bool value, const std::string& doc) {
    Put(name, MetaBool::New(value), doc);
}

void MetaStruct::SetField(const std::string& name, const std::vector<std::string>& value,
                          const std::string& doc) {
    auto list = MetaList::New(META_STRING);
    list->Reserve(value.size());
    for (const auto& text : value) list->Add(text);
    Put(name, list, doc);
}

void MetaStruct::SetField(const std::string& name, std::shared_ptr<MetaString> value,
                          const std::string& doc) {
    Put(name, std::move(value), doc);
}

void MetaStruct::SetField(const std::string& name, std::shared_ptr<MetaInt> value,
                          const std::string& doc) {
    Put(name, std::move(value), doc);
}

void MetaStruct::SetField(const std::string& name, std::shared_ptr<MetaBool> value,
                          const std::string& doc) {
    Put(name, std::move(value), doc);
}

void MetaStruct::SetField(const std::string& name, std::shared_ptr<MetaList> value,
                          const std::string& doc) {
    Put(name, std::move(value), doc);
}

void MetaStruct::SetField(const std::string& name, std::shared_ptr<MetaStruct> value,
                          const std::string& doc) {
    Put(name, std::move(value), doc);
}

std::shared_ptr<MetaObject> MetaStruct::GetField(const std::string& name) const {
    for (const auto& field : fields_) {
        if (field.name == name) return field.value;
    }
    return nullptr;
}

const MetaObject* MetaStruct::FindField(const std::string& name) const {
    for (const auto& field : fields_) {
        if (field.name == name) return field.value.get();
    }
    return nullptr;
}

std::shared_ptr<MetaList> MetaList::New(int elementType) {
    return New(elementType, nullptr);
}

std::shared_ptr<MetaList> MetaList::New(int elementType, std::shared_ptr<MetaStruct> prototype) {
    if (elementType != META_STRING && elementType != META_STRUCT) {
        throw CmdKitException("A list holds strings or structures, not element type " +
                              std::to_string(elementType));
    }
    return std::shared_ptr<MetaList>(new MetaList(elementType, std::move(prototype)));
}

std::shared_ptr<MetaList> MetaList::New(std::shared_ptr<MetaStruct> prototype,
                                        std::shared_ptr<RowSource> rows) {
    if (!prototype || !rows) throw CmdKitException("A streamed list needs a prototype and rows");
    auto list = New(META_STRUCT, std::move(prototype));
    list->rows_ = std::move(rows);
    return list;
}

void MetaList::ForEach(const std::function<void(const MetaObject&)>& element) const {
    if (rows_) {
        rows_->Each([&](std::shared_ptr<MetaStruct> row) {
            if (!row) throw CmdKitException("A row source gave a null row");
            element(*row);
        });
        return;
    }
    for (const auto& each : elements_) element(*each);
}

const std::vector<std::shared_ptr<MetaObject>>& MetaList::GetElements() const {
    if (rows_) {
        std::vector<std::shared_ptr<MetaObject>> all;
        rows_->Each([&](std::shared_ptr<MetaStruct> row) {
            if (!row) throw CmdKitException("A row source gave a null row");
            all.push_back(std::move(row));
        });
        elements_ = std::move(all);
        rows_.reset();
    }
    return elements_;
}

void MetaList::Add(const std::string& text) {
    Add(MetaString::New(text));
}

void MetaList::Add(std::shared_ptr<MetaString> text) {
    if (!text) throw CmdKitException("Cannot add a null string to a list");
    if (elementType_ != META_STRING) {
        throw CmdKitException("Cannot add a string to a list of structures");
    }
    elements_.push_back(std::move(text));
}

void MetaList::Add(std::shared_ptr<MetaStruct> row) {
    if (!row) throw CmdKitException("Cannot add a null structure to a list");
    if (rows_) throw CmdKitException("Cannot add to a list read from a row source");
    if (elementType_ != META_STRUCT) {
        throw CmdKitException("Cannot add a structure to a list of strings");
    }
    elements_.push_back(std::move(row));
}

}  // namespace CmdKit::MetaObj

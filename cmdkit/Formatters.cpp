// The output formatters: simple, table, json, xml, csv and keyvalue.
#include <algorithm>
#include <boost/algorithm/string/trim.hpp>
#include <functional>
#include <map>
#include <nlohmann/json.hpp>
#include <ostream>
#include <pugixml.hpp>
#include <sstream>
#include <utility>

#include "Internal.h"

namespace CmdKit::Detail {

namespace {

using MetaObj::MetaBool;
using MetaObj::MetaInt;
using MetaObj::MetaList;
using MetaObj::MetaObject;
using MetaObj::MetaString;
using MetaObj::MetaStruct;

const MetaStruct* AsStruct(const MetaObject* object) {
    return object && object->GetMetaType() == MetaObj::META_STRUCT
               ? static_cast<const MetaStruct*>(object)
               : nullptr;
}

const MetaList* AsList(const MetaObject* object) {
    return object && object->GetMetaType() == MetaObj::META_LIST
               ? static_cast<const MetaList*>(object)
               : nullptr;
}

std::string Hint(const Hints& hints, const std::string& key) {
    auto found = hints.find(key);
    return found == hints.end() ? std::string() : found->second;
}

std::vector<std::string> SplitNames(const std::string& text) {
    std::vector<std::string> names;
    std::stringstream stream(text);
    std::string name;
    while (std::getline(stream, name, ',')) {
        boost::algorithm::trim(name);
        if (!name.empty()) names.push_back(name);
    }
    return names;
}

// SplitNames of a hint that every row of a listing asks for again: split once per text.
const std::vector<std::string>& SplitNamesOnce(const std::string& text) {
    thread_local std::map<std::string, std::vector<std::string>, std::less<>> split;
    auto found = split.find(text);
    if (found == split.end()) found = split.emplace(text, SplitNames(text)).first;
    return found->second;
}

// The prototype of a list's elements: the list's own, else the one the declared result gives.
const MetaStruct* ElementPrototype(const MetaList& list, const MetaObject* prototype) {
    if (list.GetPrototype()) return list.GetPrototype().get();
    if (const MetaList* declared = AsList(prototype)) return declared->GetPrototype().get();
    return nullptr;
}

// Every field of `object` in the declared structure's order, then any field it does not
// declare in the object's own order.
std::vector<const MetaStruct::Field*> AllFields(const MetaStruct& object,
                                                const MetaStruct* prototype) {
    std::vector<const MetaStruct::Field*> fields;
    fields.reserve(object.GetFields().size());
    if (prototype) {
        for (const auto& declared : prototype->GetFields()) {
            for (const auto& field : object.GetFields()) {
                if (field.name == declared.name) fields.push_back(&field);
            }
        }
    }
    for (const auto& field : object.GetFields()) {
        if (std::find(fields.begin(), fields.end(), &field) == fields.end()) {
            fields.push_back(&field);
        }
    }
    return fields;
}

const MetaObject* DeclaredField(const MetaStruct* prototype, const std::string& name) {
    return prototype ? prototype->FindField(name) : nullptr;
}

// The names of the fields to show of a structure: the "fields:<Struct>" hint when set,
// otherwise all fields.
std::vector<std::string> ShownFields(const MetaStruct& object, const MetaStruct* prototype,
                                     const Hints& hints) {
    std::vector<std::string> names;
    const std::string hint = Hint(hints, "fields:" + object.GetName());
    if (!hint.empty()) {
        for (const auto& name : SplitNamesOnce(hint)) {
            if (object.FindField(name) || DeclaredField(prototype, name)) names.push_back(name);
        }
        return names;
    }
    for (const auto* field : AllFields(object, prototype)) names.push_back(field->name);
    return names;
}

std::string IntText(const MetaInt& value) {
    return value.HasValue() ? std::to_string(value.GetValue()) : std::string();
}

// A value as one piece of text: scalars as themselves, a list's elements comma-separated,
// a structure as its "Field: value" pairs.
std::string InlineText(const MetaObject* object) {
    if (!object) return std::string();
    switch (object->GetMetaType()) {
        case MetaObj::META_STRING:
            return PrintableText(static_cast<const MetaString*>(object)->GetValue());
        case MetaObj::META_INT:
            return IntText(*static_cast<const MetaInt*>(object));
        case MetaObj::META_BOOL:
            return static_cast<const MetaBool*>(object)->GetValue() ? "true" : "false";
        case MetaObj::META_LIST: {
            std::string text;
            static_cast<const MetaList*>(object)->ForEach([&](const MetaObject& element) {
                if (!text.empty()) text += ", ";
                text += InlineText(&element);
            });
            return text;
        }
        case MetaObj::META_STRUCT: {
            std::string text;
            for (const auto& field : static_cast<const MetaStruct*>(object)->GetFields()) {
                if (!text.empty()) text += ", ";
                text += field.name + ": " + InlineText(field.value.get());
            }
            return text;
        }
    }
    return std::string();
}

std::string WithUnit(const std::string& text, const Hints& hints, const std::string& structName,
                     const std::string& field) {
    // Most results declare no units at all: then no key needs to be built for every field.
    const auto units = hints.lower_bound("units:");
    if (units == hints.end() || units->first.compare(0, 6, "units:") != 0) return text;
    const std::string unit = Hint(hints, "units:" + structName + "." + field);
    if (unit.empty() || text.empty()) return text;
    return text + " " + unit;
}

// --- simple ---

// A carriage return would move a terminal's cursor back over what the line already shows.
std::string ScreenText(std::string text) {
    for (size_t at = text.find('\r'); at != std::string::npos; at = text.find('\r', at)) {
        text.replace(at, 1, "\xEF\xBF\xBD");
    }
    return text;
}

void SimpleStruct(const MetaStruct& object, const MetaStruct* prototype, const Hints& hints,
                  size_t indent, bool nested, std::ostream& out);

void SimpleField(const std::string& name, const MetaObject* value, const MetaObject* declared,
                 const std::string& structName, const Hints& hints, size_t indent,
                 std::ostream& out) {
    const std::string pad(indent, ' ');
    if (const MetaStruct* inner = AsStruct(value)) {
        out << pad << name << ":\n";
        SimpleStruct(*inner, AsStruct(declared), hints, indent + 3, true, out);
        return;
    }
    const MetaList* list = AsList(value);
    if (list && list->GetElementType() == MetaObj::META_STRUCT) {
        out << pad << name << ":\n";
        const MetaStruct* elementPrototype = ElementPrototype(*list, declared);
        list->ForEach([&](const MetaObject& element) {
            SimpleStruct(static_cast<const MetaStruct&>(element), elementPrototype, hints,
                         indent + 3, false, out);
        });
        return;
    }
    const std::string text = ScreenText(WithUnit(InlineText(value), hints, structName, name));
    out << pad << name << ":";
    if (!text.empty()) out << ' ' << text;
    out << '\n';
}

void SimpleStruct(const MetaStruct& object, const MetaStruct* prototype, const Hints& hints,
                  size_t indent, bool nested, std::ostream& out) {
    const bool header = !nested && Hint(hints, "show-header:" + object.GetName()) != "false";
    size_t fieldIndent = indent;
    if (header) {
        out << std::string(indent, ' ') << object.GetName() << ":\n";
        fieldIndent += 3;
    }
    for (const auto& name : ShownFields(object, prototype, hints)) {
        SimpleField(name, object.FindField(name), DeclaredField(prototype, name), object.GetName(),
                    hints, fieldIndent, out);
    }
}

void FormatSimple(const MetaObject& result, const FormatContext& context, std::ostream& out) {
    if (const MetaStruct* object = AsStruct(&result)) {
        SimpleStruct(*object, AsStruct(context.prototype.get()), context.hints, 0, false, out);
        return;
    }
    if (const MetaList* list = AsList(&result)) {
        const MetaStruct* prototype = ElementPrototype(*list, context.prototype.get());
        bool first = true;
        list->ForEach([&](const MetaObject& element) {
            if (const MetaStruct* row = AsStruct(&element)) {
                if (!first) out << '\n';
                SimpleStruct(*row, prototype, context.hints, 0, false, out);
            } else {
                out << ScreenText(InlineText(&element)) << '\n';
            }
            first = false;
        });
        return;
    }
    out << ScreenText(InlineText(&result)) << '\n';
}

// --- table ---

std::string OneLine(std::string text) {
    std::replace(text.begin(), text.end(), '\n', ' ');
    std::replace(text.begin(), text.end(), '\r', ' ');
    std::replace(text.begin(), text.end(), '\t', ' ');
    return text;
}

// Splits a cell into pieces of at most `width` characters, at spaces where possible.
std::vector<std::string> WrapCell(const std::string& text, size_t width) {
    std::vector<std::string> pieces;
    std::string rest = text;
    while (rest.size() > width) {
        size_t cut = rest.rfind(' ', width);
        if (cut == std::string::npos || cut == 0) {
            pieces.push_back(rest.substr(0, width));
            rest.erase(0, width);
        } else {
            pieces.push_back(rest.substr(0, cut));
            rest.erase(0, cut + 1);
        }
    }
    pieces.push_back(rest);
    return pieces;
}

void WriteLine(std::string line, size_t cut, std::ostream& out) {
    boost::algorithm::trim_right(line);
    if (cut > 0 && line.size() > cut) line.resize(cut);
    out << line << '\n';
}

void FormatTable(const MetaList& list, const FormatContext& context, std::ostream& out) {
    const MetaStruct* prototype = ElementPrototype(list, context.prototype.get());
    // A streamed list's prototype names every field; only a list in memory has a first row to ask.
    const MetaStruct* first = list.IsStreamed() || list.GetElements().empty()
                                  ? nullptr
                                  : AsStruct(list.GetElements().front().get());
    // A prototype without fields (only a name) leaves the columns to the first row.
    const MetaStruct* shape = prototype && !prototype->GetFields().empty() ? prototype : first;
    if (!shape) shape = prototype;
    const std::string structName = shape ? shape->GetName() : std::string();

    std::vector<std::string> columns = SplitNames(Hint(context.hints, "table-columns"));
    if (columns.empty()) columns = SplitNames(Hint(context.hints, "fields:" + structName));
    if (columns.empty() && shape) {
        for (const auto& field : shape->GetFields()) columns.push_back(field.name);
    }

    std::vector<std::string> header;
    for (const auto& column : columns) {
        const std::string unit = Hint(context.hints, "units:" + structName + "." + column);
        header.push_back(unit.empty() ? column : column + " (" + unit + ")");
    }
    // The rows are walked twice, their cells made afresh each time: once for the column widths,
    // once to print. Only one row is held at a time.
    std::vector<std::string> cells(columns.size());
    auto cellsOf = [&](const MetaObject& element) -> const std::vector<std::string>& {
        const MetaStruct* row = AsStruct(&element);
        for (size_t i = 0; i < columns.size(); ++i) {
            cells[i] = row ? OneLine(InlineText(row->FindField(columns[i]))) : "";
        }
        return cells;
    };

    std::vector<size_t> widths;
    for (const auto& title : header) widths.push_back(title.size());
    list.ForEach([&](const MetaObject& element) {
        const auto& row = cellsOf(element);
        for (size_t i = 0; i < row.size(); ++i) widths[i] = std::max(widths[i], row[i].size());
    });
    if (columns.empty()) return;

    // Where the last column starts, and how much room a terminal leaves it.
    size_t lastStart = 0;
    for (size_t i = 0; i + 1 < widths.size(); ++i) lastStart += widths[i] + 2;
    const size_t terminal = context.terminalWidth;
    const bool tooWide = terminal > 0 && lastStart + widths.back() > terminal;
    const bool wrap =
        tooWide && Hint(context.hints, "wrap-last") == "true" && terminal > lastStart + 10;
    const size_t cut = tooWide && !wrap ? terminal : 0;

    auto writeRow = [&](const std::vector<std::string>& cells) {
        std::string line;
        for (size_t i = 0; i + 1 < cells.size(); ++i) {
            line += cells[i];
            // A row that has grown since the widths were measured (the host changed under a
            // fault's count) pushes its line right rather than breaking it.
            line.append(widths[i] > cells[i].size() ? widths[i] - cells[i].size() + 2 : 2, ' ');
        }
        if (!wrap) {
            WriteLine(line + cells.back(), cut, out);
            return;
        }
        auto pieces = WrapCell(cells.back(), terminal - lastStart);
        WriteLine(line + pieces[0], 0, out);
        for (size_t i = 1; i < pieces.size(); ++i) {
            WriteLine(std::string(lastStart, ' ') + pieces[i], 0, out);
        }
    };
    writeRow(header);
    std::vector<std::string> dashes;
    for (size_t i = 0; i < widths.size(); ++i) {
        // The dashes under the last column stop where the terminal does.
        size_t width = widths[i];
        if (wrap && i + 1 == widths.size()) width = std::min(width, terminal - lastStart);
        dashes.push_back(std::string(width, '-'));
    }
    writeRow(dashes);
    list.ForEach([&](const MetaObject& element) { writeRow(cellsOf(element)); });
}

// --- json ---

using Json = nlohmann::ordered_json;

Json ToJson(const MetaObject* object, const MetaObject* prototype) {
    if (!object) return nullptr;
    switch (object->GetMetaType()) {
        case MetaObj::META_STRING:
            return static_cast<const MetaString*>(object)->GetValue();
        case MetaObj::META_INT: {
            const auto* value = static_cast<const MetaInt*>(object);
            if (!value->HasValue()) return nullptr;
            return static_cast<int64_t>(value->GetValue());
        }
        case MetaObj::META_BOOL:
            return static_cast<const MetaBool*>(object)->GetValue();
        case MetaObj::META_LIST: {
            const auto* list = static_cast<const MetaList*>(object);
            const MetaStruct* elementPrototype = ElementPrototype(*list, prototype);
            Json array = Json::array();
            list->ForEach([&](const MetaObject& element) {
                array.push_back(ToJson(&element, elementPrototype));
            });
            return array;
        }
        case MetaObj::META_STRUCT: {
            const auto* structure = static_cast<const MetaStruct*>(object);
            const MetaStruct* declared = AsStruct(prototype);
            Json json = Json::object();
            for (const auto* field : AllFields(*structure, declared)) {
                json[field->name] =
                    ToJson(field->value.get(), DeclaredField(declared, field->name));
            }
            return json;
        }
    }
    return nullptr;
}

// --- xml ---

void ToXml(const MetaObject* object, const MetaObject* prototype, pugi::xml_node parent) {
    if (!object) {
        parent.append_child("null");
        return;
    }
    switch (object->GetMetaType()) {
        case MetaObj::META_STRING:
            parent.append_child("string").text().set(
                PrintableText(static_cast<const MetaString*>(object)->GetValue()).c_str());
            return;
        case MetaObj::META_INT: {
            auto node = parent.append_child("integer");
            const auto* value = static_cast<const MetaInt*>(object);
            if (value->HasValue()) node.text().set(std::to_string(value->GetValue()).c_str());
            return;
        }
        case MetaObj::META_BOOL:
            parent.append_child("boolean").text().set(
                static_cast<const MetaBool*>(object)->GetValue() ? "true" : "false");
            return;
        case MetaObj::META_LIST: {
            const auto* list = static_cast<const MetaList*>(object);
            auto node = parent.append_child("list");
            node.append_attribute("type") =
                list->GetElementType() == MetaObj::META_STRUCT ? "structure" : "string";
            const MetaStruct* elementPrototype = ElementPrototype(*list, prototype);
            list->ForEach(
                [&](const MetaObject& element) { ToXml(&element, elementPrototype, node); });
            return;
        }
        case MetaObj::META_STRUCT: {
            const auto* structure = static_cast<const MetaStruct*>(object);
            const MetaStruct* declared = AsStruct(prototype);
            auto node = parent.append_child("structure");
            node.append_attribute("typeName") = PrintableText(structure->GetName()).c_str();
            for (const auto* field : AllFields(*structure, declared)) {
                auto fieldNode = node.append_child("field");
                fieldNode.append_attribute("name") = PrintableText(field->name).c_str();
                ToXml(field->value.get(), DeclaredField(declared, field->name), fieldNode);
            }
            return;
        }
    }
}

// Passes the document on, with a carriage return in text as `&#13;`: the writer leaves a raw one,
// which any reader turns into a line feed.
class XmlWriter : public pugi::xml_writer {
  public:
    explicit XmlWriter(std::ostream& out) : out_(out) {}
    void write(const void* data, size_t size) override {
        std::string_view text(static_cast<const char*>(data), size);
        for (size_t at = text.find('\r'); at != std::string_view::npos; at = text.find('\r')) {
            out_.write(text.data(), static_cast<std::streamsize>(at));
            out_ << "&#13;";
            text.remove_prefix(at + 1);
        }
        out_.write(text.data(), static_cast<std::streamsize>(text.size()));
    }

  private:
    std::ostream& out_;
};

// --- csv ---

std::string CsvCell(const std::string& text) {
    if (text.find_first_of(",\"\r\n") == std::string::npos) return text;
    std::string quoted = "\"";
    for (char c : text) {
        if (c == '"') quoted += '"';
        quoted += c;
    }
    return quoted + "\"";
}

// The columns are the prototype's, then any other field a row has: the rows are walked for them
// first, unless `prototypeNamesAll` (a streamed list's prototype names every field).
void CsvRows(const std::function<void(const std::function<void(const MetaStruct&)>&)>& eachRow,
             const MetaStruct* prototype, bool prototypeNamesAll, std::ostream& out) {
    std::vector<std::string> columns;
    if (prototype) {
        for (const auto& field : prototype->GetFields()) columns.push_back(field.name);
    }
    if (!prototypeNamesAll || !prototype) {
        eachRow([&](const MetaStruct& row) {
            for (const auto& field : row.GetFields()) {
                if (std::find(columns.begin(), columns.end(), field.name) == columns.end()) {
                    columns.push_back(field.name);
                }
            }
        });
    }
    if (columns.empty()) return;
    auto writeLine = [&](const std::vector<std::string>& cells) {
        for (size_t i = 0; i < cells.size(); ++i) out << (i ? "," : "") << CsvCell(cells[i]);
        out << '\n';
    };
    // The header waits for the first row, so that rows failing at once leave nothing written.
    bool headed = false;
    std::vector<std::string> cells(columns.size());
    eachRow([&](const MetaStruct& row) {
        for (size_t i = 0; i < columns.size(); ++i) {
            cells[i] = InlineText(row.FindField(columns[i]));
        }
        if (!std::exchange(headed, true)) writeLine(columns);
        writeLine(cells);
    });
    if (!headed) writeLine(columns);
}

void FormatCsv(const MetaObject& result, const FormatContext& context, std::ostream& out) {
    if (const MetaStruct* object = AsStruct(&result)) {
        const MetaStruct* declared = AsStruct(context.prototype.get());
        CsvRows([&](const auto& row) { row(*object); }, declared ? declared : object, false, out);
        return;
    }
    if (const MetaList* list = AsList(&result)) {
        if (list->GetElementType() == MetaObj::META_STRUCT) {
            auto eachRow = [&](const std::function<void(const MetaStruct&)>& row) {
                list->ForEach([&](const MetaObject& element) {
                    if (const MetaStruct* structure = AsStruct(&element)) row(*structure);
                });
            };
            CsvRows(eachRow, ElementPrototype(*list, context.prototype.get()), list->IsStreamed(),
                    out);
            return;
        }
        list->ForEach(
            [&](const MetaObject& element) { out << CsvCell(InlineText(&element)) << '\n'; });
        return;
    }
    out << CsvCell(InlineText(&result)) << '\n';
}

// --- keyvalue ---

std::string Escape(const std::string& text) {
    std::string escaped;
    escaped.reserve(text.size());
    for (char c : text) {
        if (c == '\\') {
            escaped += "\\\\";
        } else if (c == '\n') {
            escaped += "\\n";
        } else if (c == '\r') {
            escaped += "\\r";
        } else {
            escaped += c;
        }
    }
    return escaped;
}

void KeyValue(const std::string& key, const MetaObject* object, const MetaObject* prototype,
              std::ostream& out) {
    if (const MetaStruct* structure = AsStruct(object)) {
        const MetaStruct* declared = AsStruct(prototype);
        for (const auto* field : AllFields(*structure, declared)) {
            KeyValue(key + "." + field->name, field->value.get(),
                     DeclaredField(declared, field->name), out);
        }
        return;
    }
    if (const MetaList* list = AsList(object)) {
        const MetaStruct* elementPrototype = ElementPrototype(*list, prototype);
        size_t index = 0;
        list->ForEach([&](const MetaObject& element) {
            KeyValue(key + "[" + std::to_string(index++) + "]", &element, elementPrototype, out);
        });
        if (index == 0) out << key << "=\n";
        return;
    }
    out << key << '=' << Escape(InlineText(object)) << '\n';
}

void FormatKeyValue(const MetaObject& result, const FormatContext& context, std::ostream& out) {
    const MetaObject* prototype = context.prototype.get();
    switch (result.GetMetaType()) {
        case MetaObj::META_STRUCT:
            KeyValue(static_cast<const MetaStruct&>(result).GetName(), &result, prototype, out);
            return;
        case MetaObj::META_LIST: {
            const auto& list = static_cast<const MetaList&>(result);
            const MetaStruct* elementPrototype = ElementPrototype(list, prototype);
            size_t index = 0;
            list.ForEach([&](const MetaObject& element) {
                const MetaStruct* row = AsStruct(&element);
                const std::string name = row ? row->GetName() : std::string("String");
                KeyValue(name + "[" + std::to_string(index++) + "]", &element, elementPrototype,
                         out);
            });
            return;
        }
        case MetaObj::META_STRING:
            KeyValue("String", &result, nullptr, out);
            return;
        case MetaObj::META_INT:
            KeyValue("Integer", &result, nullptr, out);
            return;
        case MetaObj::META_BOOL:
            KeyValue("Boolean", &result, nullptr, out);
            return;
    }
}

std::string JsonText(const Json& json) {
    return json.dump(2, ' ', false, nlohmann::json::error_handler_t::replace);
}

// `text` with every line moved right by `indent` spaces.
void WriteIndented(const std::string& text, size_t indent, std::ostream& out) {
    const std::string pad(indent, ' ');
    size_t start = 0;
    for (size_t end = text.find('\n'); end != std::string::npos; end = text.find('\n', start)) {
        out << pad;
        out.write(text.data() + start, static_cast<std::streamsize>(end - start + 1));
        start = end + 1;
    }
    out << pad << std::string_view(text).substr(start);
}

// A list is written element by element, as the whole document would show it; nothing is written
// before its first element is ready, so a list that fails at once leaves no partial document.
void FormatJson(const MetaObject& result, const FormatContext& context, std::ostream& out) {
    const MetaList* list = AsList(&result);
    if (!list) {
        out << JsonText(ToJson(&result, context.prototype.get())) << '\n';
        return;
    }
    const MetaStruct* prototype = ElementPrototype(*list, context.prototype.get());
    bool any = false;
    list->ForEach([&](const MetaObject& element) {
        const std::string text = JsonText(ToJson(&element, prototype));
        out << (any ? ",\n" : "[\n");
        WriteIndented(text, 2, out);
        any = true;
    });
    out << (any ? "\n]\n" : "[]\n");
}

void FormatXml(const MetaObject& result, const FormatContext& context, std::ostream& out) {
    XmlWriter writer(out);
    const MetaList* list = AsList(&result);
    if (!list) {
        pugi::xml_document document;
        ToXml(&result, context.prototype.get(), document.append_child("output"));
        document.save(writer, "  ", pugi::format_default, pugi::encoding_utf8);
        return;
    }
    const char* const type =
        list->GetElementType() == MetaObj::META_STRUCT ? "structure" : "string";
    const std::string opening =
        std::string("<?xml version=\"1.0\"?>\n<output>\n  <list type=\"") + type + "\"";
    const MetaStruct* prototype = ElementPrototype(*list, context.prototype.get());
    bool any = false;
    list->ForEach([&](const MetaObject& element) {
        pugi::xml_document piece;
        ToXml(&element, prototype, piece);
        if (!any) out << opening << ">\n";
        piece.first_child().print(writer, "  ", pugi::format_default, pugi::encoding_utf8, 2);
        any = true;
    });
    out << (any ? "  </list>\n</output>\n" : opening + " />\n</output>\n");
}

// A table needs a list of structures; any other result is printed as simple prints it.
void FormatTableOrSimple(const MetaObject& result, const FormatContext& context,
                         std::ostream& out) {
    const MetaList* list = AsList(&result);
    if (list && list->GetElementType() == MetaObj::META_STRUCT) {
        FormatTable(*list, context, out);
    } else {
        FormatSimple(result, context, out);
    }
}

struct Formatter {
    const char* name;
    void (*write)(const MetaObject& result, const FormatContext& context, std::ostream& out);
};

// Every formatter, in the order the messages, the help and completion list them.
constexpr Formatter kFormatters[] = {
    {"simple", FormatSimple}, {"table", FormatTableOrSimple},
    {"json", FormatJson},     {"xml", FormatXml},
    {"csv", FormatCsv},       {"keyvalue", FormatKeyValue},
};

const Formatter* FindFormatter(const std::string& name) {
    for (const auto& formatter : kFormatters) {
        if (name == formatter.name) return &formatter;
    }
    return nullptr;
}

}  // namespace

bool IsFormatterName(const std::string& name) {
    return FindFormatter(name) != nullptr;
}

const std::vector<std::string>& FormatterNames() {
    static const std::vector<std::string> names = [] {
        std::vector<std::string> all;
        for (const auto& formatter : kFormatters) all.emplace_back(formatter.name);
        return all;
    }();
    return names;
}

void Format(const std::string& formatter, const MetaObj::MetaObject& result,
            const FormatContext& context, std::ostream& out) {
    const Formatter* found = FindFormatter(formatter);
    (found ? found->write : FormatSimple)(result, context, out);
}

nlohmann::ordered_json ResultJson(const MetaObj::MetaObject& result,
                                  const MetaObj::MetaObject* prototype) {
    return ToJson(&result, prototype);
}

}  // namespace CmdKit::Detail

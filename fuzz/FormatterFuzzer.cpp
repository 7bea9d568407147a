// The formatters on any stored text. Input: pieces of text, each a length byte and that many
// bytes; they fill a list of structures (a string field, a list field, a nested structure's
// field) that every formatter prints. Checks: every output is valid UTF-8 with no control
// character its format does not allow; json and xml parse, and xml holds no character XML 1.0
// forbids; keyvalue writes one line per value.
#include <algorithm>
#include <nlohmann/json.hpp>
#include <pugixml.hpp>
#include <sstream>

#include "../cmdkit/Internal.h"
#include "FuzzSupport.h"

namespace {

using namespace CmdKit;

std::vector<std::string> Pieces(const uint8_t* data, size_t size) {
    std::vector<std::string> pieces;
    for (size_t at = 0; at < size;) {
        const size_t length = std::min<size_t>(data[at], size - at - 1);
        pieces.emplace_back(reinterpret_cast<const char*>(data + at + 1), length);
        at += 1 + length;
    }
    return pieces;
}

// The first C0 control character or DEL not in `allowed`, or -1.
int StrayControl(const std::string& text, std::string_view allowed) {
    for (unsigned char c : text) {
        if ((c < 0x20 || c == 0x7F) &&
            allowed.find(static_cast<char>(c)) == std::string_view::npos) {
            return c;
        }
    }
    return -1;
}

// Character references the formatter may write: tab, line feed and carriage return.
bool OnlyAllowedReferences(const std::string& xml) {
    for (size_t at = xml.find("&#"); at != std::string::npos; at = xml.find("&#", at + 2)) {
        const size_t end = xml.find(';', at);
        if (end == std::string::npos) return false;
        const int code = std::atoi(xml.substr(at + 2, end - at - 2).c_str());
        if (code != 9 && code != 10 && code != 13) return false;
    }
    return true;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const auto pieces = Pieces(data, size);
    auto prototype = MetaObj::MetaStruct::New("Row");
    prototype->SetField("Name", "", MetaObj::MetaStruct::_docEmpty);
    prototype->SetField("Tags", std::vector<std::string>{}, MetaObj::MetaStruct::_docEmpty);
    auto list = MetaObj::MetaList::New(MetaObj::META_STRUCT, prototype);
    size_t values = 0;
    for (size_t i = 0; i < pieces.size(); i += 3) {
        auto row = MetaObj::MetaStruct::New("Row");
        row->SetField("Name", pieces[i], MetaObj::MetaStruct::_docEmpty);
        std::vector<std::string> tags(
            pieces.begin() + static_cast<long>(i) + 1,
            pieces.begin() + static_cast<long>(std::min(i + 3, pieces.size())));
        row->SetField("Tags", tags, MetaObj::MetaStruct::_docEmpty);
        auto inner = MetaObj::MetaStruct::New("Inner");
        inner->SetField("Note", pieces[i], MetaObj::MetaStruct::_docEmpty);
        row->SetField("Inner", inner, MetaObj::MetaStruct::_docEmpty);
        list->Add(row);
        values += 2 + std::max<size_t>(tags.size(), 1);
    }
    Detail::FormatContext context;
    context.prototype = MetaObj::MetaList::New(MetaObj::META_STRUCT, prototype);
    const std::vector<std::pair<std::string, std::string_view>> formatters = {
        {"simple", "\n\t"}, {"table", "\n"},   {"json", "\n\x7f"},
        {"xml", "\n\t"},    {"csv", "\n\r\t"}, {"keyvalue", "\n\t"}};
    for (const auto& [formatter, allowed] : formatters) {
        std::ostringstream out;
        Detail::Format(formatter, *list, context, out);
        const std::string text = out.str();
        BRIX_FUZZ_CHECK(BrixFuzz::ValidUtf8(text), formatter);
        BRIX_FUZZ_CHECK(StrayControl(text, allowed) < 0,
                        formatter + ": control " + std::to_string(StrayControl(text, allowed)));
        if (formatter == "json") {
            BRIX_FUZZ_CHECK(nlohmann::json::accept(text), text);
        } else if (formatter == "xml") {
            pugi::xml_document document;
            BRIX_FUZZ_CHECK(document.load_string(text.c_str()), text);
            BRIX_FUZZ_CHECK(OnlyAllowedReferences(text), text);
        } else if (formatter == "keyvalue") {
            const auto lines = static_cast<size_t>(std::count(text.begin(), text.end(), '\n'));
            BRIX_FUZZ_CHECK(lines == values, text);
        }
    }
    return 0;
}

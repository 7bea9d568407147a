// The framework's private pieces: option lookup, help and formatters.
#pragma once

#include <cstdint>
#include <iosfwd>
#include <map>
#include <memory>
#include <nlohmann/json_fwd.hpp>
#include <string>
#include <string_view>
#include <vector>

#include "cmdkit/AutoCli.h"

namespace CmdKit::Detail {

// The parameter an option word (`--name`, `--name=value`, `-n`, `-n=value`) names, or null.
// `hasInlineValue` tells whether the word carried `=value`.
std::shared_ptr<CallSpec::ParameterSpec> FindOption(const CallSpec::InputSpec& spec,
                                                    const std::string& word, bool& hasInlineValue);

// True when the parameter's value is the next word (no `=` in the option word).
inline bool TakesValue(const CallSpec::ParameterSpec& parameter) {
    return parameter.GetType() != CallSpec::PARAM_FLAG;
}

// Text helpers (Text.cpp).
// A parameter description with "%ENUM%" replaced by its constraint's values, comma-separated,
// and "%FULLENUM%" by each value with its description, each after `lineBreak`.
std::string ExpandEnumPlaceholders(const CallSpec::ParameterSpec& parameter,
                                   const std::string& description, const std::string& lineBreak);
void ReplaceAll(std::string& text, const std::string& from, const std::string& to);
// Breaks `text` into lines of at most `width` characters at spaces; explicit line breaks stay.
std::vector<std::string> Wrap(const std::string& text, size_t width);
std::string Join(const std::vector<std::string>& values, const std::string& separator);
// An integer range as help and the reference show it: "1..10", "at least 1", "at most 10", or
// empty for an unbounded one.
std::string RangeText(int64_t min, int64_t max);

// The help of a namespace or command, its usage line naming `program`.
void PrintHelp(AutoCli::NamespaceNode& node, const std::string& program, std::ostream& out);

using Hints = std::map<std::string, std::string>;

struct FormatContext {
    Hints hints;
    // The command's declared result, used for field order where the result's own order differs.
    std::shared_ptr<MetaObj::MetaObject> prototype;
    // Terminal width when standard output is a terminal, otherwise 0 (never cut or wrap).
    size_t terminalWidth = 0;
};

bool IsFormatterName(const std::string& name);
// Every formatter name, in the order the messages, the help and completion list them.
const std::vector<std::string>& FormatterNames();
// Writes `result` (non-null) with the named formatter (simple for an unknown name).
void Format(const std::string& formatter, const MetaObj::MetaObject& result,
            const FormatContext& context, std::ostream& out);
// `result` as the json formatter writes it, `prototype` giving the field order.
nlohmann::ordered_json ResultJson(const MetaObj::MetaObject& result,
                                  const MetaObj::MetaObject* prototype);

// `text` as valid UTF-8 without control characters: each ill-formed UTF-8 sequence, each
// control character (C0, DEL, C1) not in `kept` and the noncharacters U+FFFE and U+FFFF become
// U+FFFD.
std::string PrintableText(std::string_view text, std::string_view kept = "\t\n\r");

// A message as the tool prints it: on one line, escaped as MessageExcerpt does, cut after 1024
// characters.
std::string MessageLine(std::string_view message);

}  // namespace CmdKit::Detail

// Text made safe for output: valid UTF-8 for the formatters, one escaped line for messages.
#include "cmdkit/Text.h"

#include <boost/algorithm/string/replace.hpp>
#include <cstdint>
#include <cstdio>

#include "Internal.h"
#include "cmdkit/ConstraintRule.h"

namespace CmdKit {

namespace {

constexpr std::string_view kReplacement = "\xEF\xBF\xBD";  // U+FFFD

// One step through UTF-8 text: a well-formed character, or the longest start of one that
// breaks off (at least one byte), which counts as one ill-formed piece.
struct Utf8Piece {
    size_t size;
    char32_t codePoint;
    bool valid;
};

Utf8Piece NextUtf8(std::string_view text, size_t at) {
    const auto byte = [&](size_t i) { return static_cast<unsigned char>(text[i]); };
    const unsigned char lead = byte(at);
    if (lead < 0x80) return {1, lead, true};
    size_t length = 0;
    char32_t codePoint = 0;
    // The range of the second byte narrows for E0, ED, F0 and F4: no overlong forms, no
    // surrogates, nothing above U+10FFFF.
    unsigned char low = 0x80, high = 0xBF;
    if (lead >= 0xC2 && lead <= 0xDF) {
        length = 2;
        codePoint = lead & 0x1F;
    } else if (lead >= 0xE0 && lead <= 0xEF) {
        length = 3;
        codePoint = lead & 0x0F;
        if (lead == 0xE0) low = 0xA0;
        if (lead == 0xED) high = 0x9F;
    } else if (lead >= 0xF0 && lead <= 0xF4) {
        length = 4;
        codePoint = lead & 0x07;
        if (lead == 0xF0) low = 0x90;
        if (lead == 0xF4) high = 0x8F;
    } else {
        return {1, 0, false};
    }
    for (size_t i = 1; i < length; ++i) {
        if (at + i >= text.size() || byte(at + i) < low || byte(at + i) > high) {
            return {i, 0, false};
        }
        codePoint = (codePoint << 6) | (byte(at + i) & 0x3F);
        low = 0x80;
        high = 0xBF;
    }
    return {length, codePoint, true};
}

bool IsControl(char32_t c) {
    return c < 0x20 || (c >= 0x7F && c <= 0x9F);
}

// Characters that move text on a line or between lines without being seen: the line and
// paragraph separators and the bidirectional marks, embeddings, overrides and isolates.
bool IsInvisibleLayout(char32_t c) {
    return c == 0x200E || c == 0x200F || (c >= 0x2028 && c <= 0x202E) ||
           (c >= 0x2066 && c <= 0x2069);
}

void AppendEscape(std::string& out, const char* format, unsigned value) {
    char buffer[16];
    std::snprintf(buffer, sizeof buffer, format, value);
    out += buffer;
}

// `text` escaped as MessageExcerpt says, cut after `limit` characters.
std::string EscapedLine(std::string_view text, size_t limit) {
    std::string out;
    size_t shown = 0;
    for (size_t at = 0; at < text.size();) {
        const Utf8Piece piece = NextUtf8(text, at);
        std::string escaped;
        if (!piece.valid) {
            for (size_t i = 0; i < piece.size; ++i) {
                AppendEscape(escaped, "\\x%02x", static_cast<unsigned char>(text[at + i]));
            }
        } else if (piece.codePoint == '\n') {
            escaped = "\\n";
        } else if (piece.codePoint == '\t') {
            escaped = "\\t";
        } else if (piece.codePoint == '\r') {
            escaped = "\\r";
        } else if (piece.codePoint < 0x20 || piece.codePoint == 0x7F) {
            AppendEscape(escaped, "\\x%02x", static_cast<unsigned>(piece.codePoint));
        } else if (IsControl(piece.codePoint) || IsInvisibleLayout(piece.codePoint)) {
            AppendEscape(escaped, "\\u%04x", static_cast<unsigned>(piece.codePoint));
        }
        // An escape counts its characters; a character shown as itself counts one.
        const size_t width = escaped.empty() ? 1 : escaped.size();
        if (shown + width > limit) {
            return out + "... (" + std::to_string(text.size()) + " bytes)";
        }
        if (escaped.empty()) {
            out.append(text.substr(at, piece.size));
        } else {
            out += escaped;
        }
        shown += width;
        at += piece.size;
    }
    return out;
}

}  // namespace

std::string MarkdownText(std::string_view text) {
    std::string escaped;
    for (char c : text) {
        switch (c) {
            case '<':
                escaped += "&lt;";
                break;
            case '>':
                escaped += "&gt;";
                break;
            case '|':
                escaped += "\\|";
                break;
            case '\n':
                escaped += "<br>";
                break;
            default:
                escaped += c;
        }
    }
    return escaped;
}

std::string MarkdownCode(std::string_view text) {
    std::string escaped;
    for (char c : text) {
        if (c == '|') escaped += '\\';
        escaped += c;
    }
    const bool hasTick = escaped.find('`') != std::string::npos;
    return hasTick ? "`` " + escaped + " ``" : "`" + escaped + "`";
}

std::string MessageExcerpt(std::string_view value) {
    return EscapedLine(value, 128);
}

namespace Detail {

std::string PrintableText(std::string_view text, std::string_view kept) {
    // Most text is printable ASCII: it is taken as it is.
    size_t at = 0;
    while (at < text.size()) {
        const auto c = static_cast<unsigned char>(text[at]);
        if ((c < 0x20 && kept.find(static_cast<char>(c)) == std::string_view::npos) || c >= 0x7F) {
            break;
        }
        ++at;
    }
    if (at == text.size()) return std::string(text);
    std::string out(text.substr(0, at));
    out.reserve(text.size() + 8);
    while (at < text.size()) {
        const Utf8Piece piece = NextUtf8(text, at);
        const char32_t c = piece.codePoint;
        const bool keptControl =
            c < 0x20 && kept.find(static_cast<char>(c)) != std::string_view::npos;
        if (!piece.valid || (IsControl(c) && !keptControl) || c == 0xFFFE || c == 0xFFFF) {
            out += kReplacement;
        } else {
            out.append(text.substr(at, piece.size));
        }
        at += piece.size;
    }
    return out;
}

std::string MessageLine(std::string_view message) {
    return EscapedLine(message, 1024);
}

void ReplaceAll(std::string& text, const std::string& from, const std::string& to) {
    boost::algorithm::replace_all(text, from, to);
}

std::vector<std::string> Wrap(const std::string& text, size_t width) {
    std::vector<std::string> lines;
    size_t start = 0;
    while (start <= text.size()) {
        size_t end = text.find('\n', start);
        if (end == std::string::npos) end = text.size();
        std::string paragraph = text.substr(start, end - start);
        while (paragraph.size() > width) {
            size_t cut = paragraph.rfind(' ', width);
            if (cut == std::string::npos || cut == 0) cut = paragraph.find(' ', width);
            if (cut == std::string::npos) break;
            lines.push_back(paragraph.substr(0, cut));
            paragraph.erase(0, cut + 1);
        }
        lines.push_back(paragraph);
        start = end + 1;
    }
    return lines;
}

std::string Join(const std::vector<std::string>& values, const std::string& separator) {
    std::string text;
    for (const auto& value : values) {
        if (!text.empty()) text += separator;
        text += value;
    }
    return text;
}

std::string RangeText(int64_t min, int64_t max) {
    const bool hasMin = min != INT64_MIN;
    const bool hasMax = max != INT64_MAX;
    if (hasMin && hasMax) return std::to_string(min) + ".." + std::to_string(max);
    if (hasMin) return "at least " + std::to_string(min);
    if (hasMax) return "at most " + std::to_string(max);
    return "";
}

std::string ExpandEnumPlaceholders(const CallSpec::ParameterSpec& parameter,
                                   const std::string& description, const std::string& lineBreak) {
    std::string values;
    std::string full;
    const auto& constraint = parameter.GetConstraint();
    const auto* rule = constraint ? CallSpec::FindConstraintRule(constraint->GetType()) : nullptr;
    if (rule) {
        for (const auto& entry : rule->Values(*constraint)) {
            if (!values.empty()) values += ", ";
            values += entry.value;
            full += lineBreak + entry.value;
            if (!entry.description.empty()) full += ": " + entry.description;
        }
    }
    std::string text = description;
    ReplaceAll(text, "%FULLENUM%", full);
    ReplaceAll(text, "%ENUM%", values);
    return text;
}

}  // namespace Detail

}  // namespace CmdKit

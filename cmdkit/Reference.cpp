// The command reference in Markdown, generated from the command tree in tree order.
#include <cctype>
#include <deque>
#include <ostream>
#include <set>
#include <sstream>

#include "Internal.h"
#include "cmdkit/Cli.h"

namespace CmdKit {

namespace Detail {

namespace {

void ReplaceAll(std::string& text, const std::string& from, const std::string& to) {
    for (size_t at = text.find(from); at != std::string::npos;
         at = text.find(from, at + to.size())) {
        text.replace(at, from.size(), to);
    }
}

}  // namespace

std::string ExpandEnumPlaceholders(const CallSpec::ParameterSpec& parameter,
                                   const std::string& description, const std::string& lineBreak) {
    std::string values;
    std::string full;
    const auto& constraint = parameter.GetConstraint();
    if (constraint && constraint->GetType() == CallSpec::CONSTRAINT_STRING_ENUM) {
        for (const auto& entry : constraint->GetEnumValues()) {
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

namespace AutoCli {

namespace {

using MetaObj::MetaList;
using MetaObj::MetaObject;
using MetaObj::MetaStruct;

// Text for a table cell or paragraph: no HTML, no cell break, line breaks kept.
std::string Text(const std::string& text) {
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

// A code span; a table cell break inside it is escaped too.
std::string Code(const std::string& text) {
    std::string escaped;
    for (char c : text) {
        if (c == '|') escaped += '\\';
        escaped += c;
    }
    const bool hasTick = escaped.find('`') != std::string::npos;
    return hasTick ? "`` " + escaped + " ``" : "`" + escaped + "`";
}

// The heading anchor a Markdown renderer makes of a path.
std::string Anchor(const std::string& path) {
    std::string anchor;
    for (char c : path) {
        if (c == ' ') {
            anchor += '-';
        } else if (std::isalnum(static_cast<unsigned char>(c)) || c == '-' || c == '_') {
            anchor += static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
        }
    }
    return anchor;
}

std::string TypeName(int type) {
    switch (type) {
        case CallSpec::PARAM_STRING:
            return "string";
        case CallSpec::PARAM_INT:
            return "integer";
        case CallSpec::PARAM_BOOL:
            return "boolean";
        case CallSpec::PARAM_FLAG:
            return "flag";
        case CallSpec::PARAM_STRING_LIST:
            return "string list";
        default:
            return "?";
    }
}

std::string ConstraintText(const CallSpec::ParameterConstraint* constraint) {
    if (!constraint) return "";
    switch (constraint->GetType()) {
        case CallSpec::CONSTRAINT_STRING_ENUM: {
            // Values with descriptions one a line, bare values on one line.
            bool described = false;
            for (const auto& entry : constraint->GetEnumValues()) {
                described = described || !entry.description.empty();
            }
            std::string text = "one of:";
            const char* separator = " ";
            for (const auto& entry : constraint->GetEnumValues()) {
                text += (described ? "<br>" : separator) + Code(entry.value);
                if (!entry.description.empty()) text += ": " + Text(entry.description);
                separator = ", ";
            }
            return text;
        }
        case CallSpec::CONSTRAINT_INT_RANGE: {
            const bool hasMin = constraint->GetMin() != INT64_MIN;
            const bool hasMax = constraint->GetMax() != INT64_MAX;
            if (hasMin && hasMax) {
                return "range " + std::to_string(constraint->GetMin()) + ".." +
                       std::to_string(constraint->GetMax());
            }
            if (hasMin) return "at least " + std::to_string(constraint->GetMin());
            if (hasMax) return "at most " + std::to_string(constraint->GetMax());
            return "";
        }
        case CallSpec::CONSTRAINT_REGEX:
            return "matches " + Code(constraint->GetRegex());
        default:
            return "";
    }
}

// The type of a result or field; a structure met on the way is queued for its own table.
std::string ResultType(const MetaObject& object, std::deque<const MetaStruct*>& structures) {
    switch (object.GetMetaType()) {
        case MetaObj::META_STRING:
            return "string";
        case MetaObj::META_INT:
            return "integer";
        case MetaObj::META_BOOL:
            return "boolean";
        case MetaObj::META_STRUCT: {
            const auto& structure = static_cast<const MetaStruct&>(object);
            structures.push_back(&structure);
            return "structure " + Code(structure.GetName());
        }
        case MetaObj::META_LIST: {
            const auto& list = static_cast<const MetaList&>(object);
            if (list.GetElementType() == MetaObj::META_STRING) return "list of strings";
            if (!list.GetPrototype()) return "list of structures";
            structures.push_back(list.GetPrototype().get());
            return "list of " + Code(list.GetPrototype()->GetName()) + " structures";
        }
    }
    return "?";
}

void WriteParameters(const CallSpec::InputSpec& spec, std::ostream& out) {
    if (spec.GetParameters().empty()) {
        out << "Options: none.\n\n";
        return;
    }
    out << "| Option | Short | Type | Required | Constraint | Description |\n"
        << "|---|---|---|---|---|---|\n";
    for (const auto& parameter : spec.GetParameters()) {
        std::string description =
            Text(Detail::ExpandEnumPlaceholders(*parameter, parameter->GetDescription(), "\n"));
        if (parameter->IsSecret()) {
            description += std::string(description.empty() ? "" : " ") + "(secret: never echoed)";
        }
        out << "| " << Code("--" + parameter->GetName()) << " | "
            << (parameter->GetShortName().empty() ? "" : Code("-" + parameter->GetShortName()))
            << " | " << TypeName(parameter->GetType()) << " | "
            << (parameter->IsRequired() ? "yes" : "no") << " | "
            << ConstraintText(parameter->GetConstraint().get()) << " | " << description << " |\n";
    }
    out << '\n';
}

void WriteResult(const MetaObject* root, std::ostream& out) {
    if (!root) {
        out << "Result: none.\n\n";
        return;
    }
    std::deque<const MetaStruct*> structures;
    out << "Result: " << ResultType(*root, structures) << ".\n\n";
    std::set<std::string> written;
    while (!structures.empty()) {
        const MetaStruct* structure = structures.front();
        structures.pop_front();
        if (!written.insert(structure->GetName()).second) continue;
        out << "Fields of " << Code(structure->GetName()) << ":\n\n"
            << "| Field | Type |\n|---|---|\n";
        for (const auto& field : structure->GetFields()) {
            out << "| " << Code(field.name) << " | "
                << (field.value ? ResultType(*field.value, structures) : "?") << " |\n";
        }
        out << '\n';
    }
}

void WriteContents(NamespaceNode& node, size_t depth, std::ostream& out) {
    for (const auto& child : node.GetNamespaceNodes()) {
        const std::string path = child->GetPathString(' ');
        out << std::string(2 * depth, ' ') << "- [" << path << "](#" << Anchor(path) << ")\n";
        WriteContents(*child, depth + 1, out);
    }
}

void WriteNode(NamespaceNode& node, std::ostream& out) {
    const std::string path = node.GetPathString(' ');
    if (!path.empty()) {
        out << "## " << path << "\n\n";
        if (!node.GetDescription().empty()) out << Text(node.GetDescription()) << "\n\n";
        if (node.GetType() == NodeType::Command) {
            auto& command = dynamic_cast<CommandSpec&>(node);
            const std::string kind = command.GetMetaDataField("type");
            if (!kind.empty()) out << "Kind: " << Text(kind) << ". ";
            out << "Default formatter: " << Code(command.GetDefaultOutputFormatter()) << ".\n\n";
            WriteParameters(*command.GetInputSpec(), out);
            WriteResult(command.GetOutputSpec()->GetRootObject().get(), out);
            return;
        }
    }
    for (const auto& child : node.GetNamespaceNodes()) WriteNode(*child, out);
}

}  // namespace

void WriteReference(NamespaceNode& node, std::ostream& stream, const Program& program) {
    std::ostringstream out;
    out << "# " << program.name << " command reference\n\n"
        << "<!-- Generated by `" << program.name
        << " --reference` (scripts/gen-docs): do not edit. -->\n\n"
        << "Every namespace and command, in tree order, with its options and the fields of its "
           "result in output order. The global options (`--formatter`, `--help`, ...) are "
           "described in [command-line.md](command-line.md).\n\n";
    out << "## Contents\n\n";
    const std::string path = node.GetPathString(' ');
    if (!path.empty()) {
        out << "- [" << path << "](#" << Anchor(path) << ")\n";
        WriteContents(node, 1, out);
    } else {
        WriteContents(node, 0, out);
    }
    out << '\n';
    WriteNode(node, out);
    std::string text = out.str();
    while (!text.empty() && text.back() == '\n') text.pop_back();
    stream << text << '\n';
}

}  // namespace AutoCli

}  // namespace CmdKit

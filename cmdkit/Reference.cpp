// The command reference in Markdown, generated from the command tree in tree order.
#include <cctype>
#include <deque>
#include <ostream>
#include <set>
#include <sstream>

#include "Internal.h"
#include "cmdkit/Cli.h"
#include "cmdkit/ConstraintRule.h"
#include "cmdkit/Text.h"

namespace CmdKit {

namespace AutoCli {

namespace {

using MetaObj::MetaList;
using MetaObj::MetaObject;
using MetaObj::MetaStruct;

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
    const auto* rule = constraint ? CallSpec::FindConstraintRule(constraint->GetType()) : nullptr;
    return rule ? rule->ReferenceText(*constraint) : "";
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
            return "structure " + MarkdownCode(structure.GetName());
        }
        case MetaObj::META_LIST: {
            const auto& list = static_cast<const MetaList&>(object);
            if (list.GetElementType() == MetaObj::META_STRING) return "list of strings";
            if (!list.GetPrototype()) return "list of structures";
            structures.push_back(list.GetPrototype().get());
            return "list of " + MarkdownCode(list.GetPrototype()->GetName()) + " structures";
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
        std::string description = MarkdownText(
            Detail::ExpandEnumPlaceholders(*parameter, parameter->GetDescription(), "\n"));
        if (parameter->IsSecret()) {
            description += std::string(description.empty() ? "" : " ") + "(secret: never echoed)";
        }
        out << "| " << MarkdownCode("--" + parameter->GetName()) << " | "
            << (parameter->GetShortName().empty() ? ""
                                                  : MarkdownCode("-" + parameter->GetShortName()))
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
        out << "Fields of " << MarkdownCode(structure->GetName()) << ":\n\n"
            << "| Field | Type |\n|---|---|\n";
        for (const auto& field : structure->GetFields()) {
            out << "| " << MarkdownCode(field.name) << " | "
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
        if (!node.GetDescription().empty()) out << MarkdownText(node.GetDescription()) << "\n\n";
        if (node.GetType() == NodeType::Command) {
            auto& command = dynamic_cast<CommandSpec&>(node);
            const std::string kind = command.GetMetaDataField("type");
            if (!kind.empty()) out << "Kind: " << MarkdownText(kind) << ". ";
            out << "Default formatter: " << MarkdownCode(command.GetDefaultOutputFormatter())
                << ".\n\n";
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

// Help of namespaces and commands.
#include <algorithm>
#include <boost/algorithm/string/join.hpp>
#include <ostream>

#include "Internal.h"
#include "cmdkit/ConstraintRule.h"

namespace CmdKit::Detail {

namespace {

using AutoCli::CommandSpec;
using AutoCli::NamespaceNode;
using AutoCli::NodeType;

constexpr size_t kWidth = 100;

std::string TypeName(int type) {
    switch (type) {
        case CallSpec::PARAM_STRING:
            return "str";
        case CallSpec::PARAM_INT:
            return "long";
        case CallSpec::PARAM_BOOL:
            return "bool";
        case CallSpec::PARAM_FLAG:
            return "flag";
        case CallSpec::PARAM_STRING_LIST:
            return "str[]";
        default:
            return "?";
    }
}

void PrintIndented(std::ostream& out, const std::string& text, size_t indent) {
    for (const auto& line : Wrap(text, kWidth - indent)) {
        out << std::string(line.empty() ? 0 : indent, ' ') << line << '\n';
    }
}

std::string Usage(const NamespaceNode& node, const std::string& program) {
    std::string path = node.GetPathString(' ');
    std::string usage = "Usage: " + program +
                        " [--formatter=" + boost::algorithm::join(FormatterNames(), "|") + "]";
    if (!path.empty()) usage += " " + path;
    if (node.GetType() == NodeType::Command) return usage + " [cmd options]";
    return usage + " {cmd} [cmd options]";
}

// The parameter's description with "%ENUM%" and "%FULLENUM%" filled in, then its constraint
// where the description did not already show it, then the required marker.
std::string ParameterText(const CallSpec::ParameterSpec& parameter) {
    const std::string& description = parameter.GetDescription();
    const bool valuesShown = description.find("%ENUM%") != std::string::npos ||
                             description.find("%FULLENUM%") != std::string::npos;
    std::string text = ExpandEnumPlaceholders(parameter, description, "\n  ");
    const auto& constraint = parameter.GetConstraint();
    if (const auto* rule =
            constraint ? CallSpec::FindConstraintRule(constraint->GetType()) : nullptr) {
        const std::string note = rule->HelpNote(*constraint, valuesShown);
        if (!note.empty()) text += (text.empty() ? "" : " ") + note;
    }
    if (parameter.GetType() == CallSpec::PARAM_STRING_LIST) {
        text += (text.empty() ? "" : " ") + std::string("(may be repeated)");
    }
    if (parameter.IsRequired()) text += (text.empty() ? "" : " ") + std::string("(required)");
    return text;
}

std::string OptionSynopsis(const CallSpec::ParameterSpec& parameter) {
    std::string synopsis;
    if (!parameter.GetShortName().empty()) synopsis = "-" + parameter.GetShortName() + "|";
    synopsis += "--" + parameter.GetName();
    if (parameter.GetType() != CallSpec::PARAM_FLAG) {
        synopsis += "=<" + TypeName(parameter.GetType()) + ">";
    }
    return synopsis;
}

// Rows of two columns: the left column padded, the right one wrapped beside it.
void PrintColumns(std::ostream& out, const std::vector<std::pair<std::string, std::string>>& rows) {
    size_t left = 0;
    for (const auto& row : rows) left = std::max(left, row.first.size());
    const size_t indent = 2 + left + 2;
    const size_t width = kWidth > indent + 20 ? kWidth - indent : 20;
    for (const auto& [name, text] : rows) {
        auto lines = Wrap(text, width);
        out << "  " << name;
        if (lines.empty() || (lines.size() == 1 && lines[0].empty())) {
            out << '\n';
            continue;
        }
        out << std::string(left - name.size() + 2, ' ') << lines[0] << '\n';
        for (size_t i = 1; i < lines.size(); ++i) {
            out << std::string(lines[i].empty() ? 0 : indent, ' ') << lines[i] << '\n';
        }
    }
}

}  // namespace

void PrintHelp(NamespaceNode& node, const std::string& program, std::ostream& out) {
    out << Usage(node, program) << '\n';
    if (!node.GetDescription().empty()) {
        out << "\nDescription:\n";
        std::string text = node.GetDescription();
        if (node.GetType() == NodeType::Command) text = node.GetName() + ": " + text;
        PrintIndented(out, text, 2);
    }
    if (node.GetType() == NodeType::Command) {
        auto& command = dynamic_cast<CommandSpec&>(node);
        auto spec = command.GetInputSpec();
        out << "\nCmd options:\n";
        if (spec->GetParameters().empty()) {
            out << "  (none)\n";
            return;
        }
        std::vector<std::pair<std::string, std::string>> rows;
        for (const auto& parameter : spec->GetParameters()) {
            rows.emplace_back(OptionSynopsis(*parameter), ParameterText(*parameter));
        }
        PrintColumns(out, rows);
        return;
    }
    std::vector<std::pair<std::string, std::string>> namespaces;
    std::vector<std::pair<std::string, std::string>> commands;
    const auto names = node.GetNamespaceNodeNames();
    const auto children = node.GetNamespaceNodes();
    for (size_t i = 0; i < children.size(); ++i) {
        auto& list = children[i]->GetType() == NodeType::Command ? commands : namespaces;
        list.emplace_back(names[i], children[i]->GetDescription());
    }
    if (!namespaces.empty()) {
        out << "\nAvailable Namespaces:\n";
        PrintColumns(out, namespaces);
    }
    if (!commands.empty()) {
        out << "\nAvailable Commands:\n";
        PrintColumns(out, commands);
    }
}

}  // namespace CmdKit::Detail

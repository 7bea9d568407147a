// One invocation: global options, path resolution, parsing, dispatch and output.
#include "cmdkit/Cli.h"

#include <pwd.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <iostream>

#include "Internal.h"
#include "cmdkit/Text.h"

namespace CmdKit::AutoCli {

namespace {

void ExecuteDirectly(const std::function<void()>& execute) {
    execute();
}

std::atomic<ExecutionScope> executionScope{&ExecuteDirectly};

ExecutionScope CurrentExecutionScope() {
    return executionScope.load();
}

constexpr const char* kFormatters = "simple, table, json, xml, csv, keyvalue";

struct Globals {
    std::string formatter;
    bool help = false;
    bool listCommands = false;
    bool reference = false;
    std::string completionShell;
};

std::string ShellList() {
    std::string text;
    for (const auto& shell : CompletionShells()) text += (text.empty() ? "" : ", ") + shell;
    return text;
}

// Recognises a global option at args[i] (advancing i past a separate value). A command's own
// option of the same name wins, so `spec` is consulted first when given.
bool TakeGlobal(const std::vector<std::string>& args, size_t& i, Globals& globals) {
    const std::string& word = args[i];
    if (word == "--help" || word == "-h") {
        globals.help = true;
        return true;
    }
    if (word == "--list-commands") {
        globals.listCommands = true;
        return true;
    }
    if (word == "--reference") {
        globals.reference = true;
        return true;
    }
    if (word == "--completion" || word.rfind("--completion=", 0) == 0) {
        std::string shell;
        if (word.size() > 12) {
            shell = word.substr(13);
        } else if (i + 1 < args.size()) {
            shell = args[++i];
        } else {
            throw UsageError("Error: Missing value for --completion (one of: " + ShellList() + ")");
        }
        const auto& shells = CompletionShells();
        if (std::find(shells.begin(), shells.end(), shell) == shells.end()) {
            throw UsageError("Error: Unknown shell " + MessageExcerpt(shell) +
                             " (one of: " + ShellList() + ")");
        }
        globals.completionShell = shell;
        return true;
    }
    if (word == "--formatter" || word.rfind("--formatter=", 0) == 0) {
        std::string name;
        if (word.size() > 11) {
            name = word.substr(12);
        } else if (i + 1 < args.size()) {
            name = args[++i];
        } else {
            throw UsageError(
                "Error: Missing value for --formatter (one of: " + std::string(kFormatters) + ")");
        }
        if (!Detail::IsFormatterName(name)) {
            throw UsageError("Error: Unknown formatter " + MessageExcerpt(name) +
                             " (one of: " + kFormatters + ")");
        }
        globals.formatter = name;
        return true;
    }
    return false;
}

std::string LoginName() {
    if (const passwd* entry = getpwuid(geteuid()); entry && entry->pw_name) return entry->pw_name;
    const char* user = std::getenv("USER");
    return user ? user : "";
}

size_t TerminalWidth(const std::ostream& out) {
    if (&out != &std::cout || !isatty(STDOUT_FILENO)) return 0;
    winsize size{};
    if (ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0) return size.ws_col;
    if (const char* columns = std::getenv("COLUMNS")) {
        long width = std::atol(columns);
        if (width > 0) return static_cast<size_t>(width);
    }
    return 80;
}

void CollectCommands(NamespaceNode& node, MetaObj::MetaList& list) {
    for (const auto& child : node.GetNamespaceNodes()) {
        if (child->GetType() == NodeType::Command) {
            auto row = MetaObj::MetaStruct::New("Command");
            row->SetField("Command", child->GetPathString(' '), MetaObj::MetaStruct::_docEmpty);
            row->SetField("Description", child->GetDescription(), MetaObj::MetaStruct::_docEmpty);
            list.Add(row);
        } else {
            CollectCommands(*child, list);
        }
    }
}

std::string ChildList(const NamespaceNode& node) {
    std::string text;
    for (const auto& name : node.GetNamespaceNodeNames()) {
        if (!text.empty()) text += ", ";
        text += name;
    }
    return text.empty() ? "(none)" : text;
}

// A command's messages, each on its own line whatever it holds.
void WriteMessages(const CallSpec::Output& output, std::ostream& err) {
    for (const auto& message : output.GetErrorMessages())
        err << Detail::MessageLine(message) << '\n';
}

int Run(const std::shared_ptr<NamespaceNode>& root, const std::vector<std::string>& args,
        std::ostream& out, std::ostream& err, bool execute) {
    Globals globals;
    size_t i = 0;
    // Global options before the path.
    while (i < args.size() && !args[i].empty() && args[i][0] == '-') {
        if (!TakeGlobal(args, i, globals)) {
            throw UsageError("Error: Unknown option " +
                             MessageExcerpt(args[i].substr(0, args[i].find('='))));
        }
        ++i;
    }
    // The path: words naming children, as far as they go.
    std::shared_ptr<NamespaceNode> node = root;
    while (i < args.size() && node->GetType() != NodeType::Command) {
        const std::string& word = args[i];
        if (!word.empty() && word[0] == '-') break;
        auto child = node->GetNamespaceNode(word);
        if (!child) {
            std::string path = node->GetPathString(' ');
            const std::string shown = MessageExcerpt(word);
            std::string full = path.empty() ? shown : path + " " + shown;
            err << "Error: Unknown command or namespace " << full << '\n';
            err << "Valid choices" << (path.empty() ? "" : " under " + path) << ": "
                << ChildList(*node) << '\n';
            return 2;
        }
        node = std::move(child);
        ++i;
    }

    std::shared_ptr<CallSpec::InputSpec> spec;
    if (node->GetType() == NodeType::Command) {
        spec = dynamic_cast<CommandSpec&>(*node).GetInputSpec();
    }
    // Global options among the command's own; a value word of a command option is skipped.
    std::vector<std::string> rest;
    for (; i < args.size(); ++i) {
        bool inlineValue = false;
        auto parameter = spec ? Detail::FindOption(*spec, args[i], inlineValue) : nullptr;
        if (parameter) {
            rest.push_back(args[i]);
            if (!inlineValue && Detail::TakesValue(*parameter) && i + 1 < args.size()) {
                rest.push_back(args[++i]);
            }
            continue;
        }
        if (!TakeGlobal(args, i, globals)) rest.push_back(args[i]);
    }

    if (globals.help) {
        Detail::PrintHelp(*node, out);
        return 0;
    }
    // Generated from the whole tree whatever the path: the script completes every path.
    if (!globals.completionShell.empty()) {
        WriteCompletionScript(*root, globals.completionShell, out);
        return 0;
    }
    if (globals.reference) {
        WriteReference(*node, out);
        return 0;
    }
    if (globals.listCommands) {
        auto prototype = MetaObj::MetaStruct::New("Command");
        prototype->SetField("Command", "", MetaObj::MetaStruct::_docEmpty);
        prototype->SetField("Description", "", MetaObj::MetaStruct::_docEmpty);
        auto list = MetaObj::MetaList::New(MetaObj::META_STRUCT, prototype);
        if (node->GetType() == NodeType::Command) {
            auto row = MetaObj::MetaStruct::New("Command");
            row->SetField("Command", node->GetPathString(' '), MetaObj::MetaStruct::_docEmpty);
            row->SetField("Description", node->GetDescription(), MetaObj::MetaStruct::_docEmpty);
            list->Add(row);
        } else {
            CollectCommands(*node, *list);
        }
        Detail::FormatContext context;
        context.terminalWidth = TerminalWidth(out);
        context.prototype = list;
        Detail::Format(globals.formatter.empty() ? "table" : globals.formatter, *list, context,
                       out);
        return 0;
    }
    if (node->GetType() != NodeType::Command) {
        if (!rest.empty()) {
            const std::string& word = rest.front();
            if (!word.empty() && word[0] == '-') {
                err << "Error: Unknown option " << MessageExcerpt(word.substr(0, word.find('=')))
                    << '\n';
                return 2;
            }
        }
        std::string path = node->GetPathString(' ');
        err << "Error: Missing command" << (path.empty() ? "" : " after " + path) << '\n';
        err << '\n';
        Detail::PrintHelp(*node, err);
        return 2;
    }

    auto& command = dynamic_cast<Command&>(*node);
    auto input = ParseArguments(*spec, rest);
    if (!execute) return 0;
    for (const auto& context : spec->GetSupportedContexts()) {
        if (context == "user") input->SetContext("user", LoginName());
    }
    auto output = CallSpec::Output::New();
    try {
        CurrentExecutionScope()([&] { command.GetDispatcher()->Execute(input, output); });
    } catch (const std::exception& error) {
        WriteMessages(*output, err);
        err << Detail::MessageLine(std::string("Error: ") + error.what()) << '\n';
        return 1;
    } catch (...) {
        WriteMessages(*output, err);
        err << "Error: the command failed with an unknown exception\n";
        return 1;
    }

    WriteMessages(*output, err);
    if (const auto& result = output->GetRootObject()) {
        std::string formatter = globals.formatter;
        if (formatter.empty()) formatter = command.GetDefaultOutputFormatter();
        if (!Detail::IsFormatterName(formatter)) formatter = "simple";
        Detail::FormatContext context;
        context.hints = command.GetDefaultOutputParameters();
        context.prototype = command.GetOutputSpec()->GetRootObject();
        context.terminalWidth = TerminalWidth(out);
        Detail::Format(formatter, *result, context, out);
    }
    out.flush();
    return output->GetErrorMessages().empty() ? 0 : 1;
}

// RunCli and DryRunCli: the framework's refusals exit with 2, any other failure with 1.
int Guarded(const std::shared_ptr<NamespaceNode>& root, const std::vector<std::string>& args,
            std::ostream& out, std::ostream& err, bool execute) {
    try {
        if (!root) throw CmdKitException("No command tree");
        return Run(root, args, out, err, execute);
    } catch (const UsageError& error) {
        err << error.what() << '\n';
        return 2;
    } catch (const std::exception& error) {
        err << Detail::MessageLine(std::string("Error: ") + error.what()) << '\n';
        return 1;
    }
}

}  // namespace

void SetExecutionScope(ExecutionScope scope) {
    executionScope.store(scope ? scope : &ExecuteDirectly);
}

int RunCli(const std::shared_ptr<NamespaceNode>& root, const std::vector<std::string>& args,
           std::ostream& out, std::ostream& err) {
    return Guarded(root, args, out, err, true);
}

int DryRunCli(const std::shared_ptr<NamespaceNode>& root, const std::vector<std::string>& args,
              std::ostream& out, std::ostream& err) {
    return Guarded(root, args, out, err, false);
}

}  // namespace CmdKit::AutoCli

// One invocation in four steps: its global options, the path to its node, dispatch, and printing.
#include "cmdkit/Cli.h"

#include <pwd.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <boost/algorithm/string/join.hpp>
#include <cstdlib>
#include <iostream>
#include <optional>
#include <sstream>

#include "Invocation.h"
#include "cmdkit/Text.h"

namespace CmdKit::AutoCli {

namespace {

using Detail::Outcome;

void ExecuteDirectly(const std::function<void()>& execute) {
    execute();
}

std::atomic<ExecutionScope> executionScope{&ExecuteDirectly};

ExecutionScope CurrentExecutionScope() {
    return executionScope.load();
}

// The options a command line may give anywhere.
struct Globals {
    std::string formatter;
    bool help = false;
    bool listCommands = false;
    bool reference = false;
    bool version = false;
    bool verbose = false;
    std::string completionShell;
    std::optional<std::string> batch;
    bool stopOnError = false;
};

// " (one of: a, b)" for the messages about a value.
std::string OneOf(const std::vector<std::string>& names) {
    return " (one of: " + boost::algorithm::join(names, ", ") + ")";
}

// When args[i] is `name=VALUE` or `name` (its value then the next word, skipped), sets `value`.
// A missing value is refused, naming `choices` when there are any.
bool TakeValue(const std::vector<std::string>& args, size_t& i, const std::string& name,
               const std::vector<std::string>& choices, std::string& value) {
    const std::string& word = args[i];
    if (word.compare(0, name.size(), name) != 0) return false;
    if (word.size() > name.size()) {
        if (word[name.size()] != '=') return false;
        value = word.substr(name.size() + 1);
    } else if (i + 1 < args.size()) {
        value = args[++i];
    } else {
        throw UsageError("Error: Missing value for " + name +
                         (choices.empty() ? "" : OneOf(choices)));
    }
    return true;
}

// Recognises a global option at args[i] (advancing i past a separate value).
bool TakeGlobal(const std::vector<std::string>& args, size_t& i, Globals& globals) {
    const std::string& word = args[i];
    bool* flag = word == "--help" || word == "-h" ? &globals.help
                 : word == "--list-commands"      ? &globals.listCommands
                 : word == "--reference"          ? &globals.reference
                 : word == "--version"            ? &globals.version
                 : word == "--verbose"            ? &globals.verbose
                 : word == "--stop-on-error"      ? &globals.stopOnError
                                                  : nullptr;
    if (flag) {
        *flag = true;
        return true;
    }
    std::string value;
    if (TakeValue(args, i, "--completion", CompletionShells(), value)) {
        const auto& shells = CompletionShells();
        if (std::find(shells.begin(), shells.end(), value) == shells.end()) {
            throw UsageError("Error: Unknown shell " + MessageExcerpt(value) + OneOf(shells));
        }
        globals.completionShell = value;
        return true;
    }
    if (TakeValue(args, i, "--formatter", Detail::FormatterNames(), value)) {
        if (!Detail::IsFormatterName(value)) {
            throw UsageError("Error: Unknown formatter " + MessageExcerpt(value) +
                             OneOf(Detail::FormatterNames()));
        }
        globals.formatter = value;
        return true;
    }
    if (TakeValue(args, i, "--batch", {}, value)) {
        globals.batch = value;
        return true;
    }
    return false;
}

// A command line read up to its command: the global options, the node the path reaches, and
// the words left for the command.
struct Request {
    Globals globals;
    std::shared_ptr<NamespaceNode> node;
    std::shared_ptr<CallSpec::InputSpec> spec;  // the command's, when the node is one
    std::vector<std::string> words;
};

std::string ChildList(const NamespaceNode& node) {
    std::string text;
    for (const auto& name : node.GetNamespaceNodeNames()) {
        if (!text.empty()) text += ", ";
        text += name;
    }
    return text.empty() ? "(none)" : text;
}

Request ReadRequest(const std::shared_ptr<NamespaceNode>& root,
                    const std::vector<std::string>& args) {
    Request request;
    Globals& globals = request.globals;
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
    request.node = root;
    while (i < args.size() && request.node->GetType() != NodeType::Command) {
        const std::string& word = args[i];
        if (!word.empty() && word[0] == '-') break;
        auto child = request.node->GetNamespaceNode(word);
        if (!child) {
            std::string path = request.node->GetPathString(' ');
            throw UsageError(
                "Error: Unknown command or namespace " +
                (path.empty() ? MessageExcerpt(word) : path + " " + MessageExcerpt(word)) +
                "\nValid choices" + (path.empty() ? "" : " under " + path) + ": " +
                ChildList(*request.node));
        }
        request.node = std::move(child);
        ++i;
    }

    if (request.node->GetType() == NodeType::Command) {
        request.spec = dynamic_cast<CommandSpec&>(*request.node).GetInputSpec();
    }
    // Global options among the command's own; a value word of a command option is skipped.
    for (; i < args.size(); ++i) {
        bool inlineValue = false;
        auto parameter =
            request.spec ? Detail::FindOption(*request.spec, args[i], inlineValue) : nullptr;
        if (parameter) {
            request.words.push_back(args[i]);
            if (!inlineValue && Detail::TakesValue(*parameter) && i + 1 < args.size()) {
                request.words.push_back(args[++i]);
            }
            continue;
        }
        if (!TakeGlobal(args, i, globals)) request.words.push_back(args[i]);
    }
    return request;
}

std::string LoginName() {
    if (const passwd* entry = getpwuid(geteuid()); entry && entry->pw_name) return entry->pw_name;
    const char* user = std::getenv("USER");
    return user ? user : "";
}

Outcome Text(std::string text) {
    Outcome outcome;
    outcome.text = std::move(text);
    return outcome;
}

Outcome Failure(int status, std::vector<std::string> messages) {
    Outcome outcome;
    outcome.status = status;
    outcome.messages = std::move(messages);
    return outcome;
}

std::string VersionText(const Program& program, bool verbose) {
    std::string text = program.name;
    if (!program.version.empty()) text += " " + program.version;
    text += '\n';
    if (!verbose) return text;
    text += "Plug-ins:\n";
    for (const auto& plugin : program.plugins) text += "  " + plugin + '\n';
    if (program.plugins.empty()) text += "  (none)\n";
    return text;
}

std::shared_ptr<MetaObj::MetaStruct> CommandRow(const NamespaceNode& node) {
    auto row = MetaObj::MetaStruct::New("Command");
    row->SetField("Command", node.GetPathString(' '), MetaObj::MetaStruct::_docEmpty);
    row->SetField("Description", node.GetDescription(), MetaObj::MetaStruct::_docEmpty);
    return row;
}

void CollectCommands(const NamespaceNode& node, MetaObj::MetaList& list) {
    if (node.GetType() == NodeType::Command) {
        list.Add(CommandRow(node));
        return;
    }
    for (const auto& child : node.GetNamespaceNodes()) CollectCommands(*child, list);
}

Outcome ListCommands(const NamespaceNode& node, const std::string& formatter) {
    auto prototype = MetaObj::MetaStruct::New("Command");
    prototype->SetField("Command", "", MetaObj::MetaStruct::_docEmpty);
    prototype->SetField("Description", "", MetaObj::MetaStruct::_docEmpty);
    auto list = MetaObj::MetaList::New(MetaObj::META_STRUCT, prototype);
    CollectCommands(node, *list);
    Outcome outcome;
    outcome.result = list;
    outcome.formatter = formatter.empty() ? "table" : formatter;
    outcome.context.prototype = list;
    return outcome;
}

// A command's messages, each made one line whatever it holds.
std::vector<std::string> MessageLines(const CallSpec::Output& output) {
    std::vector<std::string> lines;
    for (const auto& message : output.GetErrorMessages())
        lines.push_back(Detail::MessageLine(message));
    return lines;
}

// Parses the command's words and runs it inside the execution scope.
Outcome Execute(Command& command, const Request& request, bool execute) {
    auto input = ParseArguments(*request.spec, request.words);
    if (!execute) return {};
    for (const auto& context : request.spec->GetSupportedContexts()) {
        if (context == "user") input->SetContext("user", LoginName());
    }
    auto output = CallSpec::Output::New();
    try {
        CurrentExecutionScope()([&] { command.GetDispatcher()->Execute(input, output); });
    } catch (const std::exception& error) {
        auto messages = MessageLines(*output);
        messages.push_back(Detail::MessageLine("Error: " + std::string(error.what())));
        return Failure(1, std::move(messages));
    } catch (...) {
        auto messages = MessageLines(*output);
        messages.push_back("Error: the command failed with an unknown exception");
        return Failure(1, std::move(messages));
    }

    Outcome outcome;
    outcome.messages = MessageLines(*output);
    outcome.status = outcome.messages.empty() ? 0 : 1;
    if ((outcome.result = output->GetRootObject())) {
        outcome.formatter = request.globals.formatter;
        if (outcome.formatter.empty()) outcome.formatter = command.GetDefaultOutputFormatter();
        if (!Detail::IsFormatterName(outcome.formatter)) outcome.formatter = "simple";
        outcome.context.hints = command.GetDefaultOutputParameters();
        outcome.context.prototype = command.GetOutputSpec()->GetRootObject();
    }
    return outcome;
}

// What the request asks for: help, version, completion, reference, the command list, or the
// command's run.
Outcome Dispatch(const Program& program, NamespaceNode& root, const Request& request,
                 bool execute) {
    const Globals& globals = request.globals;
    NamespaceNode& node = *request.node;
    std::ostringstream text;
    if (globals.help) {
        Detail::PrintHelp(node, program.name, text);
        return Text(text.str());
    }
    if (globals.stopOnError) throw UsageError("Error: --stop-on-error needs --batch");
    if (globals.verbose && !globals.version) throw UsageError("Error: --verbose needs --version");
    if (globals.version) return Text(VersionText(program, globals.verbose));
    // Generated from the whole tree whatever the path: the script completes every path.
    if (!globals.completionShell.empty()) {
        WriteCompletionScript(root, globals.completionShell, text, program);
        return Text(text.str());
    }
    if (globals.reference) {
        WriteReference(node, text, program);
        return Text(text.str());
    }
    if (globals.listCommands) return ListCommands(node, globals.formatter);
    if (node.GetType() != NodeType::Command) {
        if (!request.words.empty()) {
            const std::string& word = request.words.front();
            if (!word.empty() && word[0] == '-') {
                throw UsageError("Error: Unknown option " +
                                 MessageExcerpt(word.substr(0, word.find('='))));
            }
        }
        std::string path = node.GetPathString(' ');
        Detail::PrintHelp(node, program.name, text);
        std::string help = text.str();
        if (!help.empty() && help.back() == '\n') help.pop_back();
        return Failure(
            2, {"Error: Missing command" + (path.empty() ? "" : " after " + path) + "\n\n" + help});
    }
    return Execute(dynamic_cast<Command&>(node), request, execute);
}

// The outcome of `answer`, or of the exception it throws: the framework's refusals give 2,
// any other failure 1.
template <class Answer>
Outcome Guarded(Answer&& answer) {
    try {
        return answer();
    } catch (const UsageError& error) {
        // One message a line: "Unknown command" comes with the valid choices.
        std::vector<std::string> messages;
        std::istringstream lines(error.what());
        for (std::string line; std::getline(lines, line);) messages.push_back(line);
        return Failure(2, std::move(messages));
    } catch (const std::exception& error) {
        return Failure(1, {Detail::MessageLine("Error: " + std::string(error.what()))});
    }
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

// A single invocation, or with --batch the command lines of its file.
int Run(const Program& program, const std::shared_ptr<NamespaceNode>& root,
        const std::vector<std::string>& args, std::ostream& out, std::ostream& err, bool execute) {
    std::optional<Detail::Batch> batch;
    Outcome outcome = Guarded([&] {
        if (!root) throw CmdKitException("No command tree");
        Request request = ReadRequest(root, args);
        const Globals& globals = request.globals;
        if (!globals.batch) return Dispatch(program, *root, request, execute);
        if (request.node != root || !request.words.empty()) {
            const std::string path = request.node->GetPathString(' ');
            throw UsageError(
                "Error: Unexpected argument " +
                (path.empty() ? request.words.front() : path.substr(0, path.find(' '))));
        }
        if (globals.help || globals.listCommands || globals.reference || globals.version ||
            globals.verbose || !globals.completionShell.empty()) {
            throw UsageError("Error: --batch takes only --formatter and --stop-on-error");
        }
        batch = Detail::Batch{*globals.batch, globals.formatter, globals.stopOnError};
        return Outcome{};
    });
    // A dry run stops before the commands, so before reading the batch's file.
    if (batch) return execute ? Detail::RunBatch(program, root, *batch, out, err) : 0;
    return Detail::Print(outcome, out, err);
}

}  // namespace

void SetExecutionScope(ExecutionScope scope) {
    executionScope.store(scope ? scope : &ExecuteDirectly);
}

int RunCli(const std::shared_ptr<NamespaceNode>& root, const std::vector<std::string>& args,
           std::ostream& out, std::ostream& err, const Program& program) {
    return Run(program, root, args, out, err, true);
}

int DryRunCli(const std::shared_ptr<NamespaceNode>& root, const std::vector<std::string>& args,
              std::ostream& out, std::ostream& err, const Program& program) {
    return Run(program, root, args, out, err, false);
}

}  // namespace CmdKit::AutoCli

namespace CmdKit::Detail {

Outcome RunLine(const AutoCli::Program& program,
                const std::shared_ptr<AutoCli::NamespaceNode>& root,
                const std::vector<std::string>& words, const std::string& formatter) {
    return AutoCli::Guarded([&] {
        AutoCli::Request request = AutoCli::ReadRequest(root, words);
        if (request.globals.batch) throw UsageError("Error: --batch cannot be used in a batch");
        if (request.globals.formatter.empty()) request.globals.formatter = formatter;
        return AutoCli::Dispatch(program, *root, request, true);
    });
}

std::string RowFailureLine(const std::exception& error) {
    if (dynamic_cast<const MetaObj::RowError*>(&error)) return MessageLine(error.what());
    return MessageLine("Error: " + std::string(error.what()));
}

int Print(const Outcome& outcome, std::ostream& out, std::ostream& err, const std::string& prefix) {
    auto writeMessage = [&](const std::string& message) {
        if (prefix.empty()) {
            err << message << '\n';
            return;
        }
        std::istringstream lines(message);
        for (std::string line; std::getline(lines, line);) err << prefix << line << '\n';
    };
    for (const auto& message : outcome.messages) writeMessage(message);
    int status = outcome.status;
    if (outcome.result) {
        FormatContext context = outcome.context;
        context.terminalWidth = AutoCli::TerminalWidth(out);
        try {
            Format(outcome.formatter, *outcome.result, context, out);
        } catch (const std::exception& error) {
            out.flush();
            writeMessage(RowFailureLine(error));
            status = 1;
        }
    } else {
        out << outcome.text;
    }
    out.flush();
    return status;
}

}  // namespace CmdKit::Detail

// The tool's side of the framework: argument parsing, help, formatting and dispatch.
#pragma once

#include <iosfwd>
#include <memory>
#include <string>
#include <vector>

#include "cmdkit/AutoCli.h"

namespace CmdKit::AutoCli {

// Parses option words against a command's declared input. Throws UsageError with the
// framework's message for an unknown, repeated (non-list), missing or ill-typed option or a
// constraint violation.
std::shared_ptr<CallSpec::Input> ParseArguments(const CallSpec::InputSpec& spec,
                                                const std::vector<std::string>& args);

// What the tool tells the framework about itself.
struct Program {
    std::string name = "brixcli";
    // Printed by --version after the name.
    std::string version;
    // The plug-ins the tool loaded, listed by --version --verbose.
    std::vector<std::string> plugins;
};

// Runs one invocation: `args` are the words after the program name, e.g.
// {"--formatter=json", "system", "uuid", "get"}. Writes the result to `out`, messages to `err`
// and returns the exit status (0 ok, 1 the command reported errors, 2 refused by the framework).
// With `--batch FILE` (`-`: standard input) it runs every command line of FILE in turn and
// returns the worst of their statuses.
int RunCli(const std::shared_ptr<NamespaceNode>& root, const std::vector<std::string>& args,
           std::ostream& out, std::ostream& err, const Program& program = {});

// The shells WriteCompletionScript knows, e.g. {"bash", "zsh"}.
const std::vector<std::string>& CompletionShells();

// Writes a self-contained completion script for `shell` (one of CompletionShells()) that
// completes the paths, options and option values of the tree under `root` as it is now, for the
// program's name (letters, digits and '_' only: it also names the script's functions).
void WriteCompletionScript(NamespaceNode& root, const std::string& shell, std::ostream& out,
                           const Program& program = {});

// Writes the Markdown reference of every path under `node`, in tree order: descriptions,
// parameters and result fields.
void WriteReference(NamespaceNode& node, std::ostream& out, const Program& program = {});

// RunCli up to, but not including, the command's execution: global options, path resolution,
// help, the command list and the parsing of the command's arguments, with RunCli's output and
// status. An invocation that would run a command, or a batch (whose file is not read), returns
// 0 and prints nothing; nothing on the host is read or changed.
int DryRunCli(const std::shared_ptr<NamespaceNode>& root, const std::vector<std::string>& args,
              std::ostream& out, std::ostream& err, const Program& program = {});

}  // namespace CmdKit::AutoCli

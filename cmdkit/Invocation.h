// One command line from its words to what it prints, shared by a single invocation and a batch.
#pragma once

#include <iosfwd>
#include <memory>
#include <string>
#include <vector>

#include "Internal.h"
#include "cmdkit/Cli.h"

namespace CmdKit::Detail {

// What a command line gives: its exit status, its messages for standard error, and its result
// (or a text such as help) for standard output.
struct Outcome {
    int status = 0;
    // Each may hold several lines (the help after "Missing command").
    std::vector<std::string> messages;
    std::shared_ptr<MetaObj::MetaObject> result;
    std::string formatter;  // the result's
    FormatContext context;  // the result's hints and prototype
    std::string text;       // help, reference, completion script or version: printed as it is
};

// Runs one command line of a batch: `words` as RunCli takes them, `--batch` refused, the
// formatter `formatter` unless the line gives its own.
Outcome RunLine(const AutoCli::Program& program,
                const std::shared_ptr<AutoCli::NamespaceNode>& root,
                const std::vector<std::string>& words, const std::string& formatter);

// Writes the messages to `err`, each of their lines after `prefix`, then the result or the text
// to `out`, and flushes `out`. Returns the outcome's status, or 1 when the result's rows could not
// all be read while it was written (the reason then follows on `err`).
int Print(const Outcome& outcome, std::ostream& out, std::ostream& err,
          const std::string& prefix = std::string());

// The message line of a failure to read a result's rows while it is written.
std::string RowFailureLine(const std::exception& error);

struct Batch {
    std::string file;  // "-": standard input
    std::string formatter;
    bool stopOnError = false;
};

// Runs every command line of the batch's file and returns the worst status.
int RunBatch(const AutoCli::Program& program, const std::shared_ptr<AutoCli::NamespaceNode>& root,
             const Batch& batch, std::ostream& out, std::ostream& err);

// Splits a command line into words as a POSIX shell does, without any expansion: blanks
// separate words; 'single quotes' keep everything; "double quotes" keep everything but \" \\ \$
// and \` ; a backslash outside quotes keeps the next character; quotes next to other text join
// it, and "" is an empty word. Throws UsageError for an open quote or a trailing backslash.
std::vector<std::string> SplitWords(const std::string& line);

}  // namespace CmdKit::Detail

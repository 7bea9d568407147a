// Many command lines in one process: each line is split like a shell's, run as its own
// invocation (so it sees what the lines before it changed) and printed as soon as it is done.
#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <iostream>
#include <nlohmann/json.hpp>

#include "Invocation.h"

namespace CmdKit::Detail {

namespace {

bool IsBlank(char c) {
    return c == ' ' || c == '\t' || c == '\r' || c == '\v' || c == '\f';
}

// One line as NDJSON: the line's number and text, its status, its messages and its result (the
// result as the json formatter gives it, a printed text as a string, or null).
// Returns the line's status: the outcome's, or 1 when the result's rows could not all be read.
int PrintJsonLine(size_t number, const std::string& line, const Outcome& outcome,
                  std::ostream& out) {
    nlohmann::ordered_json document;
    document["line"] = number;
    document["input"] = line;
    int status = outcome.status;
    auto messages = outcome.messages;
    nlohmann::ordered_json result = nullptr;
    if (outcome.result) {
        try {
            result = ResultJson(*outcome.result, outcome.context.prototype.get());
        } catch (const std::exception& error) {
            messages.push_back(RowFailureLine(error));
            status = 1;
        }
    } else if (!outcome.text.empty()) {
        result = outcome.text;
    }
    document["status"] = status;
    document["messages"] = messages;
    document["result"] = std::move(result);
    out << document.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace) << '\n';
    out.flush();
    return status;
}

}  // namespace

std::vector<std::string> SplitWords(const std::string& line) {
    std::vector<std::string> words;
    std::string word;
    bool inWord = false;
    for (size_t i = 0; i < line.size(); ++i) {
        const char c = line[i];
        if (IsBlank(c)) {
            if (inWord) words.push_back(std::move(word));
            word.clear();
            inWord = false;
            continue;
        }
        inWord = true;
        if (c == '\\') {
            if (++i == line.size()) throw UsageError("Error: The line ends with a backslash");
            word += line[i];
        } else if (c == '\'') {
            const size_t end = line.find('\'', i + 1);
            if (end == std::string::npos) throw UsageError("Error: Unmatched ' in the line");
            word.append(line, i + 1, end - i - 1);
            i = end;
        } else if (c == '"') {
            for (++i;; ++i) {
                if (i == line.size()) throw UsageError("Error: Unmatched \" in the line");
                if (line[i] == '"') break;
                if (line[i] == '\\' && i + 1 < line.size() &&
                    std::strchr("\"\\$`", line[i + 1]) != nullptr) {
                    ++i;
                }
                word += line[i];
            }
        } else {
            word += c;
        }
    }
    if (inWord) words.push_back(std::move(word));
    return words;
}

int RunBatch(const AutoCli::Program& program, const std::shared_ptr<AutoCli::NamespaceNode>& root,
             const Batch& batch, std::ostream& out, std::ostream& err) {
    std::ifstream file;
    std::istream* in = &std::cin;
    if (batch.file != "-") {
        file.open(batch.file);
        if (!file) {
            err << "Error: Cannot read " << batch.file << ": " << std::strerror(errno) << '\n';
            return 2;
        }
        in = &file;
    }
    const bool json = batch.formatter == "json";
    int worst = 0;
    size_t number = 0;
    for (std::string line; std::getline(*in, line);) {
        ++number;
        if (!line.empty() && line.back() == '\r') line.pop_back();
        const auto first = std::find_if_not(line.begin(), line.end(), IsBlank);
        if (first == line.end() || *first == '#') continue;

        Outcome outcome;
        try {
            outcome = RunLine(program, root, SplitWords(line), batch.formatter);
        } catch (const UsageError& error) {
            outcome.status = 2;
            outcome.messages = {error.what()};
        }
        const int status = json ? PrintJsonLine(number, line, outcome, out)
                                : Print(outcome, out, err, "line " + std::to_string(number) + ": ");
        worst = std::max(worst, status);
        if (status != 0 && batch.stopOnError) return worst;
    }
    if (in->bad()) {
        err << "Error: Cannot read " << (batch.file == "-" ? "standard input" : batch.file)
            << " after line " << number << '\n';
        return std::max(worst, 1);
    }
    return worst;
}

}  // namespace CmdKit::Detail

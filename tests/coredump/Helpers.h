// Shared helpers of the core dump tests.
#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "support/TestHost.h"

namespace CoredumpTest {

using nlohmann::json;

// The brixcli words of a core dump command: {"partition", "set", "-u"} runs
// `system coredump partition set -u`; with `asJson` the json formatter is asked for.
inline BrixTest::RunResult Coredump(const BrixTest::TempHost& host, std::vector<std::string> words,
                                    bool asJson = true) {
    words.insert(words.begin(), {"system", "coredump"});
    if (asJson) words.insert(words.begin(), "--formatter=json");
    return host.Cli(words);
}

// Operations of the "call" records journaled after the first `skip` records, in order.
inline std::vector<std::string> CallsSince(const BrixTest::TempHost& host, size_t skip) {
    std::vector<std::string> ops;
    const auto journal = host.Journal();
    for (size_t i = skip; i < journal.size(); ++i) {
        if (journal[i]["kind"] == "call") ops.push_back(journal[i]["op"].get<std::string>());
    }
    return ops;
}

// The last "call" record of an operation, or null.
inline json LastCall(const BrixTest::TempHost& host, const std::string& op) {
    json found;
    for (const auto& record : host.Journal()) {
        if (record["kind"] == "call" && record["op"] == op) found = record;
    }
    return found;
}

// Shortens "KernCtl::Storage::StorageInfoImpl::X" and similar qualified names to "X".
inline std::vector<std::string> Short(const std::vector<std::string>& ops) {
    std::vector<std::string> result;
    for (const auto& op : ops) result.push_back(op.substr(op.rfind(':') + 1));
    return result;
}

// Sets host settings through a state export and import.
inline void SetHostValues(const BrixTest::TempHost& host,
                          const std::vector<std::pair<std::string, std::string>>& values) {
    auto state = host.Export();
    auto& rows = state["tables"]["host"];
    for (const auto& [key, value] : values) {
        bool replaced = false;
        for (auto& row : rows) {
            if (row["key"] == key) {
                row["value"] = value;
                replaced = true;
            }
        }
        if (!replaced) rows.push_back({{"key", key}, {"value", value}});
    }
    host.Import(state);
}

// Asserts that a command failed with exactly one message and printed no result.
inline void ExpectFailure(const BrixTest::RunResult& run, const std::string& message) {
    EXPECT_EQ(run.status, 1) << run.err;
    EXPECT_EQ(run.err, message + "\n");
    EXPECT_EQ(run.out, "");
}

}  // namespace CoredumpTest

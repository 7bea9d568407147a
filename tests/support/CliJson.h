// Running commands with the JSON formatter and reading the journal's platform calls.
#pragma once

#include <gtest/gtest.h>

#include <nlohmann/json.hpp>
#include <ostream>
#include <string>
#include <vector>

#include "support/TestHost.h"

namespace BrixTest {

struct JsonRun {
    int status = -1;
    nlohmann::json out;  // null when nothing was printed
    std::string err;
};

inline JsonRun Json(const BrixTest::TempHost& host, std::vector<std::string> args) {
    args.insert(args.begin(), "--formatter=json");
    const auto run = host.Cli(args);
    JsonRun result;
    result.status = run.status;
    result.err = run.err;
    if (!run.out.empty()) result.out = nlohmann::json::parse(run.out);
    return result;
}

// The "call" records whose operation starts with `prefix`, as [op, args...] arrays.
inline std::vector<nlohmann::json> Calls(const BrixTest::TempHost& host,
                                         const std::string& prefix) {
    std::vector<nlohmann::json> calls;
    for (const auto& record : host.Journal()) {
        if (record.value("kind", "") != "call") continue;
        const std::string op = record.value("op", "");
        if (op.rfind(prefix, 0) != 0) continue;
        nlohmann::json call = nlohmann::json::array({op});
        for (const auto& arg : record["args"]) call.push_back(arg);
        calls.push_back(call);
    }
    return calls;
}

inline std::vector<std::string> With(std::vector<std::string> base,
                                     const std::vector<std::string>& more) {
    base.insert(base.end(), more.begin(), more.end());
    return base;
}

// A command line that must be refused with one message and leave the host as it was.
struct Refusal {
    const char* name;  // names the row in test output
    std::vector<std::string> args;
    std::string message;          // the whole of standard error, without its newline
    const char* fault = nullptr;  // an operation made to fail with "commit refused"
};

inline void PrintTo(const Refusal& row, std::ostream* out) {
    *out << row.name;
}

inline std::string RefusalName(const testing::TestParamInfo<Refusal>& info) {
    return info.param.name;
}

class RefusalTest : public testing::TestWithParam<Refusal> {
  protected:
    // Runs `command` with the row's options: exit 1, the message alone, no result, the whole
    // host as before, and no platform call whose operation starts with `changer`.
    void ExpectRefused(const std::vector<std::string>& command, const std::string& changer) {
        const auto& row = GetParam();
        const auto before = host.Export();
        if (row.fault) host.Fault(row.fault, "commit refused");
        const auto run = Json(host, With(command, row.args));
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, row.message + "\n");
        EXPECT_TRUE(run.out.is_null());
        EXPECT_TRUE(Calls(host, changer).empty());
        host.Sim({"fault", "clear"});
        EXPECT_EQ(host.Export(), before);
    }

    TempHost host;
};

inline std::vector<std::string> Column(const nlohmann::json& rows, const std::string& field) {
    std::vector<std::string> values;
    for (const auto& row : rows) values.push_back(row.at(field).get<std::string>());
    return values;
}

}  // namespace BrixTest

// Running commands with the JSON formatter and reading the journal's platform calls.
#pragma once

#include <nlohmann/json.hpp>
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

inline std::vector<std::string> Column(const nlohmann::json& rows, const std::string& field) {
    std::vector<std::string> values;
    for (const auto& row : rows) values.push_back(row.at(field).get<std::string>());
    return values;
}

}  // namespace BrixTest

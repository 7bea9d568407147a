// Helpers of the host-state tests: JSON results and the journal records a step added.
#pragma once

#include <gtest/gtest.h>

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "support/TestHost.h"

namespace HostStateTesting {

using nlohmann::json;

// Runs brixcli with --formatter=json and these words.
inline BrixTest::RunResult Json(const BrixTest::TempHost& host, std::vector<std::string> words) {
    words.insert(words.begin(), "--formatter=json");
    return host.Cli(words);
}

// The result a successful JSON run printed.
inline json Parsed(const BrixTest::RunResult& run) {
    EXPECT_EQ(run.status, 0) << run.err;
    return run.out.empty() ? json() : json::parse(run.out);
}

// Marks the journal's current end; Added() gives the records appended after it.
class JournalMark {
  public:
    explicit JournalMark(const BrixTest::TempHost& host)
        : host_(host), start_(host.Journal().size()) {}

    std::vector<json> Added() const {
        auto all = host_.Journal();
        return std::vector<json>(all.begin() + static_cast<long>(start_), all.end());
    }
    // The added records of these kinds, in order.
    std::vector<json> Added(const std::vector<std::string>& kinds) const {
        std::vector<json> picked;
        for (const auto& record : Added()) {
            for (const auto& kind : kinds) {
                if (record.value("kind", "") == kind) picked.push_back(record);
            }
        }
        return picked;
    }
    // The added "call" records of this operation.
    std::vector<json> Calls(const std::string& op) const {
        std::vector<json> picked;
        for (const auto& record : Added({"call"})) {
            if (record.value("op", "") == op) picked.push_back(record);
        }
        return picked;
    }

  private:
    const BrixTest::TempHost& host_;
    size_t start_;
};

// The message a refused command printed: exit status 1, one line on stderr, nothing on stdout.
inline void ExpectRefused(const BrixTest::RunResult& run, const std::string& message) {
    EXPECT_EQ(run.status, 1) << run.err;
    EXPECT_EQ(run.err, message + "\n");
    EXPECT_EQ(run.out, "");
}

}  // namespace HostStateTesting

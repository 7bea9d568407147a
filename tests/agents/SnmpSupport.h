// Helpers shared by the SNMP agent tests.
#pragma once

#include <filesystem>
#include <fstream>
#include <nlohmann/json.hpp>
#include <sstream>
#include <string>
#include <vector>

#include "support/TestHost.h"

namespace SnmpTest {

using nlohmann::json;

inline BrixTest::RunResult Snmp(const BrixTest::TempHost& host, std::vector<std::string> words) {
    words.insert(words.begin(), {"--formatter=json", "system", "snmp"});
    return host.Cli(words);
}

// `system snmp get` as JSON; the host must answer it.
inline json Config(const BrixTest::TempHost& host) {
    const auto run = Snmp(host, {"get"});
    if (run.status != 0) throw std::runtime_error("snmp get failed: " + run.err);
    return json::parse(run.out);
}

inline std::filesystem::path ConfigFile(const BrixTest::TempHost& host) {
    return host.Root() / "etc/ostrel/snmp.xml";
}

inline std::string ReadFile(const std::filesystem::path& path) {
    std::ifstream in(path, std::ios::binary);
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
}

inline void WriteFile(const std::filesystem::path& path, const std::string& content) {
    std::filesystem::create_directories(path.parent_path());
    std::ofstream(path, std::ios::binary | std::ios::trunc) << content;
}

// The "call" records of one operation, in order.
inline std::vector<json> Calls(const BrixTest::TempHost& host, const std::string& operation) {
    std::vector<json> calls;
    for (const auto& record : host.Journal()) {
        if (record["kind"] == "call" && record["op"] == operation) calls.push_back(record);
    }
    return calls;
}

inline const char* const kCommit = "HostCtl::System::SnmpAgentConfig::Commit";
inline const char* const kSendWarmStart = "HostCtl::System::SnmpAgentConfig::SendWarmStart";

}  // namespace SnmpTest

// `system slp stats get`: the SLP daemon's statistics from the simulated host.
#include <gtest/gtest.h>

#include "support/TestHost.h"

namespace {

using nlohmann::json;

const std::vector<std::string> kFieldOrder = {
    "Date",
    "Process ID",
    "Uptime",
    "Last TCP connection accept",
    "TCP completed accepts",
    "TCP accepts failed",
    "TCP accepts toomany",
    "Last UDP packet received",
    "UDP pkts received ok",
    "UDP pkts received failed",
    "UDP pkts received bytes",
    "UDP pkts transmitted ok",
    "UDP pkts transmitted failed",
    "UDP pkts transmitted/bytes",
    "SRVRQST type packets received",
    "SRVRPLY type packets sent",
    "SRVREG type packets received",
    "SRVDREG type packets received",
    "SRVACK type packets sent",
    "ATTRRQST type packets received",
    "ATRRPLY type packets sent",
    "DAADVERT type packets received",
    "SRVTYPERQST type packets received",
    "SRVTYPERPLY type packets sent",
    "SAADVERT type packets received",
    "SRVREG transactions failed",
    "SRVDEREG transactions failed",
    "SA SRV request receieved",
    "DA SRV request reccieved",
    "No reply sent",
    "UDP Message truncated when sent",
    "Internal err",
};

TEST(SlpStats, AllFieldsInOrderWithSeededValues) {
    BrixTest::TempHost host;
    const auto run = host.Cli({"--formatter=json", "system", "slp", "stats", "get"});
    ASSERT_EQ(run.status, 0) << run.err;
    std::vector<std::string> names;
    const auto ordered = nlohmann::ordered_json::parse(run.out);
    for (const auto& item : ordered.items()) names.push_back(item.key());
    EXPECT_EQ(names, kFieldOrder);
    const auto stats = json::parse(run.out);
    EXPECT_EQ(stats["Process ID"], "2291");
    EXPECT_EQ(stats["Uptime"].get<std::string>().rfind("3 days ", 0), 0u) << stats["Uptime"];
    EXPECT_EQ(stats["UDP pkts received bytes"], 5312847219LL);
    EXPECT_EQ(stats["UDP pkts transmitted/bytes"], 2904118733LL);
    EXPECT_EQ(stats["SRVRQST type packets received"], 1742310);
    EXPECT_EQ(stats["SA SRV request receieved"], 1742310);
    EXPECT_EQ(stats["DA SRV request reccieved"], 0);
    EXPECT_EQ(stats["ATRRPLY type packets sent"], 2866);
    EXPECT_EQ(stats["No reply sent"], 144290);
    for (const char* text : {"Date", "Last TCP connection accept", "Last UDP packet received"}) {
        EXPECT_TRUE(stats[text].is_string()) << text;
        EXPECT_FALSE(stats[text].get<std::string>().empty()) << text;
    }
    for (size_t i = 0; i < kFieldOrder.size(); ++i) {
        const bool text = i < 4 || i == 7;
        EXPECT_EQ(stats[kFieldOrder[i]].is_string(), text) << kFieldOrder[i];
        EXPECT_EQ(stats[kFieldOrder[i]].is_number_integer(), !text) << kFieldOrder[i];
    }
}

TEST(SlpStats, ByteCountersCarriedInFull) {
    BrixTest::TempHost host;
    auto state = host.Export();
    auto& row = state["tables"]["slp_daemon"][0];
    row["udp_received_bytes"] = 9007199254740993LL;  // 2^53 + 1: exact only as an integer
    row["udp_sent_bytes"] = 2147483648LL;
    row["last_tcp_accept"] = nullptr;
    host.Import(state);
    const auto run = host.Cli({"--formatter=json", "system", "slp", "stats", "get"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_NE(run.out.find("9007199254740993"), std::string::npos) << run.out;
    const auto stats = json::parse(run.out);
    EXPECT_EQ(stats["UDP pkts received bytes"].get<int64_t>(), 9007199254740993LL);
    EXPECT_EQ(stats["UDP pkts transmitted/bytes"].get<int64_t>(), 2147483648LL);
    EXPECT_EQ(stats["Last TCP connection accept"], "never");
    // The simple view shows the same digits.
    const auto simple = host.Cli({"system", "slp", "stats", "get"});
    EXPECT_NE(simple.out.find("9007199254740993"), std::string::npos) << simple.out;
    EXPECT_NE(simple.out.find("ATRRPLY type packets sent"), std::string::npos);
}

}  // namespace

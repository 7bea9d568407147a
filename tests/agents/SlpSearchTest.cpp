// `system slp search` end to end: brixcli's SLP agent against the test responder on loopback.
#include <gtest/gtest.h>

#include <chrono>
#include <map>

#include "SlpResponder.h"
#include "brixcli/SystemPlugin.h"
#include "support/TestHost.h"

namespace {

using nlohmann::json;
using SlpTest::Behaviour;
using SlpTest::Responder;

const std::vector<SlpTest::Service> kServices = {
    {"service:wbem:https://192.0.2.10:5989", 10800},
    {"service:brix-mgmt://192.0.2.11:443", 900},
};

const json kListed = json::parse(R"([
    {"TimeToLive": 10800, "System": "service:wbem:https://192.0.2.10:5989"},
    {"TimeToLive": 900, "System": "service:brix-mgmt://192.0.2.11:443"}])");

// Sets host settings through the simulator's state export and import.
void SetHostValues(const BrixTest::TempHost& host,
                   const std::vector<std::pair<std::string, std::string>>& values) {
    auto state = host.Export();
    auto& rows = state["tables"]["host"];
    for (const auto& [key, value] : values) {
        bool found = false;
        for (auto& row : rows) {
            if (row["key"] == key) {
                row["value"] = value;
                found = true;
            }
        }
        if (!found) rows.push_back({{"key", key}, {"value", value}});
    }
    host.Import(state);
}

// A host whose searches wait at most `waitMs`. Searches that get their answer return at once;
// the wait leaves room for a loaded machine.
void ShortWaits(const BrixTest::TempHost& host, int waitMs = 1500) {
    SetHostValues(host, {{"slp.ua.multicast_wait_ms", std::to_string(waitMs)},
                         {"slp.ua.unicast_wait_ms", std::to_string(waitMs)}});
}

BrixTest::RunResult Search(const BrixTest::TempHost& host, std::vector<std::string> options) {
    std::vector<std::string> args = {"--formatter=json", "system", "slp", "search"};
    args.insert(args.end(), options.begin(), options.end());
    return host.Cli(args);
}

TEST(SlpSearch, UnicastListsServicesWithLifetimes) {
    BrixTest::TempHost host;
    ShortWaits(host);
    struct Case {
        std::vector<std::string> protocol;  // extra options
        const char* transport;
    };
    const Case cases[] = {
        {{"-P", "udp"}, "udp"},
        {{"-P", "tcp"}, "tcp"},
        {{}, "tcp"},  // TCP is the agent's default
        {{"--protocol=udp"}, "udp"},
    };
    for (const auto& c : cases) {
        Responder responder(kServices);
        std::vector<std::string> options = {
            "-n", "127.0.0.1", "-p", std::to_string(responder.Port()), "-s", "wbem"};
        options.insert(options.end(), c.protocol.begin(), c.protocol.end());
        const auto run = Search(host, options);
        ASSERT_EQ(run.status, 0) << run.err;
        EXPECT_EQ(run.err, "");
        EXPECT_EQ(json::parse(run.out), kListed) << run.out;
        const auto requests = responder.Requests();
        // Over UDP a slow answer may have been asked for twice, with the same id.
        ASSERT_FALSE(requests.empty()) << c.transport;
        EXPECT_EQ(requests.front().xid, requests.back().xid);
        EXPECT_EQ(requests[0].transport, c.transport);
        EXPECT_EQ(requests[0].function, 1);
        EXPECT_EQ(requests[0].flags, 0) << "unicast requests are not marked multicast";
        EXPECT_EQ(requests[0].language, "en");
        EXPECT_EQ(requests[0].serviceType, "service:wbem");
        EXPECT_EQ(requests[0].scopes, "DEFAULT");
        EXPECT_EQ(requests[0].previousResponders, "");
    }
}

TEST(SlpSearch, ServiceTypeDefaultsAndPrefix) {
    BrixTest::TempHost host;
    ShortWaits(host);
    const std::pair<std::vector<std::string>, const char*> cases[] = {
        {{}, "service:service-agent"},
        {{"-s", "service:printer:lpr"}, "service:printer:lpr"},
        {{"--service", "brix-mgmt"}, "service:brix-mgmt"},
        // The scheme is case-insensitive, and not put in front a second time.
        {{"-s", "SERVICE:wbem"}, "service:wbem"},
        {{"-s", "Service:printer:lpr"}, "service:printer:lpr"},
    };
    for (const auto& [options, type] : cases) {
        Responder responder(kServices);
        std::vector<std::string> args = {"-n",  "localhost", "-P",
                                         "udp", "-p",        std::to_string(responder.Port())};
        args.insert(args.end(), options.begin(), options.end());
        const auto run = Search(host, args);
        ASSERT_EQ(run.status, 0) << run.err;
        const auto requests = responder.Requests();
        ASSERT_FALSE(requests.empty());
        EXPECT_EQ(requests[0].serviceType, type);
    }
    // The service agent answers a search for agents with its advertisement, which has no lifetime.
    Responder responder(kServices);
    const auto run = Search(host, {"-n", "127.0.0.1", "-p", std::to_string(responder.Port())});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(json::parse(run.out),
              json::parse(R"([{"TimeToLive": 0, "System": "service:service-agent://127.0.0.1"}])"));
}

TEST(SlpSearch, NoAnswerIsAnEmptyTable) {
    BrixTest::TempHost host;
    ShortWaits(host, 300);
    // Nobody listening on the port: refused at once.
    uint16_t closedPort = 0;
    {
        Responder gone(kServices);
        closedPort = gone.Port();
    }
    auto run = Search(host, {"-n", "127.0.0.1", "-P", "udp", "-p", std::to_string(closedPort)});
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(json::parse(run.out), json::array());
    EXPECT_EQ(run.err, "");

    // A silent agent: the search gives up after its wait, over either protocol.
    for (const char* protocol : {"udp", "tcp"}) {
        Responder silent(kServices, Behaviour::Silent);
        const auto start = std::chrono::steady_clock::now();
        run =
            Search(host, {"-n", "127.0.0.1", "-P", protocol, "-p", std::to_string(silent.Port())});
        const auto took = std::chrono::steady_clock::now() - start;
        EXPECT_EQ(run.status, 0) << run.err;
        EXPECT_EQ(json::parse(run.out), json::array()) << protocol;
        EXPECT_LT(took, std::chrono::seconds(3)) << protocol;
        if (std::string(protocol) == "udp") {
            // Asked once more before giving up, with the same transaction id.
            const auto requests = silent.Requests();
            ASSERT_EQ(requests.size(), 2u);
            EXPECT_EQ(requests[0].xid, requests[1].xid);
        }
    }
}

TEST(SlpSearch, MalformedRepliesAreSkipped) {
    BrixTest::TempHost host;
    ShortWaits(host, 1000);
    // Over UDP a broken reply and one for another request come first; the answer still counts.
    {
        Responder responder(kServices, Behaviour::MalformedFirst);
        const auto run = Search(host, {"-n", "127.0.0.1", "-P", "udp", "-p",
                                       std::to_string(responder.Port()), "-s", "wbem"});
        ASSERT_EQ(run.status, 0) << run.err;
        EXPECT_EQ(json::parse(run.out), kListed);
    }
    for (const char* protocol : {"udp", "tcp"}) {
        Responder responder(kServices, Behaviour::MalformedOnly);
        const auto run = Search(host, {"-n", "127.0.0.1", "-P", protocol, "-p",
                                       std::to_string(responder.Port()), "-s", "wbem"});
        EXPECT_EQ(run.status, 0) << run.err;
        EXPECT_EQ(json::parse(run.out), json::array()) << protocol;
        EXPECT_EQ(run.err, "");
    }
}

TEST(SlpSearch, MulticastCollectsAnswers) {
    BrixTest::TempHost host;
    ShortWaits(host);
    Responder responder(kServices);
    const auto run = Search(host, {"-p", std::to_string(responder.Port()), "-s", "wbem"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(json::parse(run.out), kListed);
    const auto requests = responder.Requests();
    // Asked twice: the second time naming the agent that already answered.
    ASSERT_EQ(requests.size(), 2u);
    EXPECT_EQ(requests[0].flags, 0x2000);
    EXPECT_EQ(requests[0].previousResponders, "");
    EXPECT_EQ(requests[1].previousResponders, "127.0.0.1");
    EXPECT_EQ(requests[0].xid, requests[1].xid);
    // The seeded host searches this machine only: the request left by loopback.
    EXPECT_EQ(requests[0].source, "127.0.0.1");

    // The protocol option alone is accepted and does not turn the search into a unicast one.
    Responder again(kServices);
    const auto udp = Search(host, {"-P", "udp", "-p", std::to_string(again.Port())});
    ASSERT_EQ(udp.status, 0) << udp.err;
    ASSERT_FALSE(again.Requests().empty());
    EXPECT_EQ(again.Requests()[0].flags, 0x2000);

    // An empty interface setting means loopback too, never the routing table's choice.
    SetHostValues(host, {{"slp.ua.interface", ""}});
    Responder unset(kServices);
    ASSERT_EQ(Search(host, {"-P", "udp", "-p", std::to_string(unset.Port())}).status, 0);
    ASSERT_FALSE(unset.Requests().empty());
    EXPECT_EQ(unset.Requests()[0].source, "127.0.0.1");
}

TEST(SlpSearch, ErrorsAndRefusals) {
    BrixTest::TempHost host;
    ShortWaits(host);
    {
        Responder responder(kServices, Behaviour::Error);
        const auto run =
            Search(host, {"-n", "127.0.0.1", "-P", "udp", "-p", std::to_string(responder.Port())});
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.out, "");
        EXPECT_EQ(run.err, "SLP search of '127.0.0.1' failed: SCOPE_NOT_SUPPORTED\n");
    }
    {
        uint16_t closedPort = 0;
        {
            Responder gone(kServices);
            closedPort = gone.Port();
        }
        const auto run = Search(host, {"-n", "127.0.0.1", "-p", std::to_string(closedPort)});
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, "Unable to connect to '127.0.0.1' port " + std::to_string(closedPort) +
                               ": Connection refused\n");
    }
    {
        const auto run = Search(host, {"-n", "no-such-host.invalid", "-P", "udp"});
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err.rfind("Unable to resolve host 'no-such-host.invalid': ", 0), 0u)
            << run.err;
    }
    // Range and enumeration checks belong to the framework.
    for (const std::vector<std::string>& options :
         {std::vector<std::string>{"-p", "65536"}, {"-p", "-1"}, {"-P", "sctp"}, {"-P", "TCP"}}) {
        const auto run = Search(host, options);
        EXPECT_EQ(run.status, 2) << options[1];
        EXPECT_EQ(run.out, "");
    }
    // Port 0 passes the framework; nothing listens there.
    const auto zero = Search(host, {"-n", "127.0.0.1", "-P", "udp", "-p", "0"});
    EXPECT_NE(zero.status, 2) << zero.err;
}

// The output hints are not part of the generated reference.
TEST(SlpSearch, TableShowsItsFields) {
    std::shared_ptr<CmdKit::AutoCli::NamespaceNode> root = CmdKit::AutoCli::Namespace::New();
    AutoCli_RegisterNamespaces(root);
    size_t consumed = 0;
    auto search = std::dynamic_pointer_cast<CmdKit::AutoCli::CommandSpec>(
        root->ResolveNode({"system", "slp", "search"}, consumed));
    ASSERT_TRUE(search);
    EXPECT_EQ(search->GetDefaultOutputParameters(),
              (std::map<std::string, std::string>{{"fields:TimeToLive", "TimeToLive,System"}}));
}

}  // namespace

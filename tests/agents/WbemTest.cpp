// The WBEM commands against the simulated host's WBEM configuration.
#include <gtest/gtest.h>

#include <algorithm>
#include <map>

#include "brixcli/SystemPlugin.h"
#include "hostctl/Host.h"
#include "hostctl/SystemInfo.h"
#include "hostctl/WbemAgentConfig.h"
#include "support/TestHost.h"

namespace {

using nlohmann::json;

constexpr const char* kCommit = "HostCtl::System::WbemAgentConfig::Commit";

const json kSeeded = json::parse(R"({"Enabled": true, "WS-Management Service": true,
    "Authorization Model": "password", "Port": 5989, "Log level": "warning"})");

BrixTest::RunResult Wbem(const BrixTest::TempHost& host, std::vector<std::string> words) {
    std::vector<std::string> args = {"--formatter=json", "system", "wbem"};
    args.insert(args.end(), words.begin(), words.end());
    return host.Cli(args);
}

json Get(const BrixTest::TempHost& host) {
    const auto run = Wbem(host, {"get"});
    EXPECT_EQ(run.status, 0) << run.err;
    return json::parse(run.out);
}

json Providers(const BrixTest::TempHost& host) {
    const auto run = Wbem(host, {"provider", "list"});
    EXPECT_EQ(run.status, 0) << run.err;
    return json::parse(run.out);
}

// The WBEM part of the journal: commit calls and service actions, in order.
std::vector<json> WbemJournal(const BrixTest::TempHost& host) {
    std::vector<json> records;
    for (const auto& record : host.Journal()) {
        if (record["kind"] == "call" && record["op"] == kCommit) {
            records.push_back({{"commit", record["args"]}});
        } else if (record["kind"] == "exec") {
            records.push_back({{"exec", record["argv"]}});
        }
    }
    return records;
}

json Restarted(bool wsman = true) {
    return {{{"exec", {"/etc/init.d/sfcbd", "restart"}}},
            {{"exec", {"/etc/init.d/openwsmand", wsman ? "restart" : "stop"}}}};
}

TEST(Wbem, GetShowsTheSeededConfiguration) {
    BrixTest::TempHost host;
    EXPECT_EQ(Get(host), kSeeded);
}

TEST(Wbem, SetAppliesEachOptionAndSurvives) {
    struct Case {
        std::vector<std::string> options;
        json changes;      // the commit's journaled changes
        json expectedGet;  // patch over the seeded configuration
    };
    const Case cases[] = {
        {{"-p", "65525"}, json::array({"port=65525"}), {{"Port", 65525}}},
        {{"-p", "0"}, json::array({"port=0"}), {{"Port", 0}}},
        {{"--loglevel", "debug"}, json::array({"log_level=debug"}), {{"Log level", "debug"}}},
        {{"-a", "certificate"},
         json::array({"auth_model=2"}),
         {{"Authorization Model", "certificate"}}},
        {{"-W", "no"}, json::array({"wsman=false"}), {{"WS-Management Service", false}}},
        {{"-e", "false", "-l", "error"},
         json::array({"enabled=false", "log_level=error"}),
         {{"Enabled", false}, {"Log level", "error"}}},
    };
    for (const auto& c : cases) {
        BrixTest::TempHost host;
        auto options = c.options;
        options.insert(options.begin(), "set");
        const auto run = Wbem(host, options);
        ASSERT_EQ(run.status, 0) << run.err;
        EXPECT_EQ(run.out, "true\n");
        auto expected = kSeeded;
        expected.update(c.expectedGet);
        EXPECT_EQ(Get(host), expected) << c.changes;
        const auto journal = WbemJournal(host);
        ASSERT_EQ(journal.size(), 3u) << c.changes;
        EXPECT_EQ(journal[0], json({{"commit", c.changes}}));
        const bool running = expected["Enabled"].get<bool>();
        const bool wsman = expected["WS-Management Service"].get<bool>();
        EXPECT_EQ(journal[1]["exec"][1], running ? "restart" : "stop");
        EXPECT_EQ(journal[2]["exec"][1], running && wsman ? "restart" : "stop");
    }
}

TEST(Wbem, PortBoundIsTheFrameworks) {
    BrixTest::TempHost host;
    for (const char* port : {"65526", "65535", "-1"}) {
        const auto run = Wbem(host, {"set", "-p", port});
        EXPECT_EQ(run.status, 2) << port;
        EXPECT_EQ(run.out, "") << port;
    }
    for (const char* level : {"trace", "Debug"}) {
        EXPECT_EQ(Wbem(host, {"set", "-l", level}).status, 2) << level;
    }
    EXPECT_EQ(Get(host), kSeeded);
    EXPECT_TRUE(WbemJournal(host).empty());
}

TEST(Wbem, SetValidationFailsBesideTrueAndCommitsNothing) {
    BrixTest::TempHost host;
    struct Case {
        std::vector<std::string> options;
        const char* message;
    };
    const Case cases[] = {
        {{"set", "-a", "Password", "-e", "true"}, "Invalid --auth value provided\n"},
        {{"set", "-a", "Password", "-e", "false"}, "Invalid --auth value provided\n"},
        {{"set", "-e", "false", "-a", "none", "-p", "80"}, "Invalid --auth value provided\n"},
        {{"set"}, "Specify what to set or --help\n"},
    };
    for (const auto& c : cases) {
        const auto run = Wbem(host, c.options);
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, c.message);
        EXPECT_EQ(run.out, "true\n");
    }
    EXPECT_EQ(Get(host), kSeeded);
    EXPECT_TRUE(WbemJournal(host).empty());
}

TEST(Wbem, ResetRestoresFactoryDefaultsUnderLaterOptions) {
    BrixTest::TempHost host;
    ASSERT_EQ(Wbem(host, {"set", "-a", "certificate", "-l", "debug"}).status, 0);
    ASSERT_EQ(Wbem(host, {"provider", "set", "-n", "brix_storage", "-e", "false"}).status, 0);
    const auto run = Wbem(host, {"set", "-r", "-p", "5990"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(Get(host), json::parse(R"({"Enabled": false, "WS-Management Service": true,
        "Authorization Model": "password", "Port": 5990, "Log level": "warning"})"));
    // Factory provider states: the vendor RAID monitor comes back, power management stays off;
    // with the services stopped nothing is loaded.
    for (const auto& provider : Providers(host)) {
        const std::string name = provider["Name"];
        EXPECT_EQ(provider["Enabled"], name != "brix_powermgmt") << name;
        EXPECT_EQ(provider["Loaded"], false) << name;
    }
    const auto journal = WbemJournal(host);
    ASSERT_EQ(journal.size(), 9u);
    const auto& changes = journal[6]["commit"];
    EXPECT_EQ(changes[0], "reset");
    EXPECT_EQ(changes[3], "port=5990");
    EXPECT_EQ(journal[7], json({{"exec", {"/etc/init.d/sfcbd", "stop"}}}));
    EXPECT_EQ(journal[8], json({{"exec", {"/etc/init.d/openwsmand", "stop"}}}));
}

TEST(Wbem, AuthorizationModelCodes) {
    const std::pair<int, const char*> cases[] = {
        {0, "not supported"}, {1, "password"}, {2, "certificate"}, {7, ""}, {-1, ""}};
    for (const auto& [code, text] : cases) {
        BrixTest::TempHost host;
        auto state = host.Export();
        state["tables"]["wbem_config"][0]["auth_model"] = code;
        host.Import(state);
        EXPECT_EQ(Get(host)["Authorization Model"], text) << code;
    }
}

TEST(Wbem, ProviderListKeepsTheStoresOrder) {
    BrixTest::TempHost host;
    const auto seeded = Providers(host);
    ASSERT_EQ(seeded.size(), 8u);
    EXPECT_EQ(seeded[0], json::parse(R"({"Name": "brix_hwinventory", "Enabled": true,
                                        "Loaded": true})"));
    EXPECT_EQ(seeded[7], json::parse(R"({"Name": "tamsin_raidmon", "Enabled": false,
                                        "Loaded": false})"));
    // Reverse the stored positions: the listing follows them, not the names.
    auto state = host.Export();
    auto& rows = state["tables"]["wbem_providers"];
    for (auto& row : rows) row["position"] = 100 - row["position"].get<int>();
    host.Import(state);
    auto reversed = seeded;
    std::reverse(reversed.begin(), reversed.end());
    EXPECT_EQ(Providers(host), reversed);
    // No providers: an empty table.
    state["tables"]["wbem_providers"] = json::array();
    host.Import(state);
    EXPECT_EQ(Providers(host), json::array());
}

TEST(Wbem, ProviderSet) {
    BrixTest::TempHost host;
    // Without --enable: a plain message, no result, nothing committed.
    auto run = Wbem(host, {"provider", "set", "-n", "x"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.out, "");
    EXPECT_EQ(run.err, "Specify what to set or --help\n");
    run = Wbem(host, {"provider", "set", "-n", "brix_sensors"});
    EXPECT_EQ(run.err, "Specify what to set or --help\n");
    EXPECT_TRUE(WbemJournal(host).empty());

    run = Wbem(host, {"provider", "set", "-n", "nope", "-e", "true"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.out, "");
    EXPECT_EQ(run.err, "Provider 'nope' is not installed\n");
    EXPECT_TRUE(WbemJournal(host).empty());

    EXPECT_EQ(Wbem(host, {"provider", "set"}).status, 2);

    // Enabling a provider that is loaded on demand; disabling one that was loaded unloads it.
    run = Wbem(host, {"provider", "set", "-n", "tamsin_raidmon", "--enable", "yes"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, "true\n");
    run = Wbem(host, {"provider", "set", "-n", "brix_sensors", "-e", "0"});
    ASSERT_EQ(run.status, 0) << run.err;
    const auto providers = Providers(host);
    EXPECT_EQ(providers[1], json::parse(R"({"Name": "brix_sensors", "Enabled": false,
                                           "Loaded": false})"));
    EXPECT_EQ(providers[7], json::parse(R"({"Name": "tamsin_raidmon", "Enabled": true,
                                           "Loaded": false})"));
    json expected = json::array();
    expected.push_back({{"commit", json::array({"provider tamsin_raidmon=true"})}});
    for (const auto& record : Restarted()) expected.push_back(record);
    expected.push_back({{"commit", json::array({"provider brix_sensors=false"})}});
    for (const auto& record : Restarted()) expected.push_back(record);
    EXPECT_EQ(json(WbemJournal(host)), expected);
}

// A failing setter or commit leaves the configuration as it was and restarts nothing.
TEST(Wbem, FaultsChangeNothing) {
    struct Case {
        const char* operation;
        std::vector<std::string> words;
        const char* out;  // set answers true beside its error
    };
    const Case cases[] = {
        {"HostCtl::System::WbemAgentConfig::SetProviderEnabled",
         {"provider", "set", "-n", "brix_sensors", "-e", "no"},
         ""},
        {kCommit, {"provider", "set", "-n", "brix_sensors", "-e", "no"}, ""},
        {"HostCtl::System::WbemAgentConfig::ResetToDefaults", {"set", "-r"}, "true\n"},
        {"HostCtl::System::WbemAgentConfig::SetPort", {"set", "-p", "1"}, "true\n"},
        {kCommit, {"set", "-e", "no"}, "true\n"},
    };
    for (const auto& c : cases) {
        BrixTest::TempHost host;
        host.Fault(c.operation, "CIMOM configuration locked");
        const auto run = Wbem(host, c.words);
        EXPECT_EQ(run.status, 1) << c.operation;
        EXPECT_EQ(run.out, c.out) << c.operation;
        EXPECT_EQ(run.err, "CIMOM configuration locked\n") << c.operation;
        host.ClearFaults();
        EXPECT_TRUE(WbemJournal(host).empty()) << c.operation;
        EXPECT_EQ(Get(host), kSeeded) << c.operation;
    }
}

TEST(Wbem, ConcurrentCommitsKeepEachOthersChanges) {
    BrixTest::TempHost host;
    // Two configuration objects read the same state; each commits only what it changed.
    auto first = HostCtl::HostFactory::GetHost()->GetSystemInfo();
    auto second = HostCtl::HostFactory::GetHost()->GetSystemInfo();
    auto a = first->GetWbemAgentConfig();
    auto b = second->GetWbemAgentConfig();
    a->SetPort(6000);
    a->SetProviderEnabled("brix_network", false);
    b->SetLogLevel("info");
    b->SetProviderEnabled("tamsin_raidmon", true);
    a->Commit();
    b->Commit();
    auto expected = kSeeded;
    expected["Port"] = 6000;
    expected["Log level"] = "info";
    EXPECT_EQ(Get(host), expected);
    const auto providers = Providers(host);
    EXPECT_EQ(providers[4]["Enabled"], false);
    EXPECT_EQ(providers[7]["Enabled"], true);
    // The object that committed last sees the stored state, not only its own changes.
    EXPECT_EQ(b->GetPort(), 6000);
}

// The output hints are not part of the generated reference.
TEST(Wbem, ProviderListShowsItsFields) {
    std::shared_ptr<CmdKit::AutoCli::NamespaceNode> root = CmdKit::AutoCli::Namespace::New();
    AutoCli_RegisterNamespaces(root);
    std::vector<std::string> path = {"system", "wbem", "provider", "list"};
    size_t consumed = 0;
    const auto list =
        std::dynamic_pointer_cast<CmdKit::AutoCli::CommandSpec>(root->ResolveNode(path, consumed));
    ASSERT_TRUE(list);
    EXPECT_EQ(list->GetDefaultOutputParameters(),
              (std::map<std::string, std::string>{
                  {"fields:WbemAgentProviderList", "Name,Enabled,Loaded"}}));
}

}  // namespace

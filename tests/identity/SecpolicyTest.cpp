// system secpolicy domain list|set, and the unattached read-cache commands.
#include <sstream>

#include "HostStateTesting.h"
#include "brixcli/SystemPlugin.h"
#include "cmdkit/Cli.h"
#include "hostsim/core/Store.h"
#include "identity/ReadCacheGet.h"
#include "identity/ReadCacheSet.h"
#include "identity/Shutdown.h"

namespace {

using namespace HostStateTesting;

constexpr const char* kOps = "KernCtl::Security::KernAccessInterfaceImpl::";

json Row(const std::string& name, const std::string& level) {
    return {{"Domain Name", name}, {"Enforcement Level", level}};
}

json Domains(const BrixTest::TempHost& host) {
    return Parsed(Json(host, {"system", "secpolicy", "domain", "list"}));
}

const std::vector<std::string> kSeededNames{"kernelCore",   "hostDaemons",  "mgmtAgents",
                                            "shellTools",   "guestRuntime", "netServices",
                                            "storageTools", "pluginSandbox"};

json AllAt(const std::string& level) {
    json rows = json::array();
    for (const auto& name : kSeededNames) rows.push_back(Row(name, level));
    return rows;
}

TEST(SecpolicyDomain, ListSkipsEmptySlots) {
    BrixTest::TempHost host;
    EXPECT_EQ(Domains(host), AllAt("enforcing"));

    // Only slots below the maximum are read.
    BrixSim::Store::Get().SetInt("secpolicy.max_domains", 6);
    EXPECT_EQ(Domains(host),
              json::array({Row("kernelCore", "enforcing"), Row("hostDaemons", "enforcing"),
                           Row("mgmtAgents", "enforcing"), Row("shellTools", "enforcing"),
                           Row("guestRuntime", "enforcing")}));
    BrixSim::Store::Get().SetInt("secpolicy.max_domains", 0);
    EXPECT_EQ(Domains(host), json::array());
}

TEST(SecpolicyDomain, ListFailuresShowNoPartialList) {
    for (const char* op :
         {"KernAccessInterfaceImpl", "GetKeywordsMap", "GetMaxDomains", "GetDomainInfo"}) {
        SCOPED_TRACE(op);
        BrixTest::TempHost host;
        host.Fault(std::string(kOps) + op, "access control unavailable");
        ExpectRefused(host.Cli({"--formatter=json", "system", "secpolicy", "domain", "list"}),
                      "access control unavailable");
    }
}

TEST(SecpolicyDomain, SetOneOrAll) {
    BrixTest::TempHost host;
    JournalMark one(host);
    EXPECT_EQ(Parsed(Json(host, {"system", "secpolicy", "domain", "set", "-n", "mgmtAgents", "-l",
                                 "audit"})),
              json(true));
    auto expected = AllAt("enforcing");
    expected[2] = Row("mgmtAgents", "audit");
    EXPECT_EQ(Domains(host), expected);
    auto calls = one.Calls(std::string(kOps) + "EnableDomain");
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_EQ(calls[0]["args"], json::array({"mgmtAgents", "audit"}));

    JournalMark all(host);
    EXPECT_EQ(Parsed(Json(host, {"system", "secpolicy", "domain", "set", "--all-domains", "--level",
                                 "disabled"})),
              json(true));
    EXPECT_EQ(Domains(host), AllAt("disabled"));
    calls = all.Calls(std::string(kOps) + "Enable");
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_EQ(calls[0]["args"], json::array({"disabled"}));
}

TEST(SecpolicyDomain, SetRefusals) {
    struct Case {
        std::vector<std::string> options;
        std::string message;
    };
    const Case cases[] = {
        {{"-a", "-n", "x", "-l", "y"}, "Can't specify domain name with all-domains option"},
        {{"-l", "y"}, "Must specify one of all-domains or name"},
        {{"-n", "noSuchDomain", "-l", "audit"}, "Domain 'noSuchDomain' not found."},
        {{"-n", "kernelCore", "-l", "strict"},
         "Invalid enforcement level 'strict'. Valid levels are: disabled, audit, enforcing."},
        {{"-a", "-l", "Enforcing"},
         "Invalid enforcement level 'Enforcing'. Valid levels are: disabled, audit, enforcing."},
    };
    BrixTest::TempHost host;
    JournalMark mark(host);
    for (const auto& c : cases) {
        SCOPED_TRACE(c.message);
        std::vector<std::string> words{"system", "secpolicy", "domain", "set"};
        words.insert(words.end(), c.options.begin(), c.options.end());
        ExpectRefused(host.Cli(words), c.message);
    }
    EXPECT_TRUE(mark.Added({"call"}).empty());
    EXPECT_EQ(Domains(host), AllAt("enforcing"));
    EXPECT_EQ(host.Cli({"system", "secpolicy", "domain", "set", "-a"}).status, 2);

    // The option checks come before the interface is opened.
    host.Fault(std::string(kOps) + "KernAccessInterfaceImpl", "interface busy");
    ExpectRefused(host.Cli({"system", "secpolicy", "domain", "set", "-l", "audit"}),
                  "Must specify one of all-domains or name");
    ExpectRefused(host.Cli({"system", "secpolicy", "domain", "set", "-a", "-l", "audit"}),
                  "interface busy");
}

// The read-cache commands are complete but attached nowhere; they are run here on a tree of
// their own.
TEST(ReadCache, GetAndSetOnTheirOwnTree) {
    BrixTest::TempHost host;
    auto root = CmdKit::AutoCli::Namespace::New();
    root->RegisterNamespaceNode(OstrelCli::System::ReadCacheGet::New(), "get");
    auto set = OstrelCli::System::ReadCacheSet::New();
    EXPECT_EQ(set->GetMetaDataField("type"), "fetcher");
    root->RegisterNamespaceNode(set, "set");
    auto run = [&](std::vector<std::string> args) {
        std::ostringstream out;
        std::ostringstream err;
        args.insert(args.begin(), "--formatter=json");
        const int status = CmdKit::AutoCli::RunCli(root, args, out, err);
        return BrixTest::RunResult{status, out.str(), err.str()};
    };
    const auto status = [](bool active, bool onReboot) {
        return json{{"Active", active}, {"Enabled On Reboot", onReboot}};
    };
    EXPECT_EQ(Parsed(run({"get"})), status(false, false));

    JournalMark mark(host);
    EXPECT_EQ(Parsed(run({"set", "--enabled", "true"})), json(true));
    auto calls = mark.Calls("KernCtl::System::SystemInfoImpl::SetCbrcEnabled");
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_EQ(calls[0]["args"], json::array({true}));
    // Configured for the next boot; the running cache is unchanged.
    EXPECT_EQ(Parsed(run({"get"})), status(false, true));
    EXPECT_EQ(Parsed(run({"set", "-e", "false"})), json(true));
    EXPECT_EQ(Parsed(run({"get"})), status(false, false));

    host.Fault("KernCtl::System::SystemInfoImpl::GetCbrcConfiguredEnabled", "cache state unknown");
    ExpectRefused(run({"get"}), "cache state unknown");
    host.Fault("KernCtl::System::SystemInfoImpl::SetCbrcEnabled", "cache locked");
    ExpectRefused(run({"set", "-e", "true"}), "cache locked");
}

// Walks the registered tree: no path reaches the read-cache commands, and the two shutdown
// commands are distinct objects of one class.
TEST(ReadCache, UnreachableFromTheTree) {
    BrixTest::TempHost host;
    auto root = CmdKit::AutoCli::Namespace::New();
    AutoCli_RegisterNamespaces(root);
    std::vector<std::shared_ptr<CmdKit::AutoCli::NamespaceNode>> pending{root};
    size_t commands = 0;
    while (!pending.empty()) {
        auto node = pending.back();
        pending.pop_back();
        EXPECT_EQ(std::dynamic_pointer_cast<OstrelCli::System::ReadCacheGet>(node), nullptr);
        EXPECT_EQ(std::dynamic_pointer_cast<OstrelCli::System::ReadCacheSet>(node), nullptr);
        if (node->GetType() == CmdKit::AutoCli::NodeType::Command) ++commands;
        for (const auto& child : node->GetNamespaceNodes()) pending.push_back(child);
    }
    EXPECT_GT(commands, 0u);
    std::size_t consumed = 0;
    auto reboot = root->ResolveNode({"system", "shutdown", "reboot"}, consumed);
    auto poweroff = root->ResolveNode({"system", "shutdown", "poweroff"}, consumed);
    ASSERT_NE(std::dynamic_pointer_cast<OstrelCli::System::Shutdown>(reboot), nullptr);
    ASSERT_NE(std::dynamic_pointer_cast<OstrelCli::System::Shutdown>(poweroff), nullptr);
    EXPECT_NE(reboot, poweroff);
}

}  // namespace

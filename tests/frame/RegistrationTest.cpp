// The shape of the `system` tree as the tool sees it.
#include <gtest/gtest.h>

#include "brixcli/SystemPlugin.h"
#include "support/TestHost.h"

using CmdKit::AutoCli::Namespace;
using CmdKit::AutoCli::NamespaceNode;
using CmdKit::AutoCli::NodeType;

namespace {

std::shared_ptr<NamespaceNode> Register() {
    std::shared_ptr<NamespaceNode> root = Namespace::New();
    AutoCli_RegisterNamespaces(root);
    return root;
}

std::shared_ptr<NamespaceNode> Node(const std::shared_ptr<NamespaceNode>& root,
                                    std::vector<std::string> words) {
    size_t consumed = 0;
    auto node = root->ResolveNode(words, consumed);
    return consumed == words.size() ? node : nullptr;
}

TEST(Registration, FirstLevelNamespacesInTreeOrder) {
    BrixTest::TempHost host;
    auto system = Node(Register(), {"system"});
    ASSERT_TRUE(system);
    EXPECT_EQ(system->GetNamespaceNodeNames(),
              (std::vector<std::string>{"boot", "settings", "module", "coredump", "secpolicy",
                                        "process", "welcomemsg", "quillfs", "version", "time",
                                        "stats", "uuid", "hostname", "snmp", "slp", "wbem",
                                        "shutdown", "maintenanceMode"}));
    EXPECT_EQ(system->GetDescription(),
              "BrixKernel system properties and commands for configuring properties of the "
              "kernel core system and related system services.");
}

TEST(Registration, OddPlacementsAndEmptyDescription) {
    BrixTest::TempHost host;
    auto root = Register();
    auto stats = Node(root, {"system", "stats"});
    ASSERT_TRUE(stats);
    EXPECT_EQ(stats->GetNamespaceNodeNames(), (std::vector<std::string>{"uptime", "installtime"}));
    auto provider = Node(root, {"system", "wbem", "provider"});
    ASSERT_TRUE(provider);
    EXPECT_EQ(provider->GetDescription(), "");
    auto installtime = Node(root, {"system", "stats", "installtime", "get"});
    ASSERT_TRUE(installtime);
    EXPECT_EQ(installtime->GetType(), NodeType::Command);
    EXPECT_EQ(installtime->GetPathString(' '), "system stats installtime get");
}

TEST(Registration, DornaFollowsFeature120) {
    for (bool on : {false, true}) {
        BrixTest::TempHost host;
        if (on) {
            ASSERT_EQ(host.Sim({"feature", "set", "120", "on"}).status, 0);
        }
        auto coredump = Node(Register(), {"system", "coredump"});
        ASSERT_TRUE(coredump);
        std::vector<std::string> expected{"partition", "network", "file"};
        if (on) expected.push_back("dorna");
        EXPECT_EQ(coredump->GetNamespaceNodeNames(), expected) << "feature 120 " << on;
    }
}

TEST(Registration, TreeAloneOwnsCommands) {
    BrixTest::TempHost host;
    auto root = Register();
    auto uuid = Node(root, {"system", "uuid", "get"});
    ASSERT_TRUE(uuid);
    // root's tree plus our local copy, and GetThis shares that ownership.
    EXPECT_EQ(uuid.use_count(), 2);
    auto again = uuid->GetThis();
    EXPECT_EQ(again.get(), uuid.get());
    EXPECT_EQ(uuid.use_count(), 3);
}

TEST(Registration, HelpShowsDornaOnlyWithFeature) {
    BrixTest::TempHost host;
    auto off = host.Cli({"system", "coredump", "--help"});
    EXPECT_EQ(off.status, 0);
    EXPECT_EQ(off.out.find("dorna"), std::string::npos);
    ASSERT_EQ(host.Sim({"feature", "set", "120", "on"}).status, 0);
    auto on = host.Cli({"system", "coredump", "--help"});
    EXPECT_EQ(on.status, 0);
    EXPECT_NE(on.out.find("dorna"), std::string::npos);
}

TEST(Registration, SystemHelpListsEveryNamespaceWithDescription) {
    BrixTest::TempHost host;
    auto help = host.Cli({"system", "--help"});
    ASSERT_EQ(help.status, 0) << help.err;
    for (const char* text : {"maintenanceMode", "Command to manage the system's maintenance mode.",
                             "quillfs", "Operations pertaining to the quillfs memory filesytem.",
                             "welcomemsg", "Commands to get and set the welcome banner for KCON."}) {
        EXPECT_NE(help.out.find(text), std::string::npos) << text;
    }
}

}  // namespace

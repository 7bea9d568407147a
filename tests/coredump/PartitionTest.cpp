// `system coredump partition`: validation order, the platform calls each action makes, and the
// listing's survival of an unreadable configured partition.
#include "Helpers.h"

namespace {

using namespace CoredumpTest;

constexpr const char* kSmartMessage = "--smart can be specified only with --enable=true.";
constexpr const char* kBoot = "naa.6000c2912f4e8a61:7";
constexpr const char* kSecond = "naa.6000c29b7d03e145:2";

struct Case {
    std::vector<std::string> args;
    std::string expected;
};

TEST(Partition, SetValidationMessagesInOrderChangeNothing) {
    BrixTest::TempHost host;
    const Case cases[] = {
        {{"-e", "true", "-p", kSecond},
         "--enable cannot be combined with --partition or --unconfigure."},
        {{"-e", "false", "-u"}, "--enable cannot be combined with --partition or --unconfigure."},
        {{"-s"}, kSmartMessage},
        {{"-s", "-p", kSecond, "-u"}, kSmartMessage},
        {{"-p", kSecond, "-u"},
         "--partition and --unconfigure may not be specified simultaneously."},
        {{}, "Please specify an action. Run with --help for details."},
        {{"-e", "false", "-s"}, kSmartMessage},
    };
    const size_t before = host.Journal().size();
    for (const auto& c : cases) {
        auto args = c.args;
        args.insert(args.begin(), {"partition", "set"});
        SCOPED_TRACE(testing::PrintToString(c.args));
        ExpectFailure(Coredump(host, args), c.expected);
    }
    EXPECT_EQ(CallsSince(host, before), std::vector<std::string>{});
    auto get = Coredump(host, {"partition", "get"});
    EXPECT_EQ(json::parse(get.out), json({{"Active", kBoot}, {"Configured", kBoot}}));
}

TEST(Partition, EachActionMakesItsCallsInOrder) {
    const Case cases[] = {
        {{"-u"}, "DeactivateDiagnosticPartition,UnconfigureDiagnosticPartition"},
        {{"-e", "false"}, "DeactivateDiagnosticPartition"},
        {{"-e", "true"}, "ActivateDiagnosticPartition"},
        {{"-e", "yes", "-s"}, "SmartActivateDiagnosticPartition"},
        {{"--partition", kSecond}, "SetDiagnosticPartition"},
    };
    for (const auto& c : cases) {
        BrixTest::TempHost host;
        const size_t before = host.Journal().size();
        auto args = c.args;
        args.insert(args.begin(), {"partition", "set"});
        auto run = Coredump(host, args);
        SCOPED_TRACE(testing::PrintToString(c.args));
        EXPECT_EQ(run.status, 0) << run.err;
        EXPECT_EQ(run.out, "true\n");
        std::string joined;
        for (const auto& op : Short(CallsSince(host, before))) {
            joined += (joined.empty() ? "" : ",") + op;
        }
        EXPECT_EQ(joined, c.expected);
    }
}

TEST(Partition, ConfiguredAndActiveAreKeptApart) {
    BrixTest::TempHost host;
    ASSERT_EQ(Coredump(host, {"partition", "set", "-p", kSecond}).status, 0);
    EXPECT_EQ(LastCall(host, "KernCtl::Storage::StorageInfoImpl::SetDiagnosticPartition")["args"],
              json({kSecond, true}));
    EXPECT_EQ(json::parse(Coredump(host, {"partition", "get"}).out),
              json({{"Active", kSecond}, {"Configured", kSecond}}));

    ASSERT_EQ(Coredump(host, {"partition", "set", "-e", "false"}).status, 0);
    EXPECT_EQ(json::parse(Coredump(host, {"partition", "get"}).out),
              json({{"Active", ""}, {"Configured", kSecond}}));

    // Unconfigured: nothing to activate, but smart activation picks a local partition.
    ASSERT_EQ(Coredump(host, {"partition", "set", "-u"}).status, 0);
    EXPECT_EQ(json::parse(Coredump(host, {"partition", "get"}).out),
              json({{"Active", ""}, {"Configured", ""}}));
    ExpectFailure(Coredump(host, {"partition", "set", "-e", "true"}),
                  "No diagnostic partition is configured.");
    ASSERT_EQ(Coredump(host, {"partition", "set", "-e", "true", "-s"}).status, 0);
    EXPECT_EQ(json::parse(Coredump(host, {"partition", "get"}).out),
              json({{"Active", kBoot}, {"Configured", ""}}));
}

TEST(Partition, PlatformRefusesUnsuitablePartitions) {
    BrixTest::TempHost host;
    const Case cases[] = {
        {{"-p", "naa.6000c2912f4e8a61:1"},
         "Partition naa.6000c2912f4e8a61:1 is not a diagnostic partition."},
        {{"-p", "naa.6000c29e51c2d7f0:3"}, "Device naa.6000c29e51c2d7f0 is not accessible."},
        {{"-p", "naa.0000:1"}, "Partition naa.0000:1 not found."},
        {{"-p", "naa.6000c2912f4e8a61"}, "Partition naa.6000c2912f4e8a61 not found."},
    };
    for (const auto& c : cases) {
        auto args = c.args;
        args.insert(args.begin(), {"partition", "set"});
        ExpectFailure(Coredump(host, args), c.expected);
    }
    EXPECT_EQ(json::parse(Coredump(host, {"partition", "get"}).out),
              json({{"Active", kBoot}, {"Configured", kBoot}}));
}

json Row(const std::string& name, bool active, bool configured) {
    return {{"Name", name},
            {"Path", "/dev/disks/" + name},
            {"Active", active},
            {"Configured", configured}};
}

TEST(Partition, ListMarksActiveAndConfiguredByName) {
    BrixTest::TempHost host;
    ASSERT_EQ(Coredump(host, {"partition", "set", "-p", kSecond}).status, 0);
    ASSERT_EQ(Coredump(host, {"partition", "set", "-e", "true", "-s"}).status, 0);
    auto run = Coredump(host, {"partition", "list"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(json::parse(run.out), json::array({Row(kBoot, false, false), Row(kSecond, true, true),
                                                 Row("naa.600a098038304b2f:1", false, false),
                                                 Row("naa.6000c29e51c2d7f0:3", false, false)}));
}

TEST(Partition, ListSurvivesUnreadableConfiguredPartition) {
    BrixTest::TempHost host;
    host.Fault("KernCtl::Storage::StorageInfoImpl::GetConfiguredDiagnosticPartition", "gone");
    auto run = Coredump(host, {"partition", "list"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "no configured dump partition found; skipping\n");
    EXPECT_EQ(json::parse(run.out),
              json::array({Row(kBoot, true, false), Row(kSecond, false, false),
                           Row("naa.600a098038304b2f:1", false, false),
                           Row("naa.6000c29e51c2d7f0:3", false, false)}));
    // The table view still has every row.
    auto table = Coredump(host, {"partition", "list"}, false);
    EXPECT_NE(table.out.find("naa.6000c29e51c2d7f0:3"), std::string::npos) << table.out;
}

TEST(Partition, ConfiguredPartitionThatVanishedIsReportedByList) {
    BrixTest::TempHost host;
    SetHostValues(host, {{"coredump.partition.configured", "naa.6000c2900000dead:4"}});
    auto list = Coredump(host, {"partition", "list"});
    EXPECT_EQ(list.status, 1);
    EXPECT_EQ(list.err, "no configured dump partition found; skipping\n");
    EXPECT_EQ(json::parse(list.out).size(), 4u);
    ExpectFailure(Coredump(host, {"partition", "get"}),
                  "Configured diagnostic partition naa.6000c2900000dead:4 not found.");
}

TEST(Partition, FaultsAreReportedAndNothingIsUndone) {
    const struct {
        const char* op;
        std::vector<std::string> words;
    } cases[] = {
        {"KernCtl::Storage::StorageInfoImpl::GetActiveDiagnosticPartition", {"partition", "get"}},
        {"KernCtl::Storage::StorageInfoImpl::GetActiveDiagnosticPartition", {"partition", "list"}},
        {"KernCtl::Storage::StorageInfoImpl::GetPotentialDiagnosticPartitions",
         {"partition", "list"}},
        {"KernCtl::Storage::StorageInfoImpl::SetDiagnosticPartition",
         {"partition", "set", "-p", kSecond}},
        {"KernCtl::Storage::StorageInfoImpl::SmartActivateDiagnosticPartition",
         {"partition", "set", "-e", "1", "-s"}},
    };
    for (const auto& c : cases) {
        BrixTest::TempHost host;
        host.Fault(c.op, "storage busy");
        SCOPED_TRACE(c.op);
        ExpectFailure(Coredump(host, c.words), "storage busy");
    }
    // A failing second call leaves the partition deactivated but still configured.
    BrixTest::TempHost host;
    host.Fault("KernCtl::Storage::StorageInfoImpl::UnconfigureDiagnosticPartition", "no");
    ExpectFailure(Coredump(host, {"partition", "set", "-u"}), "no");
    EXPECT_EQ(json::parse(Coredump(host, {"partition", "get"}).out),
              json({{"Active", ""}, {"Configured", kBoot}}));
}

}  // namespace

// `system coredump dorna`: present only with feature 120, its own validation order, the
// preference store initialised by add and set, and object removal.
#include "Helpers.h"

namespace {

using namespace CoredumpTest;

constexpr const char* kActive = "3c9e7a41-5b2d-4f86-a1c0-7d84e2b9f615";
constexpr const char* kSpare = "b81f04d6-2e7c-4a93-9d58-16fa0c3e72ab";
constexpr int64_t kDefaultBytes = 768LL * 1024 * 1024;
constexpr const char* kSmartMessage = "--smart can be specified only with --enable=true.";

class Dorna : public testing::Test {
  protected:
    void SetUp() override { ASSERT_EQ(host.Sim({"feature", "set", "120", "on"}).status, 0); }

    // Operations called since `before`, without their qualifying names.
    std::vector<std::string> Since(size_t before) const { return Short(CallsSince(host, before)); }

    BrixTest::TempHost host;
};

TEST(DornaFeature, CommandsExistOnlyWithFeature120) {
    BrixTest::TempHost host;
    EXPECT_EQ(Coredump(host, {"dorna", "get"}).status, 2);
    EXPECT_EQ(host.Cli({"system", "coredump", "--help"}).out.find("dorna"), std::string::npos);
    ASSERT_EQ(host.Sim({"feature", "set", "120", "on"}).status, 0);
    EXPECT_NE(host.Cli({"system", "coredump", "--help"}).out.find("dorna"), std::string::npos);
    auto get = Coredump(host, {"dorna", "get"});
    ASSERT_EQ(get.status, 0) << get.err;
    EXPECT_EQ(json::parse(get.out), json({{"Active", kActive}, {"Configured", kActive}}));
    auto help = host.Cli({"system", "coredump", "dorna", "set", "--help"});
    EXPECT_NE(help.out.find("The UUID of the Dorna dump object to use."), std::string::npos);
}

TEST_F(Dorna, SetValidationMessagesInOrder) {
    const std::pair<std::vector<std::string>, std::string> cases[] = {
        {{"-e", "true", "-U", kSpare}, "--enable cannot be combined with --uuid or --unconfigure."},
        {{"-e", "true", "-u", "-s"}, "--enable cannot be combined with --uuid or --unconfigure."},
        {{"-e", "false", "-s"}, kSmartMessage},
        {{"-s"}, kSmartMessage},
        {{"-s", "-u", "-U", kSpare}, kSmartMessage},
        {{}, "Please specify an action (--enable or --unconfigure)."},
        {{"-u", "-U", "x"}, "--unconfigure cannot be combined with --uuid."},
        {{"--unconfigure", "--uuid", kSpare}, "--unconfigure cannot be combined with --uuid."},
    };
    for (const auto& [args, message] : cases) {
        auto words = args;
        words.insert(words.begin(), {"dorna", "set"});
        SCOPED_TRACE(testing::PrintToString(args));
        const size_t before = host.Journal().size();
        ExpectFailure(Coredump(host, words), message);
        // The preference store is initialised before validation; nothing else is called.
        const auto calls = CallsSince(host, before);
        ASSERT_EQ(calls.size(), 1u);
        EXPECT_NE(calls[0].find("Preference_Init"), std::string::npos) << calls[0];
    }
    EXPECT_EQ(json::parse(Coredump(host, {"dorna", "get"}).out),
              json({{"Active", kActive}, {"Configured", kActive}}));
}

TEST_F(Dorna, SetActions) {
    size_t before = host.Journal().size();
    ASSERT_EQ(Coredump(host, {"dorna", "set", "-u"}).status, 0);
    EXPECT_EQ(Since(before),
              (std::vector<std::string>{"Preference_Init", "DeactivateDiagnosticDorna",
                                        "UnconfigureDiagnosticDorna"}));
    EXPECT_EQ(json::parse(Coredump(host, {"dorna", "get"}).out),
              json({{"Active", ""}, {"Configured", ""}}));

    before = host.Journal().size();
    ASSERT_EQ(Coredump(host, {"dorna", "set", "-e", "true", "-s"}).status, 0);
    EXPECT_EQ(Since(before),
              (std::vector<std::string>{"Preference_Init", "SmartActivateDiagnosticDorna"}));
    EXPECT_EQ(json::parse(Coredump(host, {"dorna", "get"}).out),
              json({{"Active", kActive}, {"Configured", ""}}));

    ASSERT_EQ(Coredump(host, {"dorna", "set", "-U", kSpare}).status, 0);
    EXPECT_EQ(LastCall(host, "KernCtl::Storage::StorageInfoImpl::SetDiagnosticDorna")["args"],
              json({kSpare, true}));
    ASSERT_EQ(Coredump(host, {"dorna", "set", "-e", "false"}).status, 0);
    ASSERT_EQ(Coredump(host, {"dorna", "set", "-e", "true"}).status, 0);
    EXPECT_EQ(json::parse(Coredump(host, {"dorna", "get"}).out),
              json({{"Active", kSpare}, {"Configured", kSpare}}));
    ExpectFailure(Coredump(host, {"dorna", "set", "-U", "00000000-0000-4000-8000-000000000000"}),
                  "Dorna dump object 00000000-0000-4000-8000-000000000000 not found.");
}

json DornaRow(const std::string& uuid, bool active, bool configured, int64_t size) {
    return {{"UUID", uuid}, {"Active", active}, {"Configured", configured}, {"Size", size}};
}

TEST_F(Dorna, AddCreatesDefaultObjectNotActivated) {
    const size_t before = host.Journal().size();
    auto add = Coredump(host, {"dorna", "add"});
    ASSERT_EQ(add.status, 0) << add.err;
    EXPECT_EQ(Since(before),
              (std::vector<std::string>{"Preference_Init", "CreateDiagnosticDorna"}));
    const auto args =
        LastCall(host, "KernCtl::Storage::StorageInfoImpl::CreateDiagnosticDorna")["args"];
    ASSERT_EQ(args.size(), 3u);
    EXPECT_EQ(args[0], 0);
    EXPECT_EQ(args[1], false);
    const std::string created = args[2];
    auto list = Coredump(host, {"dorna", "list"});
    ASSERT_EQ(list.status, 0) << list.err;
    EXPECT_EQ(json::parse(list.out), json::array({DornaRow(kActive, true, true, kDefaultBytes),
                                                  DornaRow(kSpare, false, false, 2 * kDefaultBytes),
                                                  DornaRow(created, false, false, kDefaultBytes)}));

    // --auto creates nothing while objects exist.
    ASSERT_EQ(Coredump(host, {"dorna", "add", "-a", "-s", "10"}).status, 0);
    EXPECT_EQ(json::parse(Coredump(host, {"dorna", "list"}).out).size(), 3u);
    ExpectFailure(Coredump(host, {"dorna", "add", "-s", "999999"}),
                  "Insufficient space in the Dorna storage: 999999 MB needed, 259072 MB free.");
}

TEST_F(Dorna, RemoveRules) {
    ExpectFailure(Coredump(host, {"dorna", "remove"}),
                  std::string("Dorna dump object ") + kActive +
                      " is currently active.  The active Dorna dump object will only be removed "
                      "if --force is specified.");
    ExpectFailure(Coredump(host, {"dorna", "remove", "-u", kSpare}),
                  std::string("Dorna dump object ") + kSpare +
                      " read count could not be determined; Use --force to override check.");

    size_t before = host.Journal().size();
    ASSERT_EQ(Coredump(host, {"dorna", "remove", "--force"}).status, 0);
    EXPECT_EQ(Since(before),
              (std::vector<std::string>{"DeactivateDiagnosticDorna", "UnconfigureDiagnosticDorna",
                                        "DumpDornaRemove"}));
    EXPECT_EQ(json::parse(Coredump(host, {"dorna", "list"}).out),
              json::array({DornaRow(kSpare, false, false, 2 * kDefaultBytes)}));
    ExpectFailure(Coredump(host, {"dorna", "remove", "-F", "-u", kActive}),
                  std::string("Removal of object ") + kActive + " failed");

    ASSERT_EQ(Coredump(host, {"dorna", "add", "-s", "16", "-e", "true"}).status, 0);
    const std::string fresh = json::parse(Coredump(host, {"dorna", "get"}).out)["Active"];
    ASSERT_EQ(Coredump(host, {"dorna", "set", "-e", "false"}).status, 0);
    before = host.Journal().size();
    ExpectFailure(Coredump(host, {"dorna", "remove"}),
                  "Dorna dump object " + fresh + " not read yet; Use --force to override check.");
    EXPECT_EQ(Since(before), std::vector<std::string>{"UnconfigureDiagnosticDorna"});
    ExpectFailure(Coredump(host, {"dorna", "remove"}), "No configured object to remove.");

    host.Fault("KernCtl::Storage::DiagnosticDornaImpl::DumpDornaRemove", "cluster unavailable");
    ExpectFailure(Coredump(host, {"dorna", "remove", "-F", "-u", fresh}),
                  "Removal of object " + fresh + " failed");
    EXPECT_EQ(json::parse(Coredump(host, {"dorna", "list"}).out).size(), 2u);
}

TEST_F(Dorna, ListAndGetFaults) {
    host.Fault("KernCtl::Storage::StorageInfoImpl::GetActiveDiagnosticDorna", "offline");
    auto list = Coredump(host, {"dorna", "list"});
    EXPECT_EQ(list.status, 0);
    EXPECT_EQ(json::parse(list.out)[0], DornaRow(kActive, false, true, kDefaultBytes));
    ExpectFailure(Coredump(host, {"dorna", "get"}), "offline");
    host.Fault("KernCtl::Storage::StorageInfoImpl::CreateDiagnosticDorna", "full");
    ExpectFailure(Coredump(host, {"dorna", "add"}), "full");
}

}  // namespace

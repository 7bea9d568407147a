// system maintenanceMode get|set through the host's /bin/mgmt-cmd, and system shutdown.
#include "HostStateTesting.h"
#include "hostsim/core/Store.h"

namespace {

using namespace HostStateTesting;

constexpr const char* kGetState = "KernCtl::System::SystemInfoImpl::GetMaintenanceModeState";

std::string State(const BrixTest::TempHost& host) {
    return Parsed(Json(host, {"system", "maintenanceMode", "get"})).get<std::string>();
}

void SetStoredState(int state) {
    BrixSim::Store::Get().Prepare("UPDATE maintenance_mode SET state = ?").Bind(1, state).Run();
}

std::vector<std::string> Argv(const std::string& action, const std::string& timeout,
                              const std::string& mode) {
    return {"/bin/mgmt-cmd", "hostsvc/maintenance_mode_" + action, timeout, mode};
}

TEST(MaintenanceMode, GetReportsTheState) {
    BrixTest::TempHost host;
    EXPECT_EQ(State(host), "Disabled");
    for (const auto& [stored, shown] : std::vector<std::pair<int, std::string>>{
             {1, "Enabled"}, {2, "Disabled"}, {0, "Unknown"}, {7, "Unknown"}}) {
        SetStoredState(stored);
        EXPECT_EQ(State(host), shown);
    }
}

TEST(MaintenanceMode, EnterAndExitRunTheServiceTool) {
    BrixTest::TempHost host;
    JournalMark enter(host);
    EXPECT_EQ(Parsed(Json(host, {"system", "maintenanceMode", "set", "-e", "true"})), json(true));
    auto execs = enter.Added({"exec"});
    ASSERT_EQ(execs.size(), 1u);
    EXPECT_EQ(execs[0]["argv"], json(Argv("enter", "0", "ensureObjectAccessibility")));
    EXPECT_EQ(execs[0]["status"], 0);
    EXPECT_FALSE(execs[0]["user"].get<std::string>().empty());
    auto calls = enter.Calls("HostSvc::EnterMaintenanceMode");
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_EQ(calls[0]["args"], json::array({0, "ensureObjectAccessibility"}));
    EXPECT_EQ(State(host), "Enabled");

    JournalMark again(host);
    ExpectRefused(host.Cli({"system", "maintenanceMode", "set", "--enable", "yes"}),
                  "Maintenance mode is already enabled.");
    EXPECT_TRUE(again.Added({"exec"}).empty());

    JournalMark exit(host);
    EXPECT_EQ(Parsed(Json(host, {"system", "maintenanceMode", "set", "-e", "false", "-t", "45",
                                 "-m", "evacuateAllData"})),
              json(true));
    execs = exit.Added({"exec"});
    ASSERT_EQ(execs.size(), 1u);
    EXPECT_EQ(execs[0]["argv"], json(Argv("exit", "45", "evacuateAllData")));
    EXPECT_EQ(State(host), "Disabled");

    ExpectRefused(host.Cli({"system", "maintenanceMode", "set", "-e", "0"}),
                  "Maintenance mode is already disabled.");

    JournalMark modes(host);
    ASSERT_EQ(host.Cli({"system", "maintenanceMode", "set", "-e", "1", "--dornamode", "noAction",
                        "--timeout", "300"})
                  .status,
              0);
    EXPECT_EQ(modes.Added({"exec"}).at(0)["argv"], json(Argv("enter", "300", "noAction")));
}

TEST(MaintenanceMode, UnknownStatePassesBothChecks) {
    BrixTest::TempHost host;
    SetStoredState(0);
    EXPECT_EQ(Parsed(Json(host, {"system", "maintenanceMode", "set", "-e", "false"})), json(true));
    EXPECT_EQ(State(host), "Disabled");
    SetStoredState(0);
    EXPECT_EQ(Parsed(Json(host, {"system", "maintenanceMode", "set", "-e", "true"})), json(true));
    EXPECT_EQ(State(host), "Enabled");
}

TEST(MaintenanceMode, FailuresAreReported) {
    BrixTest::TempHost host;
    // The service tool's own failure: its output is the message.
    host.Fault("HostSvc::EnterMaintenanceMode", "Dorna evacuation did not finish");
    JournalMark mark(host);
    ExpectRefused(host.Cli({"system", "maintenanceMode", "set", "-e", "true"}),
                  "Dorna evacuation did not finish");
    auto execs = mark.Added({"exec"});
    ASSERT_EQ(execs.size(), 1u);
    EXPECT_NE(execs[0]["status"], 0);
    host.ClearFaults();
    EXPECT_EQ(State(host), "Disabled");

    // A state that cannot be read is reported with its detail, before anything runs.
    host.Fault(kGetState, "state unavailable", 0, "management service busy");
    JournalMark none(host);
    ExpectRefused(host.Cli({"system", "maintenanceMode", "set", "-e", "true"}),
                  "state unavailable (management service busy)");
    ExpectRefused(host.Cli({"system", "maintenanceMode", "get"}),
                  "state unavailable (management service busy)");
    EXPECT_TRUE(none.Added({"exec"}).empty());

    // An unlisted Dorna mode is the framework's to refuse.
    EXPECT_EQ(host.Cli({"system", "maintenanceMode", "set", "-e", "true", "-m", "wipe"}).status, 2);
}

// The service tool at the host's /bin/mgmt-cmd, run directly.
TEST(MaintenanceMode, ServiceToolChecksItsArguments) {
    BrixTest::TempHost host;
    EXPECT_EQ(State(host), "Disabled");  // makes the host
    const std::string tool = (host.Root() / "bin" / "mgmt-cmd").string();
    struct Case {
        std::vector<std::string> args;
        int status;
        std::string firstLine;
        bool usage = false;  // a call of the wrong shape also gets the usage, a wrong value not
    };
    const Case cases[] = {
        {{"hostsvc/maintenance_mode_exit", "0", "ensureObjectAccessibility"},
         1,
         "The host is not in maintenance mode."},
        {{}, 2, "mgmt-cmd: missing command", true},
        {{"hostsvc/reboot", "0"}, 2, "mgmt-cmd: unknown command 'hostsvc/reboot'", true},
        {{"hostsvc/maintenance_mode_enter"}, 2, "mgmt-cmd: wrong number of arguments", true},
        {{"hostsvc/maintenance_mode_enter", "-5", "noAction"},
         2,
         "mgmt-cmd: invalid timeout '-5': expected a number of seconds, 0 or more"},
        {{"hostsvc/maintenance_mode_enter", "0", "wipe"},
         2,
         "mgmt-cmd: invalid mode 'wipe': expected noAction, ensureObjectAccessibility or "
         "evacuateAllData"},
        {{"hostsvc/maintenance_mode_enter", "10"}, 0, ""},
        {{"hostsvc/maintenance_mode_enter", "0", "noAction"},
         1,
         "The host is already in maintenance mode."},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.firstLine);
        std::vector<std::string> argv{tool};
        argv.insert(argv.end(), c.args.begin(), c.args.end());
        auto run = BrixTest::Run(argv);
        EXPECT_EQ(run.status, c.status);
        EXPECT_EQ(run.err.substr(0, run.err.find('\n')), c.firstLine);
        EXPECT_EQ(run.err.find("Usage:") != std::string::npos, c.usage);
    }
    EXPECT_EQ(State(host), "Enabled");
}

}  // namespace

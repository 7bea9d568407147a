// system shutdown reboot|poweroff: checks, then sleep, event, syslog, sleep and the signal to init.
#include "HostStateTesting.h"
#include "cmdkit/CallSpec.h"
#include "hostsim/core/Store.h"
#include "identity/Shutdown.h"

namespace {

using namespace HostStateTesting;

constexpr const char* kGetState = "KernCtl::System::SystemInfoImpl::GetMaintenanceModeState";
const std::vector<std::string> kSteps{"sleep", "event", "syslog", "signal"};

void EnterMaintenance(const BrixTest::TempHost& host) {
    ASSERT_EQ(host.Cli({"system", "maintenanceMode", "set", "-e", "true"}).status, 0);
}

json Sleep(int seconds) {
    return {{"kind", "sleep"}, {"seconds", seconds}};
}
json Signal(int signal) {
    return {{"kind", "signal"}, {"pid", 1}, {"signal", signal}};
}
json Syslog(const std::string& text) {
    return {{"kind", "syslog"}, {"priority", 2}, {"text", text}};
}
json Event(const std::string& id, const std::string& text) {
    return {{"kind", "event"}, {"format", "@&!*@*@(" + id + ")%s"}, {"text", text}};
}

// The step records, with only the fields the steps are defined by.
std::vector<json> Steps(const JournalMark& mark) {
    std::vector<json> steps;
    for (const auto& record : mark.Added(kSteps)) {
        json step;
        for (const auto& key : {"kind", "seconds", "pid", "signal", "priority", "text", "format"}) {
            if (record.contains(key)) step[key] = record[key];
        }
        steps.push_back(step);
    }
    return steps;
}

TEST(Shutdown, RebootWithDelay) {
    BrixTest::TempHost host;
    EnterMaintenance(host);
    JournalMark mark(host);
    EXPECT_EQ(Parsed(Json(host, {"system", "shutdown", "reboot", "-r", "x", "-d", "30"})),
              json(true));
    EXPECT_EQ(Steps(mark),
              (std::vector<json>{Sleep(20),
                                 Event("evt.user.brixcli.host.reboot", "Reason for reboot: <x>"),
                                 Syslog("Reason for reboot: <x>"), Sleep(10), Signal(15)}));
}

TEST(Shutdown, PoweroffWithoutDelay) {
    BrixTest::TempHost host;
    EnterMaintenance(host);
    JournalMark mark(host);
    EXPECT_EQ(Parsed(Json(host, {"system", "shutdown", "poweroff", "--reason", "rack move"})),
              json(true));
    EXPECT_EQ(Steps(mark),
              (std::vector<json>{
                  Event("evt.user.brixcli.host.poweroff", "Reason for power off: <rack move>"),
                  Syslog("Reason for power off: <rack move>"), Sleep(10), Signal(12)}));
}

// A '%' in the reason is logged as itself, in the event and in the syslog record.
TEST(Shutdown, ReasonIsNeverAFormat) {
    for (const std::string& reason :
         std::vector<std::string>{"%n%s", "100% done %d%%", std::string(512, '%')}) {
        SCOPED_TRACE(reason);
        BrixTest::TempHost host;
        EnterMaintenance(host);
        JournalMark mark(host);
        EXPECT_EQ(Parsed(Json(host, {"system", "shutdown", "reboot", "-r", reason})), json(true));
        const std::string text = "Reason for reboot: <" + reason + ">";
        EXPECT_EQ(Steps(mark), (std::vector<json>{Event("evt.user.brixcli.host.reboot", text),
                                                  Syslog(text), Sleep(10), Signal(15)}));
    }
}

TEST(Shutdown, RefusalsInOrder) {
    BrixTest::TempHost host;
    JournalMark mark(host);
    // Not in maintenance mode: nothing logged, no signal.
    ExpectRefused(host.Cli({"system", "shutdown", "reboot", "-r", "x"}),
                  "System is not in maintenance mode. Cannot perform requested operation.");
    ExpectRefused(host.Cli({"system", "shutdown", "poweroff", "-r", "x", "-d", "10"}),
                  "System is not in maintenance mode. Cannot perform requested operation.");
    // Only "in maintenance mode" lets a shutdown through, never an unknown state.
    for (int state : {0, 7}) {
        BrixSim::Store::Get().Prepare("UPDATE maintenance_mode SET state = ?").Bind(1, state).Run();
        ExpectRefused(host.Cli({"system", "shutdown", "poweroff", "-r", "x"}),
                      "System is not in maintenance mode. Cannot perform requested operation.");
    }
    BrixSim::Store::Get().Prepare("UPDATE maintenance_mode SET state = 2").Run();

    // The reason's length is checked before the state is read: 513 characters are refused even
    // when the state cannot be read, 512 reach the state.
    host.Fault(kGetState, "no state", 0, "management service restarting");
    ExpectRefused(host.Cli({"system", "shutdown", "reboot", "-r", std::string(513, 'r')}),
                  "Reason message cannot be longer than 512 characters.");
    ExpectRefused(host.Cli({"system", "shutdown", "reboot", "-r", std::string(512, 'r')}),
                  "no state (management service restarting)");
    host.ClearFaults();
    EXPECT_TRUE(mark.Added(kSteps).empty());

    // The delay's range is the framework's.
    EnterMaintenance(host);
    EXPECT_EQ(host.Cli({"system", "shutdown", "reboot", "-r", "x", "-d", "9"}).status, 2);
    EXPECT_EQ(host.Cli({"system", "shutdown", "reboot", "-r", "x", "-d", "4294967296"}).status, 2);
    EXPECT_TRUE(mark.Added(kSteps).empty());
}

// The restarted host runs what is configured: uptime starts again, hand-set levels and
// current-boot-only choices are gone, and the dump partition is chosen anew.
TEST(Shutdown, RebootRestartsTheRunningState) {
    for (const char* operation : {"reboot", "poweroff"}) {
        SCOPED_TRACE(operation);
        BrixTest::TempHost host;
        EnterMaintenance(host);
        for (const std::vector<std::string>& change : std::vector<std::vector<std::string>>{
                 {"system", "secpolicy", "domain", "set", "-n", "shellTools", "-l", "audit"},
                 {"system", "settings", "keyboard", "layout", "set", "-l", "German",
                  "--no-persist"},
                 {"system", "coredump", "partition", "set", "--unconfigure"}}) {
            ASSERT_EQ(host.Cli(change).status, 0) << change[1];
        }
        const json dumpBefore = Parsed(Json(host, {"system", "coredump", "partition", "get"}));
        ASSERT_EQ(dumpBefore["Active"], "");
        ASSERT_GT(Parsed(Json(host, {"system", "stats", "uptime", "get"})).get<int64_t>(),
                  86'400'000'000LL);

        ASSERT_EQ(Parsed(Json(host, {"system", "shutdown", operation, "-r", "restart"})),
                  json(true));
        EXPECT_LT(Parsed(Json(host, {"system", "stats", "uptime", "get"})).get<int64_t>(),
                  600'000'000LL);
        for (const auto& domain : Parsed(Json(host, {"system", "secpolicy", "domain", "list"}))) {
            EXPECT_EQ(domain["Enforcement Level"], "enforcing") << domain;
        }
        EXPECT_EQ(Parsed(Json(host, {"system", "settings", "keyboard", "layout", "get"})),
                  json("US Default"));
        const json dump = Parsed(Json(host, {"system", "coredump", "partition", "get"}));
        EXPECT_EQ(dump["Active"], "naa.6000c2912f4e8a61:7");
        EXPECT_EQ(dump["Configured"], "");
        // Maintenance mode is kept across the restart.
        EXPECT_EQ(Parsed(Json(host, {"system", "maintenanceMode", "get"})), json("Enabled"));
    }
}

// A failing event library does not stop the shutdown.
TEST(Shutdown, EventFailureIsIgnored) {
    for (const char* op : {"EvtUserLib_Init", "EvtUserLib_AddEvt"}) {
        SCOPED_TRACE(op);
        BrixTest::TempHost host;
        EnterMaintenance(host);
        host.Fault(op, "event service unavailable");
        JournalMark mark(host);
        EXPECT_EQ(Parsed(Json(host, {"system", "shutdown", "poweroff", "-r", "y"})), json(true));
        EXPECT_EQ(Steps(mark),
                  (std::vector<json>{Syslog("Reason for power off: <y>"), Sleep(10), Signal(12)}));
    }
}

std::shared_ptr<CmdKit::CallSpec::Output> RunInProcess(CmdKit::AutoCli::Command& command,
                                                       const std::string& reason) {
    auto input = CmdKit::CallSpec::Input::New();
    input->AddValue("reason", reason);
    auto output = CmdKit::CallSpec::Output::New();
    command.Execute(input, output);
    return output;
}

// Once a shutdown has passed its checks, the process refuses any further one, reboot or power off.
TEST(Shutdown, SecondRequestInTheSameProcess) {
    BrixTest::TempHost host;
    EnterMaintenance(host);
    auto poweroff = OstrelCli::System::Shutdown::New(OstrelCli::System::SHUTDOWN_POWEROFF);
    auto reboot = OstrelCli::System::Shutdown::New(OstrelCli::System::SHUTDOWN_REBOOT);
    EXPECT_NE(poweroff, reboot);
    EXPECT_EQ(poweroff->GetDescription(),
              "Power off the system. The host must be in maintenance mode.");
    EXPECT_EQ(reboot->GetDescription(), "Reboot the system. The host must be in maintenance mode.");

    JournalMark mark(host);
    auto first = RunInProcess(*poweroff, "first");
    EXPECT_TRUE(first->GetErrorMessages().empty());
    EXPECT_TRUE(first->IsComplete());
    for (auto* command : {poweroff.get(), reboot.get()}) {
        auto again = RunInProcess(*command, "again");
        EXPECT_EQ(again->GetErrorMessages(),
                  std::vector<std::string>{"System is already performing requested operation."});
        EXPECT_FALSE(again->IsComplete());
        EXPECT_EQ(again->GetRootObject(), nullptr);
    }
    EXPECT_EQ(mark.Added({"signal"}).size(), 1u);
}

}  // namespace

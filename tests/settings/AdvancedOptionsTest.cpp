// system settings advanced list / set against the simulated host.
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "hostsim/core/Store.h"
#include "support/CliJson.h"

namespace {

using BrixTest::Calls;
using BrixTest::Column;
using BrixTest::Json;
using BrixTest::With;
using nlohmann::json;

const std::vector<std::string> kList = {"system", "settings", "advanced", "list"};
const std::vector<std::string> kSet = {"system", "settings", "advanced", "set"};

class AdvancedOptions : public testing::Test {
  protected:
    BrixTest::TempHost host;
};

TEST_F(AdvancedOptions, MissingTreeReportsAndAnswersEmptyList) {
    const auto run = Json(host, With(kList, {"-t", "Nope"}));
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "Invalid value for --tree No tree with the name Nope found\n");
    EXPECT_EQ(run.out, json::array());

    const auto deep = Json(host, With(kList, {"--tree", "/Net/Nope/"}));
    EXPECT_EQ(deep.err, "Invalid value for --tree No tree with the name /Net/Nope/ found\n");
    EXPECT_EQ(deep.out, json::array());
}

TEST_F(AdvancedOptions, TreeSelection) {
    const auto all = Json(host, kList);
    ASSERT_EQ(all.status, 0) << all.err;
    EXPECT_GE(all.out.size(), 250U);
    const auto allPaths = Column(all.out, "Path");

    // The tokenizer drops empty pieces: these select the same branches.
    const std::vector<std::pair<std::string, std::string>> same = {
        {"/", ""}, {"Misc", "/Misc/"}, {"Net/Tcp", "//Net//Tcp"}};
    for (const auto& [left, right] : same) {
        EXPECT_EQ(Json(host, With(kList, {"-t", left})).out,
                  Json(host, With(kList, {"-t", right})).out)
            << left << " vs " << right;
    }
    EXPECT_EQ(Column(Json(host, With(kList, {"-t", "/"})).out, "Path"), allPaths);

    // A branch's own options come before those of its sub-branches.
    const auto net = Column(Json(host, With(kList, {"-t", "Net"})).out, "Path");
    ASSERT_FALSE(net.empty());
    EXPECT_EQ(net.front(), "/Net/MaxNetifTxQueueLen");
    EXPECT_EQ(net.back(), "/Net/Tcp/RecvBufferMaxKB");
    bool inTcp = false;
    for (const auto& path : net) {
        const bool tcp = path.rfind("/Net/Tcp/", 0) == 0;
        EXPECT_FALSE(inTcp && !tcp) << path << " after a /Net/Tcp option";
        inTcp = inTcp || tcp;
    }
    // The whole tree lists in the same pre-order.
    const auto netStart = std::find(allPaths.begin(), allPaths.end(), net.front());
    ASSERT_NE(netStart, allPaths.end());
    EXPECT_TRUE(std::equal(net.begin(), net.end(), netStart));
}

TEST_F(AdvancedOptions, DeltaListsOnlyChangedReadableOptions) {
    const auto run = Json(host, With(kList, {"-d"}));
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(Column(run.out, "Path"),
              (std::vector<std::string>{"/Disk/SchedNumReqOutstanding", "/Mem/MemZipMaxPct",
                                        "/Misc/HostName", "/Net/Tcp/DelayedAck", "/Power/CpuPolicy",
                                        "/Scsi/LogCmdErrors", "/Syslog/LogHost",
                                        "/UserVars/SuppressShellWarning"}));

    ASSERT_EQ(Json(host, With(kSet, {"-o", "/Misc/HostName", "-d"})).status, 0);
    ASSERT_EQ(Json(host, With(kSet, {"-o", "/Cpu/SchedQuantumUs", "-i", "60000"})).status, 0);
    EXPECT_EQ(Column(Json(host, With(kList, {"-d", "-t", "/Cpu"})).out, "Path"),
              std::vector<std::string>{"/Cpu/SchedQuantumUs"});
    EXPECT_EQ(Column(Json(host, With(kList, {"-d", "-t", "Misc"})).out, "Path"),
              std::vector<std::string>{});
}

TEST_F(AdvancedOptions, RowShapes) {
    const auto max = Json(host, With(kList, {"-o", "/Cpu/HaltIdleThresholdUs"}));
    ASSERT_EQ(max.status, 0) << max.err;
    EXPECT_EQ(max.out, json::parse(R"js([{
        "Path": "/Cpu/HaltIdleThresholdUs", "Type": "integer",
        "Int Value": 4294967295, "Default Int Value": 4294967295,
        "Min Value": 0, "Max Value": 4294967295,
        "String Value": "", "Default String Value": "", "Valid Characters": "",
        "Description": "Idle microseconds before a physical CPU halts (4294967295: never)"}])js"));

    const auto text = Json(host, With(kList, {"-o", "/Net/IgmpRouterIp"}));
    EXPECT_EQ(text.out, json::parse(R"js([{
        "Path": "/Net/IgmpRouterIp", "Type": "string",
        "Int Value": null, "Default Int Value": null, "Min Value": null, "Max Value": null,
        "String Value": "0.0.0.0", "Default String Value": "0.0.0.0",
        "Valid Characters": "0123456789.",
        "Description": "Router that multicast reports go to"}])js"));

    const auto user = Json(host, With(kList, {"-o", "/UserVars/SuppressShellWarning"}));
    EXPECT_EQ(user.out[0]["Int Value"], 1);
    EXPECT_EQ(user.out[0]["Default Int Value"], 0);

    // Options whose value the kernel cannot hand out show error rows.
    const auto broken = Json(host, With(kList, {"-t", "Misc"}));
    const auto row = std::find_if(broken.out.begin(), broken.out.end(), [](const json& r) {
        return r["Path"] == "/Misc/LegacyTimerCalibration";
    });
    ASSERT_NE(row, broken.out.end());
    EXPECT_EQ((*row)["Int Value"], -1);
    EXPECT_EQ((*row)["Max Value"], -1);
    EXPECT_EQ((*row)["String Value"], "ERROR getting value");
    const auto brokenText = Json(host, With(kList, {"-o", "/Syslog/TemplateFormat"}));
    EXPECT_EQ(brokenText.out[0]["Int Value"], nullptr);
    EXPECT_EQ(brokenText.out[0]["String Value"], "ERROR getting values");
}

TEST_F(AdvancedOptions, SingleOptionIgnoresDeltaAndTree) {
    const auto run = Json(host, With(kList, {"-o", "/Cpu/SchedQuantumUs", "-d", "-t", "Nope"}));
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(Column(run.out, "Path"), std::vector<std::string>{"/Cpu/SchedQuantumUs"});

    const auto unknown = Json(host, With(kList, {"-o", "/Cpu/Nope"}));
    EXPECT_EQ(unknown.status, 1);
    EXPECT_EQ(unknown.err, "Unable to find option /Cpu/Nope\n");
    EXPECT_TRUE(unknown.out.is_null());
}

class AdvancedSetRefusals : public BrixTest::RefusalTest {};

TEST_P(AdvancedSetRefusals, ReportsAndChangesNothing) {
    ExpectRefused(kSet, "KernCtl::Adv::");
}

const BrixTest::Refusal kRefusals[] = {
    {"NoValue",
     {"-o", "/Cpu/SchedQuantumUs"},
     "must specify exactly one of: int-value, string-value, default"},
    {"DefaultAndInt",
     {"-o", "/Cpu/SchedQuantumUs", "-d", "-i", "1000"},
     "must specify exactly one of: int-value, string-value, default"},
    {"IntAndString",
     {"-o", "/Cpu/SchedQuantumUs", "-i", "1000", "-s", "x"},
     "must specify exactly one of: int-value, string-value, default"},
    {"AllThree",
     {"-o", "/Nope", "-i", "1", "-s", "x", "-d"},
     "must specify exactly one of: int-value, string-value, default"},
    {"UnknownOption",
     {"-o", "/Cpu/Nope", "-i", "1"},
     "Unable to find option /Cpu/Nope (Not found)"},
    {"StringForInteger",
     {"-o", "/Cpu/SchedQuantumUs", "-s", "1000"},
     "option is of type int, but input does not have int value"},
    {"IntegerForString",
     {"-o", "/Misc/HostName", "-i", "1"},
     "option is type of string, but input does not have string value"},
    {"NoIntegerView",
     {"-o", "/Misc/LegacyTimerCalibration", "-i", "1"},
     "unable to access option '/Misc/LegacyTimerCalibration' as integer option"},
    {"NoStringView",
     {"-o", "/Syslog/TemplateFormat", "-s", "x"},
     "unable to access option '/Syslog/TemplateFormat' as string option"},
    {"BelowRange",
     {"-o", "/Cpu/SchedQuantumUs", "-i", "999"},
     "Invalid value 999 for option /Cpu/SchedQuantumUs (the value must be between 1000 and "
     "200000)"},
    {"AboveRangeUser",
     {"-o", "/UserVars/TelemetryOptIn", "-i", "3"},
     "Invalid value 3 for option /UserVars/TelemetryOptIn (the value must be between 0 and 2)"},
    {"BadCharacter",
     {"-o", "/Misc/HostName", "-s", "my host"},
     "Invalid value 'my host' for option /Misc/HostName (character ' ' is not allowed)"},
    // The changes staged before a failing call never reach the host.
    {"ApplyChangeFailsAfterInt",
     {"-o", "/BufferCache/FlushIntervalMs", "-i", "100"},
     "commit refused",
     "KernCtl::Adv::AdvancedOptionImpl::ApplyChange"},
    {"ApplyChangeFailsAfterString",
     {"-o", "/Misc/HostName", "-s", "node7"},
     "commit refused",
     "KernCtl::Adv::AdvancedOptionImpl::ApplyChange"},
    {"ApplyChangeFailsAfterReset",
     {"-o", "/UserVars/SuppressShellWarning", "-d"},
     "commit refused",
     "KernCtl::Adv::AdvancedOptionImpl::ApplyChange"},
    {"ClearOverrideFailsAfterReset",
     {"-o", "/UserVars/SuppressShellWarning", "-d"},
     "commit refused",
     "KernCtl::Adv::AdvancedOptionImpl::ClearOverride"},
    {"ResetWithoutHandler",
     {"-o", "/Misc/LegacyTimerCalibration", "-d"},
     "Unable to reset option /Misc/LegacyTimerCalibration (the option's value handler is not "
     "available)"},
};

INSTANTIATE_TEST_SUITE_P(Messages, AdvancedSetRefusals, testing::ValuesIn(kRefusals),
                         BrixTest::RefusalName);

TEST_F(AdvancedOptions, SetValuesAndResetCommitInOrder) {
    auto run = Json(host, With(kSet, {"-o", "/Cpu/HaltIdleThresholdUs", "-i", "4294967294"}));
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, true);
    run = Json(host, With(kSet, {"-o", "/Misc/HostName", "-s", "node-7.lab"}));
    ASSERT_EQ(run.status, 0) << run.err;
    run = Json(host, With(kSet, {"-o", "/UserVars/WebUiWelcomeMessage", "-s", "Hi there"}));
    ASSERT_EQ(run.status, 0) << run.err;
    run = Json(host, With(kSet, {"-o", "/UserVars/SuppressShellWarning", "--default"}));
    ASSERT_EQ(run.status, 0) << run.err;

    EXPECT_EQ(Json(host, With(kList, {"-o", "/Cpu/HaltIdleThresholdUs"})).out[0]["Int Value"],
              4294967294LL);
    EXPECT_EQ(Json(host, With(kList, {"-o", "/Misc/HostName"})).out[0]["String Value"],
              "node-7.lab");
    EXPECT_EQ(Json(host, With(kList, {"-o", "/UserVars/SuppressShellWarning"})).out[0]["Int Value"],
              0);

    const auto calls = Calls(host, "KernCtl::Adv::");
    const std::vector<json> expected = {
        {"KernCtl::Adv::AdvancedIntegerOptionImpl::SetValue", "/Cpu/HaltIdleThresholdUs",
         4294967294LL},
        {"KernCtl::Adv::AdvancedOptionImpl::ApplyChange", "/Cpu/HaltIdleThresholdUs"},
        {"KernCtl::Adv::AdvancedStringOptionImpl::SetValue", "/Misc/HostName", "node-7.lab"},
        {"KernCtl::Adv::AdvancedOptionImpl::ApplyChange", "/Misc/HostName"},
        {"KernCtl::Adv::AdvancedUserStringOptionImpl::SetValue", "/UserVars/WebUiWelcomeMessage",
         "Hi there"},
        {"KernCtl::Adv::AdvancedOptionImpl::ApplyChange", "/UserVars/WebUiWelcomeMessage"},
        {"KernCtl::Adv::AdvancedOptionImpl::ResetToDefault", "/UserVars/SuppressShellWarning"},
        {"KernCtl::Adv::AdvancedOptionImpl::ClearOverride", "/UserVars/SuppressShellWarning"},
        {"KernCtl::Adv::AdvancedOptionImpl::ApplyChange", "/UserVars/SuppressShellWarning"},
    };
    EXPECT_EQ(calls, expected);
}

TEST_F(AdvancedOptions, IntegerRangeIsCheckedByTheFramework) {
    EXPECT_EQ(Json(host, With(kSet, {"-o", "/Cpu/HaltIdleThresholdUs", "-i", "4294967295"})).status,
              0);
    EXPECT_EQ(Json(host, With(kSet, {"-o", "/Cpu/HaltIdleThresholdUs", "-i", "4294967296"})).status,
              2);
    EXPECT_EQ(Json(host, With(kSet, {"-o", "/Cpu/HaltIdleThresholdUs", "-i", "-1"})).status, 2);
}

TEST_F(AdvancedOptions, AutoCreateDumpFileIsMirroredToTheHostSettings) {
    auto& store = BrixSim::Store::Get();
    EXPECT_EQ(store.GetValue("coredump.autoCreateDumpFile", "missing"), "1");
    ASSERT_EQ(Json(host, With(kSet, {"-o", "/Dump/autoCreateDumpFile", "-i", "0"})).status, 0);
    EXPECT_EQ(store.GetValue("coredump.autoCreateDumpFile", "missing"), "0");
    ASSERT_EQ(Json(host, With(kSet, {"-o", "/Dump/autoCreateDumpFile", "-d"})).status, 0);
    EXPECT_EQ(store.GetValue("coredump.autoCreateDumpFile", "missing"), "1");
}

TEST_F(AdvancedOptions, PlatformFaults) {
    // The root cannot be read: the listing fails with the platform's message.
    host.Fault("KernCtl::Adv::AdvancedOptionBranchImpl::GetOptions", "option tree locked");
    auto run = Json(host, kList);
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "option tree locked\n");
    EXPECT_TRUE(run.out.is_null());

    // Options that fail to read are left out without a message.
    host.Sim({"fault", "clear"});
    host.Fault("KernCtl::Adv::AdvancedStringOptionImpl::GetValue", "string values unavailable");
    run = Json(host, With(kList, {"-t", "Net/Tcp"}));
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out.size(), 11U);
    for (const auto& row : run.out) EXPECT_EQ(row["Type"], "integer");

    host.Sim({"fault", "clear"});
    host.Fault("HostCtl::Misc::StringTokenize", "tokenizer unavailable");
    run = Json(host, With(kList, {"-t", "Misc"}));
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "tokenizer unavailable\n");
    EXPECT_TRUE(run.out.is_null());

    host.Sim({"fault", "clear"});
    host.Fault("KernCtl::Adv::AdvancedOptionImpl::ApplyChange", "commit refused");
    run = Json(host, With(kSet, {"-o", "/Cpu/SchedQuantumUs", "-i", "2000"}));
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "commit refused\n");
}

TEST_F(AdvancedOptions, OperationsCanBeMadeToFail) {
    const auto ops = host.Sim({"fault", "ops"}).out;
    for (const char* op :
         {"HostCtl::Misc::StringTokenize", "KernCtl::Adv::AdvancedOptionImpl::FindOption",
          "KernCtl::Adv::AdvancedUserStringOptionImpl::SetValue",
          "KernCtl::Adv::AdvancedOptionBranchImpl::GetBranch",
          "KernCtl::System::KernelOpts::SetOption",
          "KernCtl::System::SystemInfoImpl::LoadKeyboardMappings",
          "KernCtl::System::ModuleImpl::CopyParameters",
          "KernCtl::System::SystemInfoImpl::SetDefaultLogLevel",
          "HostCtl::System::SystemInfo::GetModule"}) {
        EXPECT_NE(ops.find(std::string(op) + "\n"), std::string::npos) << op;
    }
}

}  // namespace

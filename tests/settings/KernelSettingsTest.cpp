// system settings kernel list / set against the simulated host.
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <csignal>
#include <set>
#include <string>
#include <vector>

#include "os/HostOs.h"
#include "support/CliJson.h"

namespace {

using BrixTest::Calls;
using BrixTest::Column;
using BrixTest::Json;
using BrixTest::With;
using nlohmann::json;

const std::vector<std::string> kList = {"system", "settings", "kernel", "list"};
const std::vector<std::string> kSet = {"system", "settings", "kernel", "set"};

class KernelSettings : public testing::Test {
  protected:
    BrixTest::TempHost host;
};

TEST_F(KernelSettings, ListsEverySettingOrderedWithoutRegardToCase) {
    const auto run = Json(host, kList);
    ASSERT_EQ(run.status, 0) << run.err;
    const auto names = Column(run.out, "Name");
    EXPECT_GE(names.size(), 30U);
    EXPECT_TRUE(std::is_sorted(names.begin(), names.end(), [](std::string a, std::string b) {
        for (auto* s : {&a, &b}) {
            for (auto& c : *s) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
        }
        return a < b;
    }));
    std::set<std::string> types;
    for (const auto& row : run.out) types.insert(row["Type"].get<std::string>());
    EXPECT_EQ(types,
              (std::set<std::string>{"bool", "int32", "string", "uint32", "uint64", "uint8"}));
}

TEST_F(KernelSettings, DeltaUsesTheTypeAwareComparison) {
    const auto run = Json(host, With(kList, {"-d"}));
    ASSERT_EQ(run.status, 0) << run.err;
    // Not listed although their texts differ: debugHeapPoison (FALSE/false/no),
    // irqRebalanceShift (uint8 1 against 257) and serialBaudRate (115200 against 0x1c200).
    EXPECT_EQ(Column(run.out, "Name"),
              (std::vector<std::string>{"clockDriftPpm", "crashKernelBytes", "deviceNamePolicy",
                                        "intrBalancingPeriodMs", "iommuDisableIr", "kernelLogPort",
                                        "memTierCount"}));
}

TEST_F(KernelSettings, OptionMatchesWithoutRegardToCase) {
    auto run = Json(host, With(kList, {"-o", "IRQREBALANCESHIFT"}));
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, json::parse(R"js([{"Name": "IRQREBALANCESHIFT", "Type": "uint8",
        "Description": "Shift applied to interrupt load before rebalancing",
        "Configured": "257", "Runtime": "1", "Default": "1"}])js"));

    // With delta too, the one setting shows only when it differs.
    run = Json(host, With(kList, {"-o", "irqrebalanceshift", "-d"}));
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.out, json::array());
    run = Json(host, With(kList, {"-o", "MEMTIERCOUNT", "-d"}));
    EXPECT_EQ(Column(run.out, "Configured"), std::vector<std::string>{"2"});

    run = Json(host, With(kList, {"-o", "noSuchSetting"}));
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "Unknown kernel setting 'noSuchSetting'\n");
    EXPECT_TRUE(run.out.is_null());
}

TEST_F(KernelSettings, SetChangesTheConfiguredValueOnly) {
    auto run = Json(host, With(kSet, {"-s", "MAXPCPUS", "-v", "0x80"}));
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, true);
    run = Json(host, With(kSet, {"--setting", "enableLargeBar", "--value", "false"}));
    ASSERT_EQ(run.status, 0) << run.err;

    const auto maxPcpus = Json(host, With(kList, {"-o", "maxPcpus"})).out[0];
    EXPECT_EQ(maxPcpus["Configured"], "0x80");
    EXPECT_EQ(maxPcpus["Runtime"], "576");
    const auto largeBar = Json(host, With(kList, {"-o", "enableLargeBar"})).out[0];
    EXPECT_EQ(largeBar["Configured"], "FALSE");
    EXPECT_EQ(largeBar["Runtime"], "TRUE");

    EXPECT_EQ(
        Calls(host, "KernCtl::System::KernelOpts::"),
        (std::vector<json>{{"KernCtl::System::KernelOpts::SetOption", "maxPcpus", "0x80"},
                           {"KernCtl::System::KernelOpts::SetOption", "enableLargeBar", "FALSE"}}));
}

class KernelSettingRefusals : public BrixTest::RefusalTest {};

TEST_P(KernelSettingRefusals, ReportAndKeepTheValue) {
    ExpectRefused(kSet, "KernCtl::System::KernelOpts::");
}

const BrixTest::Refusal kRefusals[] = {
    {"UnknownSetting", {"-s", "warpDrive", "-v", "1"}, "Unknown kernel setting 'warpDrive'"},
    {"BoolWord",
     {"-s", "skipPciReset", "-v", "yes"},
     "Invalid value 'yes' for kernel setting 'skipPciReset': expected TRUE or FALSE"},
    {"Uint8TooLarge",
     {"-s", "tscCalibrationRounds", "-v", "256"},
     "Invalid value '256' for kernel setting 'tscCalibrationRounds': expected a number from 0 "
     "to 255"},
    {"Uint32NotANumber",
     {"-s", "maxPcpus", "-v", "12x"},
     "Invalid value '12x' for kernel setting 'maxPcpus': expected a number from 0 to 4294967295"},
    {"Uint32Negative",
     {"-s", "maxPcpus", "-v", "-1"},
     "Invalid value '-1' for kernel setting 'maxPcpus': expected a number from 0 to 4294967295"},
    {"Int32TooSmall",
     {"-s", "timerSkewNs", "-v", "-2147483649"},
     "Invalid value '-2147483649' for kernel setting 'timerSkewNs': expected a number from "
     "-2147483648 to 2147483647"},
    {"Uint64TooLarge",
     {"-s", "maxIoSizeBytes", "-v", "18446744073709551616"},
     "Invalid value '18446744073709551616' for kernel setting 'maxIoSizeBytes': expected a "
     "number from 0 to 18446744073709551615"},
};

INSTANTIATE_TEST_SUITE_P(Values, KernelSettingRefusals, testing::ValuesIn(kRefusals),
                         BrixTest::RefusalName);

TEST_F(KernelSettings, BoundaryValuesAreAccepted) {
    for (const auto& [setting, value] : std::vector<std::pair<std::string, std::string>>{
             {"timerSkewNs", "-2147483648"},
             {"timerSkewNs", "2147483647"},
             {"tscCalibrationRounds", "255"},
             {"maxPcpus", "4294967295"},
             {"maxIoSizeBytes", "18446744073709551615"},
             {"netConsoleTarget", "10.0.0.9:6666"}}) {
        const auto run = Json(host, With(kSet, {"-s", setting, "-v", value}));
        EXPECT_EQ(run.status, 0) << setting << "=" << value << ": " << run.err;
        EXPECT_EQ(Json(host, With(kList, {"-o", setting})).out[0]["Configured"], value);
    }
}

TEST_F(KernelSettings, RestartRunsTheConfiguredValues) {
    ASSERT_EQ(Json(host, With(kSet, {"-s", "maxPcpus", "-v", "128"})).status, 0);
    ASSERT_EQ(HostOs::kill(1, SIGTERM), 0);  // the host's init restarts it
    for (const auto& [setting, runtime] :
         std::vector<std::pair<std::string, std::string>>{{"maxPcpus", "128"},
                                                          {"crashKernelBytes", "536870912"},
                                                          {"deviceNamePolicy", "naa"},
                                                          {"debugHeapPoison", "false"}}) {
        const auto row = Json(host, With(kList, {"-o", setting})).out[0];
        EXPECT_EQ(row["Runtime"], runtime) << setting;
        EXPECT_EQ(row["Configured"], runtime) << setting;
    }
    // A change made in this boot again waits for the next one.
    ASSERT_EQ(Json(host, With(kSet, {"-s", "maxPcpus", "-v", "64"})).status, 0);
    EXPECT_EQ(Json(host, With(kList, {"-o", "maxPcpus"})).out[0]["Runtime"], "128");
}

TEST_F(KernelSettings, PlatformFaults) {
    host.Fault("KernCtl::System::KernelOpts::GetRuntimeValue", "settings store busy");
    const auto run = Json(host, kList);
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "settings store busy\n");
    EXPECT_TRUE(run.out.is_null());
}

}  // namespace

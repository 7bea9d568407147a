// System information queries, end to end through brixcli against a fresh simulated host.
#include <gtest/gtest.h>

#include <algorithm>

#include "support/TestHost.h"

namespace {

using nlohmann::json;

struct JsonCase {
    std::vector<std::string> path;
    json expected;
};

TEST(SystemInfo, JsonOutputOfEveryQuery) {
    BrixTest::TempHost host;
    const JsonCase cases[] = {
        {{"system", "uuid", "get"}, "6a3f0c1e-52d8-4b7e-9f21-0c4d7e8a9b13"},
        {{"system", "version", "get"},
         json::parse(R"({"Product":"Brix Host","Version":"8.2.0","Build":"Releasebuild-24160381",
                         "Update":"2","Patch":"41"})")},
        {{"system", "stats", "installtime", "get"}, "2025-03-14T09:26:53.589793+00:00"},
        {{"system", "boot", "device", "get"},
         json::parse(
             R"({"Boot NIC":"","Boot Filesystem UUID":"c41f9e02-7d3a-4e6b-a8c5-2f90b17d64e8",
                         "Stateless Boot NIC":""})")},
        {{"system", "welcomemsg", "get"}, "Welcome to Brix Host"},
    };
    for (const auto& c : cases) {
        auto args = c.path;
        args.insert(args.begin(), "--formatter=json");
        auto run = host.Cli(args);
        ASSERT_EQ(run.status, 0) << run.err;
        EXPECT_EQ(json::parse(run.out).dump(), c.expected.dump()) << run.out;
        EXPECT_EQ(run.err, "");
    }
}

TEST(SystemInfo, VersionSimpleViewHasNoHeadingAndFieldOrder) {
    BrixTest::TempHost host;
    auto run = host.Cli({"system", "version", "get"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out.find("VersionGet"), std::string::npos);
    const auto product = run.out.find("Product: Brix Host");
    const auto version = run.out.find("Version: 8.2.0");
    const auto patch = run.out.find("Patch: 41");
    ASSERT_NE(product, std::string::npos) << run.out;
    EXPECT_LT(product, version);
    EXPECT_LT(version, patch);
}

TEST(SystemInfo, VersionFieldsAreCutAtTheirWidth) {
    BrixTest::TempHost host;
    // A product name longer than its 32-byte field keeps 31 characters and its NUL.
    auto state = host.Export();
    for (auto& row : state["tables"]["host"]) {
        if (row["key"] == "system.product") row["value"] = std::string(40, 'p');
    }
    host.Import(state);
    auto run = host.Cli({"--formatter=json", "system", "version", "get"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(json::parse(run.out)["Product"], std::string(31, 'p'));
}

struct FaultCase {
    const char* operation;
    std::vector<std::string> path;
    const char* message;
};

TEST(SystemInfo, FaultsBecomeMessagesWithPrefixes) {
    const FaultCase cases[] = {
        {"KernCtl::System::SystemInfoImpl::GetSystemUuid", {"system", "uuid", "get"}, "boom"},
        {"KernCtl::Util::Sysinfo::Get",
         {"system", "version", "get"},
         "Unable to query product version: boom"},
        {"HostCtl::System::SystemInfo::GetInceptionTime",
         {"system", "stats", "installtime", "get"},
         "system inception timestamp missing: boom"},
        {"KernCtl::System::SystemInfoImpl::GetBootFsUUID",
         {"system", "boot", "device", "get"},
         "boom"},
        {"KernCtl::System::SystemInfoImpl::GetWelcomeMessage",
         {"system", "welcomemsg", "get"},
         "boom"},
        {"KernCtl::System::SystemInfoImpl::SetWelcomeMessage",
         {"system", "welcomemsg", "set", "-m", "x"},
         "boom"},
    };
    for (const auto& c : cases) {
        BrixTest::TempHost host;
        host.Fault(c.operation, "boom");
        auto run = host.Cli(c.path);
        EXPECT_EQ(run.status, 1) << c.operation;
        EXPECT_EQ(run.out, "") << c.operation;
        EXPECT_EQ(run.err, std::string(c.message) + "\n") << c.operation;
    }
}

TEST(SystemInfo, WelcomeMessageSurvivesAndIsJournaled) {
    BrixTest::TempHost host;
    for (const std::string message : {"hello", "", "  spaced  "}) {
        auto set = host.Cli({"--formatter=json", "system", "welcomemsg", "set", "-m", message});
        ASSERT_EQ(set.status, 0) << set.err;
        EXPECT_EQ(set.out, "true\n");
        auto get = host.Cli({"--formatter=json", "system", "welcomemsg", "get"});
        EXPECT_EQ(json::parse(get.out), message);
    }
    int calls = 0;
    for (const auto& record : host.Journal()) {
        if (record["kind"] == "call" &&
            record["op"] == "KernCtl::System::SystemInfoImpl::SetWelcomeMessage") {
            ++calls;
        }
    }
    EXPECT_EQ(calls, 3);
}

TEST(SystemInfo, WelcomeMessageSetNeedsMessage) {
    BrixTest::TempHost host;
    auto missing = host.Cli({"system", "welcomemsg", "set"});
    EXPECT_EQ(missing.status, 2);
    EXPECT_NE(missing.err.find("message"), std::string::npos);
    auto unknown = host.Cli({"system", "welcomemsg", "set", "-m", "x", "--nope"});
    EXPECT_EQ(unknown.status, 2);
    EXPECT_NE(unknown.err.find("nope"), std::string::npos);
    // Refused invocations change nothing.
    EXPECT_EQ(host.Cli({"system", "welcomemsg", "get"}).out, "Welcome to Brix Host\n");
}

}  // namespace

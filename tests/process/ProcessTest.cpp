// The process commands against a simulated host: world listing, load and running statistics.
#include <gtest/gtest.h>

#include <cstring>
#include <regex>
#include <string>
#include <vector>

#include "kernctl/KernAccess.h"
#include "kernctl/Resource.h"
#include "kernctl/Sysinfo.h"
#include "process/ProcessList.h"
#include "process/ProcessStatsLoadGet.h"
#include "process/ProcessStatsRunningGet.h"
#include "support/TestHost.h"

namespace {

using BrixTest::TempHost;
using nlohmann::json;
// Results are parsed keeping their key order.
using ojson = nlohmann::ordered_json;

const std::vector<std::string> kWorldFields = {"Id",
                                               "Name",
                                               "Command Line",
                                               "Cartel Id",
                                               "Parent Cartel Id",
                                               "World Group Id",
                                               "Cartel Group Id",
                                               "Session Id",
                                               "World Flags",
                                               "World State",
                                               "World Type",
                                               "Security Domain"};

std::vector<std::string> Keys(const ojson& object) {
    std::vector<std::string> keys;
    for (const auto& item : object.items()) keys.push_back(item.key());
    return keys;
}

json World(int64_t id, const std::string& name, int64_t domain, int64_t state = 2,
           int64_t type = 2) {
    return {{"id", id},
            {"name", name},
            {"command_line", "/usr/lib/brix/bin/" + name + " --fg"},
            {"cartel_id", id - 1},
            {"parent_cartel_id", 1000},
            {"world_group_id", id},
            {"cartel_group_id", id - 1},
            {"session_id", 1000},
            {"flags", 0x409},
            {"state", state},
            {"type", type},
            {"domain", domain}};
}

json Stats(int64_t running, int64_t count, int64_t l1, int64_t l5, int64_t l15) {
    return {{"server_stats",
             {{{"id", 1},
               {"boot_time_us", 1'700'000'000'000'000},
               {"running", running},
               {"load_count", count},
               {"load1", l1},
               {"load5", l5},
               {"load15", l15}}}}};
}

TEST(ProcessList, JsonHasEveryFieldOfEveryWorldInOrder) {
    TempHost host;
    const auto run = host.Cli({"--formatter=json", "system", "process", "list"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.err, "");
    const auto worlds = ojson::parse(run.out);
    ASSERT_TRUE(worlds.is_array());
    ASSERT_GE(worlds.size(), 20u);
    int64_t previous = 0;
    for (const auto& world : worlds) {
        EXPECT_EQ(Keys(world), kWorldFields);
        EXPECT_GT(world["Id"].get<int64_t>(), previous);  // the kernel's order
        previous = world["Id"].get<int64_t>();
        EXPECT_FALSE(world["Name"].get<std::string>().empty());
        EXPECT_FALSE(world["Security Domain"].get<std::string>().empty());
    }
    // A cartel with several worlds, a guest's virtual CPU, and the root of the tree.
    auto find = [&](const std::string& name) {
        for (const auto& world : worlds)
            if (world["Name"] == name) return world;
        ADD_FAILURE() << name << " not listed";
        return ojson();
    };
    const auto init = find("init");
    EXPECT_EQ(init["Parent Cartel Id"], 0);
    EXPECT_EQ(init["Security Domain"], "hostDaemons");
    EXPECT_EQ(init["World Type"], "User");
    const auto agent = find("hostagentd"), agentIo = find("hostagentd-io");
    EXPECT_EQ(agent["Cartel Id"], agentIo["Cartel Id"]);
    EXPECT_EQ(agentIo["World Group Id"], agent["Id"]);
    EXPECT_EQ(agentIo["Parent Cartel Id"], init["Cartel Id"]);
    EXPECT_EQ(agent["Security Domain"], "mgmtAgents");
    const auto vcpu = find("brixvm-web01-vcpu-0");
    EXPECT_EQ(vcpu["World Type"], "Vcpu");
    EXPECT_EQ(vcpu["World State"], "Running");
    EXPECT_EQ(vcpu["Security Domain"], "guestRuntime");
}

TEST(ProcessList, TableShowsTheFiveDefaultColumns) {
    TempHost host;
    const auto run = host.Cli({"system", "process", "list"});
    ASSERT_EQ(run.status, 0) << run.err;
    const std::string header = run.out.substr(0, run.out.find('\n'));
    size_t at = 0;
    for (const char* column : {"Id", "Cartel Id", "Name", "Security Domain", "Command Line"}) {
        const size_t found = header.find(column, at);
        ASSERT_NE(found, std::string::npos) << column << " in " << header;
        at = found;
    }
    for (const char* hidden : {"Session Id", "World State", "World Flags", "Parent Cartel Id"}) {
        EXPECT_EQ(header.find(hidden), std::string::npos) << hidden;
    }
    EXPECT_NE(run.out.find("/usr/lib/brix/hostagent/bin/hostagentd"), std::string::npos);
}

TEST(ProcessList, ShowsImportedWorldsWithTheirLabelsAndCodes) {
    TempHost host;
    // Domain 9 has no domain in its slot; state and type codes the library does not know.
    host.Import({{"process_worlds",
                  {World(5000, "alpha", 2), World(5002, "orphan", 9, 7, 42),
                   World(4294967295, "last", 0, 1, 3)}}});
    const auto run = host.Cli({"--formatter=json", "system", "process", "list"});
    ASSERT_EQ(run.status, 0) << run.err;
    const auto worlds = ojson::parse(run.out);
    ASSERT_EQ(worlds.size(), 3u);
    EXPECT_EQ(
        worlds[0],
        ojson::parse(R"({"Id":5000,"Name":"alpha","Command Line":"/usr/lib/brix/bin/alpha --fg",
                "Cartel Id":4999,"Parent Cartel Id":1000,"World Group Id":5000,
                "Cartel Group Id":4999,"Session Id":1000,"World Flags":1033,
                "World State":"Waiting","World Type":"User","Security Domain":"mgmtAgents"})"));
    EXPECT_EQ(worlds[1]["Security Domain"], "9");
    EXPECT_EQ(worlds[1]["World State"], "Unknown (7)");
    EXPECT_EQ(worlds[1]["World Type"], "Unknown (42)");
    // Unsigned 32-bit identifiers reach the result whole.
    EXPECT_EQ(worlds[2]["Id"], 4294967295LL);
    EXPECT_EQ(worlds[2]["Security Domain"], "kernelCore");
    EXPECT_EQ(worlds[2]["World State"], "Running");
    EXPECT_EQ(worlds[2]["World Type"], "Vcpu");
}

TEST(ProcessList, EmptyWhenThereAreNoWorlds) {
    TempHost host;
    host.Import({{"process_worlds", json::array()}});
    const auto run = host.Cli({"--formatter=json", "system", "process", "list"});
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(ojson::parse(run.out), ojson::array());
}

TEST(ProcessList, PlatformFailureEndsTheListingWithItsMessageOnly) {
    const char* operations[] = {"KernCtl::Util::Sysinfo::Get", "KernCtl::Util::Sysinfo::List",
                                "KernCtl::Resource::ResourceInfoImpl::GetAllWorlds",
                                "KernCtl::Security::KernAccessInterfaceImpl::GetLabel"};
    for (const char* operation : operations) {
        SCOPED_TRACE(operation);
        TempHost host;
        host.Fault(operation, "Sysinfo busy: try again");
        for (const char* formatter : {"--formatter=json", "--formatter=table"}) {
            const auto run = host.Cli({formatter, "system", "process", "list"});
            EXPECT_EQ(run.status, 1);
            EXPECT_EQ(run.err, "Sysinfo busy: try again\n");
            EXPECT_EQ(run.out, "");
        }
    }
}

TEST(ProcessList, WorldRecordCarriesEveryFieldAtItsOffset) {
    TempHost host;
    host.Import({{"process_worlds", {World(0x01020304, "recordcheck", 0x0A0B0C0D, 3, 4)}}});
    KernCtl::Util::Sysinfo list(KSI_NODE_system_worlds);
    std::vector<std::string> names;
    list.List(names);
    ASSERT_EQ(names, std::vector<std::string>{"16909060"});

    KernCtl::Util::Sysinfo info(KSI_NODE_system_worlds_info);
    info.AddInstancePath(names[0]);
    unsigned char record[610];
    std::memset(record, 0xEE, sizeof record);
    info.Get(record, sizeof record);
    auto u32 = [&](size_t at) {
        return record[at] | record[at + 1] << 8 | record[at + 2] << 16 |
               static_cast<uint32_t>(record[at + 3]) << 24;
    };
    EXPECT_EQ(u32(0), 0x01020304u);
    EXPECT_EQ(u32(4), 0x01020303u);
    EXPECT_EQ(u32(8), 1000u);
    EXPECT_EQ(u32(24), 0x409u);
    EXPECT_EQ(record[28], 3);
    EXPECT_EQ(record[29], 4);
    EXPECT_EQ(u32(30), 0x0A0B0C0Du);  // unaligned
    EXPECT_STREQ(reinterpret_cast<char*>(record + 34), "recordcheck");
    EXPECT_STREQ(reinterpret_cast<char*>(record + 98), "/usr/lib/brix/bin/recordcheck --fg");
    EXPECT_EQ(record[609], 0);

    // Read back through the resource library.
    int seen = 0;
    KernCtl::Resource::ResourceInfoImpl().GetAllWorlds()->Each(
        [&](const HostCtl::Resource::World& world) {
            ++seen;
            EXPECT_EQ(world.GetSecurityDomain(), 0x0A0B0C0Du);
            EXPECT_EQ(world.GetStateName(), "Sleeping");
            EXPECT_EQ(world.GetTypeName(), "Helper");
        });
    EXPECT_EQ(seen, 1);

    info.ResetInstance();
    info.AddInstancePath("99");
    EXPECT_THROW(info.Get(record, sizeof record), HostCtl::Lib::HostCtlException);
    info.ResetInstance();
    info.AddInstancePath(names[0]);
    EXPECT_THROW(info.Get(record, 100), HostCtl::Lib::HostCtlException);
}

TEST(ProcessList, LabelIsTheDomainNameOrItsNumber) {
    TempHost host;
    KernCtl::Security::KernAccessInterfaceImpl access;
    EXPECT_EQ(access.GetLabel(0, 0), "kernelCore");
    EXPECT_EQ(access.GetLabel(11, 0), "pluginSandbox");
    EXPECT_EQ(access.GetLabel(4, 0), "4");
    EXPECT_EQ(access.GetLabel(4294967295u, 0), "4294967295");
    EXPECT_THROW(access.GetLabel(0, 1), HostCtl::Lib::HostCtlException);
}

TEST(ProcessStatsLoadGet, DividesEachFigureByNTimesAHundred) {
    struct Case {
        int64_t count, l1, l5, l15;
        const char *t1, *t5, *t15;
    };
    const Case cases[] = {
        {1, 150, 75, 0, "1.50", "0.75", "0.00"},
        {2, 150, 75, 4, "0.75", "0.38", "0.02"},
        {1, 4294967295, 1200, 5, "42949672.00", "12.00", "0.05"},
        {-1, 150, 0, 250, "-1.50", "-0.00", "-2.50"},
    };
    TempHost host;
    for (const auto& c : cases) {
        SCOPED_TRACE(c.count);
        host.Import(Stats(3, c.count, c.l1, c.l5, c.l15));
        const auto run =
            host.Cli({"--formatter=json", "system", "process", "stats", "load", "get"});
        ASSERT_EQ(run.status, 0) << run.err;
        const auto result = ojson::parse(run.out);
        EXPECT_EQ(Keys(result),
                  (std::vector<std::string>{"Load 1 Minute", "Load 5 Minutes", "Load 15 Minutes"}));
        EXPECT_EQ(result["Load 1 Minute"], c.t1);
        EXPECT_EQ(result["Load 5 Minutes"], c.t5);
        EXPECT_EQ(result["Load 15 Minutes"], c.t15);
    }
}

TEST(ProcessStatsLoadGet, SeededHostShowsPlausibleTwoDecimalLoads) {
    TempHost host;
    const auto run = host.Cli({"--formatter=json", "system", "process", "stats", "load", "get"});
    ASSERT_EQ(run.status, 0) << run.err;
    const std::regex twoDecimals("[0-9]+\\.[0-9]{2}");
    const auto loads = ojson::parse(run.out);
    for (const auto& [field, text] : loads.items()) {
        EXPECT_TRUE(std::regex_match(text.get<std::string>(), twoDecimals)) << field << text;
        EXPECT_LT(std::stod(text.get<std::string>()), 64.0) << field;
    }
}

TEST(ProcessStatsLoadGet, ZeroCountGivesInfinityOrNotANumberNotACrash) {
    TempHost host;
    host.Import(Stats(3, 0, 150, 75, 0));
    const auto run = host.Cli({"--formatter=json", "system", "process", "stats", "load", "get"});
    ASSERT_EQ(run.status, 0) << run.err;
    const auto result = ojson::parse(run.out);
    EXPECT_EQ(result["Load 1 Minute"], "inf");
    EXPECT_EQ(result["Load 5 Minutes"], "inf");
    const std::regex nan("-?nan");
    EXPECT_TRUE(std::regex_match(result["Load 15 Minutes"].get<std::string>(), nan))
        << result["Load 15 Minutes"];
}

TEST(ProcessStatsRunningGet, ReportsTheRunningCount) {
    TempHost host;
    auto run = host.Cli({"--formatter=json", "system", "process", "stats", "running", "get"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(ojson::parse(run.out), ojson({{"Running Processes", 3}}));
    host.Import(Stats(2147483647, 1, 0, 0, 0));
    run = host.Cli({"--formatter=json", "system", "process", "stats", "running", "get"});
    EXPECT_EQ(ojson::parse(run.out), ojson({{"Running Processes", 2147483647}}));
}

TEST(ProcessStats, FetchFailureIsReportedWithoutAResult) {
    TempHost host;
    host.Fault("HostCtl::AdvStats::ServerStats::FetchAllStats", "Statistics are not available");
    for (const char* which : {"load", "running"}) {
        SCOPED_TRACE(which);
        const auto run = host.Cli({"--formatter=json", "system", "process", "stats", which, "get"});
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, "Statistics are not available\n");
        EXPECT_EQ(run.out, "");
    }
}

}  // namespace

// The Quillfs commands against a simulated host: status, RAM disks, tardisks, mounting.
#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "kernctl/Sysinfo.h"
#include "memfs/QuillfsGet.h"
#include "memfs/QuillfsRamdiskAdd.h"
#include "memfs/QuillfsRamdiskList.h"
#include "memfs/QuillfsRamdiskRemove.h"
#include "memfs/QuillfsTardiskList.h"
#include "support/TestHost.h"

namespace {

using BrixTest::TempHost;
using nlohmann::json;
// Results are parsed keeping their key order.
using ojson = nlohmann::ordered_json;
using namespace OstrelCli::System;

std::vector<std::string> Keys(const ojson& object) {
    std::vector<std::string> keys;
    for (const auto& item : object.items()) keys.push_back(item.key());
    return keys;
}

json Ramdisk(const std::string& name, const std::string& mountPoint, int64_t reservedMib,
             int64_t maxMib, int64_t usedPages, bool system = false) {
    static int64_t id = 0;
    return {{"id", ++id},
            {"name", name},
            {"mount_point", mountPoint},
            {"reserved_mib", reservedMib},
            {"max_mib", maxMib},
            {"used_pages", usedPages},
            {"peak_pages", usedPages + 10},
            {"coredump", 1},
            {"system", system ? 1 : 0},
            {"permissions", 0755},
            {"reserved_inodes", 16},
            {"max_inodes", 2048},
            {"allocated_inodes", 256},
            {"used_inodes", 40}};
}

json Inodes(int64_t total, int64_t baseUsed, int64_t peakUsed) {
    return {{{"id", 1},
             {"total", total},
             {"base_used", baseUsed},
             {"unlinked", 2},
             {"peak_used", peakUsed},
             {"peak_unlinked", 9},
             {"peak_reserved", 0}}};
}

ojson List(const TempHost& host, const char* what) {
    const auto run = host.Cli({"--formatter=json", "system", "quillfs", what, "list"});
    EXPECT_EQ(run.status, 0) << run.err;
    return ojson::parse(run.out);
}

ojson FindDisk(const ojson& disks, const std::string& name) {
    for (const auto& disk : disks)
        if (disk["Ramdisk Name"] == name) return disk;
    return ojson();
}

std::vector<json> Records(const TempHost& host, const std::string& kind) {
    std::vector<json> found;
    for (const auto& record : host.Journal())
        if (record["kind"] == kind) found.push_back(record);
    return found;
}

// The output hints are not part of the generated reference: what they do shows in the default
// output, the columns with their units and the status without a heading.
TEST(QuillfsCommands, DefaultOutputFollowsTheirHints) {
    TempHost host;
    const auto firstLine = [&](std::vector<std::string> args) {
        const auto run = host.Cli(args);
        EXPECT_EQ(run.status, 0) << run.err;
        return run.out.substr(0, run.out.find('\n'));
    };
    const auto words = [](const std::string& line) {
        std::vector<std::string> columns;
        std::istringstream in(line);
        for (std::string word; in >> word;) columns.push_back(word);
        return columns;
    };
    EXPECT_EQ(words(firstLine({"system", "quillfs", "ramdisk", "list"})),
              words("Ramdisk Name  System  Include in Coredumps  Reserved (KiB)  Maximum (KiB)  "
                    "Used (KiB)  Peak Used (KiB)  Free (%)  Reserved Free (%)  Maximum Inodes  "
                    "Allocated Inodes  Used Inodes  Mount Point"));
    EXPECT_EQ(words(firstLine({"system", "quillfs", "tardisk", "list"})),
              words("Tardisk Name  System  Size (B)"));
    const auto status = host.Cli({"system", "quillfs", "get"});
    std::vector<std::string> labels;
    std::istringstream lines(status.out);
    for (std::string line; std::getline(lines, line);)
        labels.push_back(line.substr(0, line.find(':')));
    EXPECT_EQ(labels, (std::vector<std::string>{
                          "Total Inodes", "Used Inodes", "Unlinked Inodes", "Reserved Inodes",
                          "Peak Used Inodes", "Peak Unlinked Inodes", "Peak Reserved Inodes",
                          "Free Inode Percent", "Lowest Free Inode Percent"}));
}

// Registered, the command runs switched off (its options are in the reference); switched on,
// it offers the inode options between the sizes and the mode.
TEST(QuillfsRamdiskAdd, SwitchOffersTheInodeOptions) {
    const auto parameters = QuillfsRamdiskAdd::New(true)->GetInputSpec()->GetParameters();
    const std::vector<std::pair<std::string, std::string>> expected = {
        {"min-size", "m"},   {"max-size", "M"}, {"reserved-inodes", "i"},
        {"max-inodes", "I"}, {"coredump", "d"}, {"permissions", "p"},
        {"name", "n"},       {"target", "t"},
    };
    ASSERT_EQ(parameters.size(), expected.size());
    for (size_t i = 0; i < expected.size(); ++i) {
        EXPECT_EQ(parameters[i]->GetName(), expected[i].first);
        EXPECT_EQ(parameters[i]->GetShortName(), expected[i].second);
    }
    EXPECT_EQ(parameters[3]->GetType(), 1);
    EXPECT_EQ(parameters[4]->GetType(), 3);
    const auto& constraint = parameters[2]->GetConstraint();
    ASSERT_TRUE(constraint);
    EXPECT_EQ(constraint->GetMin(), 1);
    EXPECT_EQ(constraint->GetMax(), 2147483647);
    EXPECT_FALSE(parameters[3]->GetConstraint());
}

TEST(QuillfsRamdiskAdd, AddListRemoveRoundTrip) {
    TempHost host;
    std::filesystem::create_directories(host.Root() / "r1");
    auto run = host.Cli({"--formatter=json", "system", "quillfs", "ramdisk", "add", "-m", "32",
                         "-M", "64", "-p", "0755", "-n", "r1", "-t", "/r1"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(ojson::parse(run.out), true);
    const auto mounts = Records(host, "mount");
    ASSERT_EQ(mounts.size(), 1u);
    EXPECT_EQ(mounts[0]["source"], "");
    EXPECT_EQ(mounts[0]["target"], "/r1");
    EXPECT_EQ(mounts[0]["fstype"], "quillfs");
    EXPECT_EQ(mounts[0]["flags"], 0);
    EXPECT_EQ(mounts[0]["data"], "32,64,0,0,0,0755,r1");

    const auto disks = List(host, "ramdisk");
    const auto r1 = FindDisk(disks, "r1");
    EXPECT_EQ(r1, ojson::parse(R"({"Ramdisk Name":"r1","System":false,"Include in Coredumps":false,
        "Reserved":32768,"Maximum":65536,"Used":0,"Peak Used":0,"Free":100,"Reserved Free":100,
        "Maximum Inodes":8192,"Allocated Inodes":128,"Used Inodes":1,"Mount Point":"/r1"})"));
    EXPECT_EQ(disks.back(), r1);  // newest last

    run = host.Cli({"--formatter=json", "system", "quillfs", "ramdisk", "remove", "-t", "/r1"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(ojson::parse(run.out), true);
    const auto umounts = Records(host, "umount");
    ASSERT_EQ(umounts.size(), 1u);
    EXPECT_EQ(umounts[0]["target"], "/r1");
    EXPECT_TRUE(FindDisk(List(host, "ramdisk"), "r1").is_null());
    EXPECT_TRUE(std::filesystem::is_directory(host.Root() / "r1"));
}

TEST(QuillfsRamdiskAdd, MountFailuresPrintTheSystemTextAlone) {
    TempHost host;
    std::filesystem::create_directories(host.Root() / "r1");
    std::filesystem::create_directories(host.Root() / "r2");
    std::ofstream(host.Root() / "afile") << "x";
    std::filesystem::create_directories(host.Root() / std::string(140, 'x'));
    struct Case {
        std::vector<std::string> args;  // after `ramdisk add`
        int error;
    };
    auto add = [](std::string min, std::string max, std::string mode, std::string name,
                  std::string target) {
        return std::vector<std::string>{"--min-size=" + min, "--max-size=" + max,
                                        "--permissions=" + mode, "--name=" + name,
                                        "--target=" + target};
    };
    const Case cases[] = {
        {add("32", "64", "0755", "r9", "/missing"), ENOENT},
        {add("32", "64", "0755", "r9", "/missing/deeper"), ENOENT},
        {add("32", "64", "0755", "r9", "/afile"), ENOTDIR},
        {add("32", "64", "0755", "r9", "/tmp"), EBUSY},  // the host's own RAM disk
        {add("32", "64", "0755", "r9", "/tmp/../tmp/"), EBUSY},
        {add("64", "32", "0755", "r9", "/r1"), EINVAL},  // reservation above the limit
        {add("-1", "32", "0755", "r9", "/r1"), EINVAL},
        {add("1", "4294967296", "0755", "r9", "/r1"), EINVAL},
        {add("1", "2", "0789", "r9", "/r1"), EINVAL},  // not octal
        {add("1", "2", "17777", "r9", "/r1"), EINVAL},
        {add("1", "2", "0755", "bad/name", "/r1"), EINVAL},
        {add("1", "2", "0755", "a,b", "/r1"), EINVAL},  // one field too many
        {add("1", "2", "0755", "", "/r1"), EINVAL},
        {add("1", "2", "0755", "tmp", "/r1"), EEXIST},  // name in use
        {add("1", "2", "0755", "r1", "/" + std::string(140, 'x')), ENAMETOOLONG},
    };
    for (const auto& c : cases) {
        std::vector<std::string> args = {"system", "quillfs", "ramdisk", "add"};
        args.insert(args.end(), c.args.begin(), c.args.end());
        SCOPED_TRACE(c.args[0] + " " + c.args[1] + " " + c.args[2] + " " + c.args[3] + " " +
                     c.args[4].substr(0, 40));
        const auto run = host.Cli(args);
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, std::string(std::strerror(c.error)) + "\n");
        EXPECT_EQ(run.out, "");
    }
    EXPECT_TRUE(Records(host, "mount").empty());
    EXPECT_TRUE(FindDisk(List(host, "ramdisk"), "r9").is_null());

    // The same mount point twice, and the same name elsewhere.
    auto run = host.Cli({"system", "quillfs", "ramdisk", "add", "-m", "0", "-M", "0", "-p", "700",
                         "-n", "r1", "-t", "r1"});
    ASSERT_EQ(run.status, 0) << run.err;
    run = host.Cli({"system", "quillfs", "ramdisk", "add", "-m", "0", "-M", "8", "-p", "700", "-n",
                    "other", "-t", "/r1"});
    EXPECT_EQ(run.err, std::string(std::strerror(EBUSY)) + "\n");
    run = host.Cli({"system", "quillfs", "ramdisk", "add", "-m", "0", "-M", "8", "-p", "700", "-n",
                    "r1", "-t", "/r2"});
    EXPECT_EQ(run.err, std::string(std::strerror(EEXIST)) + "\n");
    EXPECT_EQ(FindDisk(List(host, "ramdisk"), "r1")["Mount Point"], "/r1");
}

TEST(QuillfsRamdiskRemove, RefusesWhatItCannotUnmount) {
    TempHost host;
    std::filesystem::create_directories(host.Root() / "outer" / "inner");
    for (const auto& [name, target] : {std::pair{"outer", "/outer"}, {"inner", "/outer/inner"}}) {
        const auto run = host.Cli({"system", "quillfs", "ramdisk", "add", "-m", "1", "-M", "4",
                                   "-p", "0755", "-n", name, "-t", target});
        ASSERT_EQ(run.status, 0) << run.err;
    }
    const std::pair<const char*, int> cases[] = {
        {"/nothing-here", EINVAL}, {"/etc/ostrel", EINVAL},
        {"/tmp", EBUSY},           {"/", EBUSY},
        {"/outer", EBUSY},         {"", EINVAL},
    };
    for (const auto& [target, error] : cases) {
        SCOPED_TRACE(target);
        const auto run = host.Cli({"system", "quillfs", "ramdisk", "remove", "-t", target});
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, std::string(std::strerror(error)) + "\n");
        EXPECT_EQ(run.out, "");
    }
    EXPECT_TRUE(Records(host, "umount").empty());
    for (const char* target : {"/outer/inner/", "/outer"}) {
        const auto run = host.Cli({"system", "quillfs", "ramdisk", "remove", "-t", target});
        EXPECT_EQ(run.status, 0) << target << run.err;
    }
    EXPECT_EQ(Records(host, "umount").size(), 2u);
}

// Executes a command object in this process, as the tool would.
std::shared_ptr<CmdKit::CallSpec::Output> Execute(
    const std::shared_ptr<CmdKit::AutoCli::Command>& command,
    const std::vector<std::pair<std::string, std::string>>& values) {
    auto input = CmdKit::CallSpec::Input::New();
    for (const auto& [name, value] : values) input->AddValue(name, value);
    auto output = CmdKit::CallSpec::Output::New();
    command->Execute(input, output);
    return output;
}

TEST(QuillfsRamdiskAdd, InodeOptionsWhenSwitchedOn) {
    TempHost host;
    std::filesystem::create_directories(host.Root() / "r2");
    const std::vector<std::pair<std::string, std::string>> base = {{"min-size", "32"},
                                                                   {"max-size", "64"},
                                                                   {"permissions", "0755"},
                                                                   {"name", "r2"},
                                                                   {"target", "/r2"}};
    auto with = [&](std::vector<std::pair<std::string, std::string>> extra) {
        extra.insert(extra.end(), base.begin(), base.end());
        return extra;
    };
    const auto command = QuillfsRamdiskAdd::New(true);

    const std::string tooGreat = "reserved-inodes cannot be greater than max-inodes";
    // Counts are passed whole: one the kernel cannot hold is refused by it, never cut short.
    const std::pair<std::vector<std::pair<std::string, std::string>>, std::string> refusals[] = {
        {with({{"reserved-inodes", "10"}}), tooGreat},
        {with({{"reserved-inodes", "11"}, {"max-inodes", "10"}}), tooGreat},
        {with({{"reserved-inodes", "10"}, {"max-inodes", "4294967306"}}), std::strerror(EINVAL)},
        {with({{"reserved-inodes", "10"}, {"max-inodes", "-1"}}), std::strerror(EINVAL)},
    };
    for (const auto& [values, message] : refusals) {
        const auto output = Execute(command, values);
        EXPECT_EQ(output->GetErrorMessages(), std::vector<std::string>{message});
        EXPECT_FALSE(output->GetRootObject());
        EXPECT_FALSE(output->IsComplete());
    }
    EXPECT_TRUE(Records(host, "mount").empty());

    auto output =
        Execute(command, with({{"reserved-inodes", "10"}, {"max-inodes", "10"}, {"coredump", ""}}));
    ASSERT_TRUE(output->GetErrorMessages().empty()) << output->GetErrorMessages()[0];
    EXPECT_TRUE(output->IsComplete());
    auto mounts = Records(host, "mount");
    ASSERT_EQ(mounts.size(), 1u);
    EXPECT_EQ(mounts[0]["data"], "32,64,10,10,1,0755,r2");
    const auto r2 = FindDisk(List(host, "ramdisk"), "r2");
    EXPECT_EQ(r2["Include in Coredumps"], true);
    EXPECT_EQ(r2["Maximum Inodes"], 10);
    EXPECT_EQ(r2["Allocated Inodes"], 10);

    // Switched off, the inode options are ignored even if a caller passes them.
    ASSERT_EQ(host.Cli({"system", "quillfs", "ramdisk", "remove", "-t", "/r2"}).status, 0);
    output = Execute(QuillfsRamdiskAdd::New(false),
                     with({{"reserved-inodes", "10"}, {"max-inodes", "20"}, {"coredump", ""}}));
    ASSERT_TRUE(output->GetErrorMessages().empty()) << output->GetErrorMessages()[0];
    mounts = Records(host, "mount");
    ASSERT_EQ(mounts.size(), 2u);
    EXPECT_EQ(mounts[1]["data"], "32,64,0,0,0,0755,r2");

    // As registered, the switch's options are unknown to the tool.
    const auto run = host.Cli({"system", "quillfs", "ramdisk", "add", "-m", "1", "-M", "2", "-p",
                               "0755", "-n", "r3", "-t", "/r2", "--max-inodes", "5"});
    EXPECT_EQ(run.status, 2);
}

TEST(QuillfsRamdiskList, ComputesSizesInKibAndFreePercentages) {
    TempHost host;
    host.Import({{"quillfs_ramdisks",
                  {Ramdisk("nolimit", "/a", 0, 0, 0),            // maximum 0: Free 0
                   Ramdisk("over", "/b", 2, 16, 1024),           // 4096 KiB used of 2048 reserved
                   Ramdisk("exact", "/c", 4, 16, 1024),          // used equals the reservation
                   Ramdisk("partial", "/d", 10, 20, 512, true),  // 2048 KiB used
                   Ramdisk("full", "/e", 0, 1, 256)}}});
    const auto disks = List(host, "ramdisk");
    ASSERT_EQ(disks.size(), 5u);
    struct Row {
        const char* name;
        int64_t reserved, maximum, used, peak, free, reservedFree;
    };
    const Row rows[] = {
        {"nolimit", 0, 0, 0, 40, 0, 0},
        {"over", 2048, 16384, 4096, 4136, 75, 0},
        {"exact", 4096, 16384, 4096, 4136, 75, 0},
        {"partial", 10240, 20480, 2048, 2088, 90, 80},
        {"full", 0, 1024, 1024, 1064, 0, 0},
    };
    for (size_t i = 0; i < std::size(rows); ++i) {
        SCOPED_TRACE(rows[i].name);
        const auto& disk = disks[i];
        EXPECT_EQ(Keys(disk),
                  (std::vector<std::string>{"Ramdisk Name", "System", "Include in Coredumps",
                                            "Reserved", "Maximum", "Used", "Peak Used", "Free",
                                            "Reserved Free", "Maximum Inodes", "Allocated Inodes",
                                            "Used Inodes", "Mount Point"}));
        EXPECT_EQ(disk["Ramdisk Name"], rows[i].name);
        EXPECT_EQ(disk["Reserved"], rows[i].reserved);
        EXPECT_EQ(disk["Maximum"], rows[i].maximum);
        EXPECT_EQ(disk["Used"], rows[i].used);
        EXPECT_EQ(disk["Peak Used"], rows[i].peak);
        EXPECT_EQ(disk["Free"], rows[i].free);
        EXPECT_EQ(disk["Reserved Free"], rows[i].reservedFree);
        EXPECT_EQ(disk["Maximum Inodes"], 2048);
        EXPECT_EQ(disk["Allocated Inodes"], 256);
        EXPECT_EQ(disk["Used Inodes"], 40);
        EXPECT_EQ(disk["Include in Coredumps"], true);
    }
    EXPECT_EQ(disks[3]["System"], true);
    EXPECT_EQ(disks[0]["System"], false);
    EXPECT_EQ(disks[3]["Mount Point"], "/d");
}

TEST(QuillfsTardiskList, ListsNamesSystemFlagAndThirtyTwoBitSizes) {
    TempHost host;
    host.Import({{"quillfs_tardisks",
                  {{{"id", 1}, {"name", "small.tdk"}, {"size", 4294967295}, {"system", 1}},
                   {{"id", 2}, {"name", "huge.tdk"}, {"size", 4294967301}, {"system", 0}}}}});
    EXPECT_EQ(List(host, "tardisk"),
              ojson::parse(R"([{"Tardisk Name":"small.tdk","System":true,"Size":4294967295},
        {"Tardisk Name":"huge.tdk","System":false,"Size":5}])"));
}

TEST(QuillfsGet, ComputesFreePercentagesFromTheCounters) {
    TempHost host;
    struct Case {
        int64_t total, baseUsed, peak;
        int64_t free, lowest;
    };
    const Case cases[] = {
        {1000, 100, 250, 90, 75},
        {3, 1, 1, 66, 66},  // truncated
        {4294967295, 0, 4294967295, 100, 0},
        {10, 10, 10, 0, 0},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.total);
        host.Import({{"quillfs_inodes", Inodes(c.total, c.baseUsed, c.peak)},
                     {"quillfs_ramdisks", json::array()}});
        const auto run = host.Cli({"--formatter=json", "system", "quillfs", "get"});
        ASSERT_EQ(run.status, 0) << run.err;
        const auto status = ojson::parse(run.out);
        EXPECT_EQ(Keys(status),
                  (std::vector<std::string>{"Total Inodes", "Used Inodes", "Unlinked Inodes",
                                            "Reserved Inodes", "Peak Used Inodes",
                                            "Peak Unlinked Inodes", "Peak Reserved Inodes",
                                            "Free Inode Percent", "Lowest Free Inode Percent"}));
        EXPECT_EQ(status["Total Inodes"], c.total);
        EXPECT_EQ(status["Used Inodes"], c.baseUsed);
        EXPECT_EQ(status["Peak Used Inodes"], c.peak);
        EXPECT_EQ(status["Unlinked Inodes"], 2);
        EXPECT_EQ(status["Peak Unlinked Inodes"], 9);
        EXPECT_EQ(status["Reserved Inodes"], 0);
        EXPECT_EQ(status["Free Inode Percent"], c.free);
        EXPECT_EQ(status["Lowest Free Inode Percent"], c.lowest);
    }
}

TEST(QuillfsGet, RamDisksCountTowardsTheInodesAndPeaksStay) {
    TempHost host;
    host.Import({{"quillfs_inodes", Inodes(100000, 1000, 0)},
                 {"quillfs_ramdisks", {Ramdisk("one", "/one", 1, 2, 3)}}});
    auto status = json::parse(host.Cli({"--formatter=json", "system", "quillfs", "get"}).out);
    EXPECT_EQ(status["Used Inodes"], 1040);
    EXPECT_EQ(status["Reserved Inodes"], 16);
    EXPECT_EQ(status["Peak Used Inodes"], 1040);
    EXPECT_EQ(status["Peak Reserved Inodes"], 16);
    std::filesystem::create_directories(host.Root() / "one");
    ASSERT_EQ(host.Cli({"system", "quillfs", "ramdisk", "remove", "-t", "/one"}).status, 0);
    status = json::parse(host.Cli({"--formatter=json", "system", "quillfs", "get"}).out);
    EXPECT_EQ(status["Used Inodes"], 1000);
    EXPECT_EQ(status["Reserved Inodes"], 0);
    EXPECT_EQ(status["Peak Used Inodes"], 1040);
    EXPECT_EQ(status["Peak Reserved Inodes"], 16);
}

// Reads a node's record in this process, as the commands do.
std::vector<unsigned char> Read(uint32_t node, const std::string& instance, size_t size) {
    KernCtl::Util::Sysinfo sysinfo(node);
    if (!instance.empty()) sysinfo.AddInstancePath(instance);
    std::vector<unsigned char> record(size, 0xEE);
    sysinfo.Get(record.data(), record.size());
    return record;
}

uint32_t U32(const std::vector<unsigned char>& record, size_t at) {
    return record[at] | record[at + 1] << 8 | record[at + 2] << 16 |
           static_cast<uint32_t>(record[at + 3]) << 24;
}

TEST(QuillfsRecords, EveryFieldSitsAtItsOffset) {
    TempHost host;
    auto disk = Ramdisk("layout", "/layout/point", 0x01020304, 0x05060708, 0x090A0B0C);
    disk["peak_pages"] = 0x0D0E0F10;
    disk["max_inodes"] = 0x11121314;
    disk["allocated_inodes"] = 0x15161718;
    disk["used_inodes"] = 0x191A1B1C;
    disk["coredump"] = 0;
    disk["system"] = 1;
    host.Import({{"quillfs_ramdisks", {disk}},
                 {"quillfs_inodes",
                  {{{"id", 1},
                    {"total", 0x7F000001},
                    {"base_used", 0x100},
                    {"unlinked", 0x200},
                    {"peak_used", 0x300},
                    {"peak_unlinked", 0x400},
                    {"peak_reserved", 0x500}}}},
                 {"quillfs_tardisks",
                  {{{"id", 1}, {"name", "t.tdk"}, {"size", 0x1A2B3C4D}, {"system", 1}}}}});

    KernCtl::Util::Sysinfo ramdisks(KSI_NODE_system_quillfs_ramdisks);
    std::vector<std::string> names;
    ramdisks.List(names);
    EXPECT_EQ(names, std::vector<std::string>{"layout"});

    auto record = Read(KSI_NODE_system_quillfs_ramdisks_stats, "layout", 180);
    EXPECT_EQ(U32(record, 0), 0x01020304u);
    EXPECT_EQ(U32(record, 4), 0x05060708u);
    EXPECT_EQ(U32(record, 8), 0x090A0B0Cu);
    EXPECT_EQ(U32(record, 12), 0x0D0E0F10u);
    EXPECT_EQ(record[24], 0);
    EXPECT_NE(record[25], 0);
    EXPECT_STREQ(reinterpret_cast<const char*>(&record[30]), "/layout/point");
    EXPECT_EQ(U32(record, 162), 0x11121314u);  // unaligned
    EXPECT_EQ(U32(record, 166), 0x15161718u);
    EXPECT_EQ(U32(record, 170), 0x191A1B1Cu);
    for (size_t i = 174; i < 180; ++i) EXPECT_EQ(record[i], 0) << i;

    record = Read(KSI_NODE_system_quillfs_stats, "", 1124);
    EXPECT_EQ(U32(record, 4), 0x7F000001u);
    EXPECT_EQ(U32(record, 8), 0x100u + 0x191A1B1Cu);   // base plus the RAM disk's
    EXPECT_EQ(U32(record, 12), 0x100u + 0x191A1B1Cu);  // the peak is at least the current use
    EXPECT_EQ(U32(record, 16), 0x200u);
    EXPECT_EQ(U32(record, 20), 0x400u);
    EXPECT_EQ(U32(record, 24), 16u);
    EXPECT_EQ(U32(record, 28), 0x500u);
    EXPECT_EQ(record[1123], 0);

    record = Read(KSI_NODE_system_quillfs_tardisks_stats, "t.tdk", 28);
    EXPECT_EQ(U32(record, 0), 0x1A2B3C4Du);
    EXPECT_NE(record[8], 0);

    // An unknown instance and a short buffer are refused.
    EXPECT_THROW(Read(KSI_NODE_system_quillfs_ramdisks_stats, "nope", 180),
                 HostCtl::Lib::HostCtlException);
    EXPECT_THROW(Read(KSI_NODE_system_quillfs_tardisks_stats, "t.tdk", 27),
                 HostCtl::Lib::HostCtlException);
}

TEST(QuillfsRecords, LongMountPointIsCutToItsSlot) {
    TempHost host;
    const std::string longPath = "/" + std::string(200, 'p');
    host.Import({{"quillfs_ramdisks", {Ramdisk("long", longPath, 1, 2, 3)}}});
    const auto record = Read(KSI_NODE_system_quillfs_ramdisks_stats, "long", 180);
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(&record[30])), longPath.substr(0, 131));
    EXPECT_EQ(U32(record, 162), 2048u);
}

}  // namespace

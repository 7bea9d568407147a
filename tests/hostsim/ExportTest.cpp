// An export is the whole host: changed by every kind of change a command makes, exported,
// imported into a new root and exported again, it reads back the same, byte for byte, and every
// question a command can ask answers the same on both hosts.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "support/TestHost.h"

namespace {

namespace fs = std::filesystem;

// One line of every mutating command, each leaving something behind.
const char* const kChanges[] = {
    "system settings kernel set -s acpiDebugLevel -v 3",
    "system settings advanced set -o /BufferCache/FlushIntervalMs -i 100",
    "system settings advanced set -o /Cpu/CoreSharingPolicy -s strict",
    "system settings keyboard layout set -l Belgian",
    "system module parameters set -m qln_nic10g -p \"rss=4 vmdq=2\"",
    "system module parameters copy -s qln_nic10g -t qln_nic25g -p rss",
    "system module load -m qln_nic25g",
    "system module set -m klv_nvmeof -e false",
    "system coredump partition set -p naa.6000c29b7d03e145:2",
    "system coredump network set -v vnic0 -j 192.0.2.50 -o 6500",
    "system coredump network set -e true",
    "system coredump file add -d ds-archive -f extra -s 100",
    "system coredump file set -p /datastores/ds-archive/coredump/extra.dumpfile",
    "system coredump file remove -f /datastores/ds-shared-02/coredump/coredump-1.dumpfile -F",
    "system coredump dorna set -U b81f04d6-2e7c-4a93-9d58-16fa0c3e72ab",
    "system coredump dorna add -s 100",
    "system coredump dorna remove -u 3c9e7a41-5b2d-4f86-a1c0-7d84e2b9f615 -F",
    "system secpolicy domain set -n shellTools -l audit",
    "system welcomemsg set -m \"Round trip\"",
    "system quillfs ramdisk add -m 1 -M 8 -p 0755 -n scratch -t /var/tmp",
    "system quillfs ramdisk remove -t /var/run/hostdiag",
    "system time set -y 2030",
    "system hostname set -f rt-host.example.net",
    "system snmp set --syslocation X --communities a,b --users u/-/-/none --port 1161 "
    "-E 0x0102030405",
    "system wbem set --enable false",
    "system wbem provider set -n brix_software -e false",
    "system maintenanceMode set -e true",
};

// Questions whose answers move with the clock.
bool AnswerIsStable(const std::string& path) {
    for (const char* moving : {"system time get", "system stats uptime get"}) {
        if (path == moving) return false;
    }
    const auto last = path.substr(path.rfind(' ') + 1);
    return last == "get" || last == "list";
}

// The answer without the fields that tell the time of asking; two hosts are asked moments apart.
std::string WithoutClockFields(const std::string& path, const std::string& json) {
    if (path != "system slp stats get" || json.empty()) return json;
    auto answer = nlohmann::json::parse(json);
    answer.erase("Date");
    answer.erase("Uptime");
    return answer.dump(2);
}

std::vector<std::string> Words(const std::string& path) {
    std::vector<std::string> words;
    std::istringstream in(path);
    for (std::string word; in >> word;) words.push_back(word);
    return words;
}

TEST(Export, RoundTripKeepsTheWholeHost) {
    BrixTest::TempHost original;
    ASSERT_EQ(original.Sim({"feature", "set", "120", "on"}).status, 0);
    std::string batch;
    for (const char* line : kChanges) batch += std::string(line) + "\n";
    const auto changed = original.Cli({"--stop-on-error", "--batch", "-"}, batch);
    ASSERT_EQ(changed.status, 0) << changed.err;

    const auto document = original.Sim({"export"});
    ASSERT_EQ(document.status, 0) << document.err;
    BrixTest::TempHost copy;
    const fs::path file = copy.Root().string() + "-export.json";
    std::ofstream(file) << document.out;
    const auto imported = copy.Sim({"import", file.string()});
    fs::remove(file);
    ASSERT_EQ(imported.status, 0) << imported.err;
    const auto again = copy.Sim({"export"});
    EXPECT_TRUE(again.out == document.out) << "the second export differs";

    // Every question, asked of both hosts.
    const auto listing = original.Cli({"--list-commands", "--formatter=json"});
    ASSERT_EQ(listing.status, 0) << listing.err;
    int asked = 0;
    for (const auto& row : nlohmann::json::parse(listing.out)) {
        const std::string path = row.begin()->get<std::string>();
        if (!AnswerIsStable(path)) continue;
        std::vector<std::string> args = Words(path);
        args.insert(args.begin(), "--formatter=json");
        const auto first = original.Cli(args);
        const auto second = copy.Cli(args);
        EXPECT_EQ(first.status, second.status) << path;
        EXPECT_EQ(WithoutClockFields(path, first.out), WithoutClockFields(path, second.out))
            << path;
        EXPECT_EQ(first.err, second.err) << path;
        ++asked;
    }
    EXPECT_GT(asked, 25);
}

}  // namespace

// brixcli killed with SIGKILL at random moments while it commits changes: afterwards the store
// opens, a getter answers, the SNMP configuration file is well-formed, and every value read is
// the old or the new one, never a mix. BRIX_ROBUST_KILLS (default 300) is the number of kills
// over all kinds of change, BRIX_ROBUST_SEED the seed of the random delays.
#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <fstream>
#include <functional>
#include <nlohmann/json.hpp>
#include <pugixml.hpp>
#include <random>
#include <string>
#include <vector>

#include "Robustness.h"
#include "support/TestHost.h"

namespace {

namespace fs = std::filesystem;
using BrixTest::TempHost;
using Clock = std::chrono::steady_clock;

// The version number of a value made by Versioned(prefix, n), or -1.
int VersionOf(const std::string& value, const std::string& prefix, const std::string& suffix = "") {
    if (value.size() <= prefix.size() + suffix.size()) return -1;
    if (value.compare(0, prefix.size(), prefix) != 0) return -1;
    if (value.compare(value.size() - suffix.size(), suffix.size(), suffix) != 0) return -1;
    const std::string digits =
        value.substr(prefix.size(), value.size() - prefix.size() - suffix.size());
    if (digits.empty() || digits.find_first_not_of("0123456789") != std::string::npos) return -1;
    return std::stoi(digits);
}

nlohmann::json GetJson(const TempHost& host, std::vector<std::string> args) {
    args.insert(args.begin(), "--formatter=json");
    const auto run = host.Cli(args);
    EXPECT_EQ(run.status, 0) << run.err;
    if (run.status != 0 || run.out.empty()) return nullptr;
    return nlohmann::json::parse(run.out, nullptr, false);
}

// One kind of change: the command that commits version n, and the version the host holds
// (-1 when what it holds is not one whole version: a mix, an empty or unreadable value).
struct ChangeKind {
    std::function<std::vector<std::string>(int)> set;
    std::function<int(const TempHost&)> read;
};

// Host name and domain in one command, kept in one row of the store.
ChangeKind HostnameKind() {
    return {[](int n) {
                const std::string v = std::to_string(n);
                return std::vector<std::string>{"system", "hostname", "set", "--fqdn",
                                                "node-" + v + ".zone-" + v + ".example"};
            },
            [](const TempHost& host) {
                const auto names = GetJson(host, {"system", "hostname", "get"});
                if (!names.is_object()) return -1;
                const int n = VersionOf(names.value("Host Name", ""), "node-");
                const std::string v = std::to_string(n);
                if (names.value("Domain Name", "") != "zone-" + v + ".example") return -1;
                if (names.value("Fully Qualified Domain Name", "") !=
                    "node-" + v + ".zone-" + v + ".example") {
                    return -1;
                }
                return n;
            }};
}

// An integer advanced option.
ChangeKind AdvancedOptionKind() {
    constexpr int kBase = 1000;  // the option's minimum
    return {[](int n) {
                return std::vector<std::string>{"system",      "settings",
                                                "advanced",    "set",
                                                "--option",    "/Cpu/SchedQuantumUs",
                                                "--int-value", std::to_string(kBase + n)};
            },
            [](const TempHost& host) {
                const auto rows = GetJson(host, {"system", "settings", "advanced", "list",
                                                 "--option", "/Cpu/SchedQuantumUs"});
                if (!rows.is_array() || rows.size() != 1) return -1;
                const auto& value = rows[0]["Int Value"];
                if (!value.is_number_integer()) return -1;
                return value.get<int>() - kBase;
            }};
}

// Three settings of the SNMP agent's configuration file in one command.
ChangeKind SnmpFileKind() {
    return {[](int n) {
                const std::string v = std::to_string(n);
                return std::vector<std::string>{
                    "system",        "snmp",          "set",
                    "--syslocation", "hall-" + v,     "--syscontact",
                    "desk-" + v,     "--communities", "pub" + v + ",ops" + v};
            },
            [](const TempHost& host) {
                pugi::xml_document document;
                const auto file = host.Root() / "etc/ostrel/snmp.xml";
                const auto parsed = document.load_file(file.c_str());
                EXPECT_TRUE(parsed) << file << ": " << parsed.description();
                if (!parsed) return -1;
                const auto agent = document.child("snmpAgent");
                const auto options = agent.child("options");
                const std::string location =
                    options.find_child_by_attribute("option", "key", "syslocation").text().get();
                const std::string contact =
                    options.find_child_by_attribute("option", "key", "syscontact").text().get();
                std::vector<std::string> communities;
                for (const auto& c : agent.child("communities").children()) {
                    communities.push_back(c.text().get());
                }
                const int n = VersionOf(location, "hall-");
                const std::string v = std::to_string(n);
                if (contact != "desk-" + v) return -1;
                if (communities != std::vector<std::string>{"pub" + v, "ops" + v}) return -1;
                // The agent reads the same file.
                const auto shown = GetJson(host, {"system", "snmp", "get"});
                if (!shown.is_object() || shown.value("syslocation", "") != location ||
                    shown.value("syscontact", "") != contact ||
                    shown["communities"] != nlohmann::json(communities)) {
                    return -1;
                }
                return n;
            }};
}

// Staged copies of the configuration file that a killed writer left beside it.
int StrayTemporaries(const TempHost& host) {
    int count = 0;
    for (const auto& entry : fs::directory_iterator(host.Root() / "etc/ostrel")) {
        if (entry.path().filename().string().rfind(".snmp.xml.tmp-", 0) == 0) ++count;
    }
    return count;
}

void KillWhileCommitting(const ChangeKind& kind, int kills, unsigned seed) {
    SCOPED_TRACE("seed " + std::to_string(seed));
    TempHost host;
    std::mt19937 random(seed);
    auto argv = [&](int n) {
        auto words = kind.set(n);
        words.insert(words.begin(), BrixRobust::Program("brixcli"));
        return words;
    };

    // A few undisturbed commits tell how long a process lives (the median).
    int version = 0;
    std::vector<int64_t> lifetimes;
    for (; version < 5; ++version) {
        const auto start = Clock::now();
        int code = -1;
        ASSERT_TRUE(BrixRobust::Reap(BrixRobust::Spawn(argv(version)), code));
        ASSERT_EQ(code, 0);
        lifetimes.push_back(
            std::chrono::duration_cast<std::chrono::microseconds>(Clock::now() - start).count());
        ASSERT_EQ(kind.read(host), version);
    }
    std::sort(lifetimes.begin(), lifetimes.end());
    const int64_t lifetime = lifetimes[lifetimes.size() / 2];
    int held = version - 1;
    std::uniform_int_distribution<int64_t> delay(0, lifetime);

    int killed = 0;
    int attempt = 0;
    for (; killed < kills && attempt < 4 * kills; ++attempt, ++version) {
        SCOPED_TRACE("version " + std::to_string(version));
        const pid_t pid = BrixRobust::Spawn(argv(version));
        const auto outcome = BrixRobust::KillAfter(pid, std::chrono::microseconds(delay(random)));
        const int now = kind.read(host);
        if (outcome.killed) {
            ++killed;
            ASSERT_TRUE(now == held || now == version)
                << "holds version " << now << " after a kill between " << held << " and "
                << version;
        } else {
            ASSERT_EQ(outcome.exitCode, 0);
            ASSERT_EQ(now, version);
        }
        held = now;
        // A commit clears what earlier killed writers left; only the last kill's can remain.
        ASSERT_LE(StrayTemporaries(host), 1);
    }
    EXPECT_EQ(killed, kills) << "processes ended before their kill too often";
    std::cerr << killed << " kills in " << attempt << " runs, process life " << lifetime / 1000
              << " ms\n";

    // Writes still work, and leave nothing behind.
    int code = -1;
    ASSERT_TRUE(BrixRobust::Reap(BrixRobust::Spawn(argv(version)), code));
    EXPECT_EQ(code, 0);
    EXPECT_EQ(kind.read(host), version);
    EXPECT_EQ(StrayTemporaries(host), 0);
}

// Temporaries of writers killed before their rename go with the next commit; other files that
// merely look alike stay.
TEST(Crash, CommitRemovesTemporariesOfKilledWriters) {
    TempHost host;
    ASSERT_EQ(host.Cli({"system", "uuid", "get"}).status, 0);  // seeds the host
    const fs::path folder = host.Root() / "etc/ostrel";
    for (const char* name : {".snmp.xml.tmp-00c0ffee12345678", ".snmp.xml.tmp-ffffffffffffffff",
                             ".snmp.xml.tmp-short", "snmp.xml.bak"}) {
        std::ofstream(folder / name) << "<snmpAgent>";
    }
    const auto set = host.Cli({"system", "snmp", "set", "--syslocation", "hall-1"});
    ASSERT_EQ(set.status, 0) << set.err;
    EXPECT_FALSE(fs::exists(folder / ".snmp.xml.tmp-00c0ffee12345678"));
    EXPECT_FALSE(fs::exists(folder / ".snmp.xml.tmp-ffffffffffffffff"));
    EXPECT_TRUE(fs::exists(folder / "snmp.xml.bak"));
    EXPECT_EQ(StrayTemporaries(host), 1);  // the look-alike
}

int KillsPerKind() {
    const int total = BrixRobust::EnvCount("BRIX_ROBUST_KILLS", 300);
    return std::max(1, (total + 2) / 3);
}

unsigned Seed(unsigned salt) {
    return static_cast<unsigned>(BrixRobust::EnvCount("BRIX_ROBUST_SEED", 20240611)) + salt;
}

TEST(Crash, HostnameCommitsAreWholeAfterKills) {
    KillWhileCommitting(HostnameKind(), KillsPerKind(), Seed(1));
}

TEST(Crash, AdvancedOptionCommitsAreWholeAfterKills) {
    KillWhileCommitting(AdvancedOptionKind(), KillsPerKind(), Seed(2));
}

TEST(Crash, SnmpFileCommitsAreWholeAfterKills) {
    KillWhileCommitting(SnmpFileKind(), KillsPerKind(), Seed(3));
}

}  // namespace

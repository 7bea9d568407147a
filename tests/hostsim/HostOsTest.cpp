// The operating-system seam: the host clock, sleeps, syslog, signals to init, mounts and unlink.
#include <errno.h>
#include <gtest/gtest.h>
#include <signal.h>

#include <algorithm>
#include <chrono>
#include <fstream>

#include "hostsim/core/Hooks.h"
#include "hostsim/core/Store.h"
#include "os/HostOs.h"
#include "support/TestHost.h"

namespace {

namespace fs = std::filesystem;
using BrixSim::Store;
using BrixTest::TempHost;

// A file-system type of the test's own: "testfs" mounts anything except target "/busy".
std::vector<std::string> testMounts;
const bool registered = BrixSim::RegisterFileSystemType(
    "testfs",
    {[](const std::string&, const std::string& target, unsigned long, const std::string&) {
         if (target == "/busy") return EBUSY;
         testMounts.push_back(target);
         return 0;
     },
     [](const std::string& target) {
         auto found = std::find(testMounts.begin(), testMounts.end(), target);
         if (found == testMounts.end()) return EINVAL;
         testMounts.erase(found);
         return 0;
     }});

TEST(HostOs, SettimeofdayMovesOnlyTheHostClock) {
    TempHost host;
    const time_t real = ::time(nullptr);
    EXPECT_LE(std::abs(HostOs::time(nullptr) - real), 1);

    const struct timeval later = {real + 86400 * 30, 0};
    ASSERT_EQ(HostOs::settimeofday(&later, nullptr), 0);
    time_t seen = 0;
    const time_t now = HostOs::time(&seen);
    EXPECT_EQ(now, seen);
    EXPECT_LE(std::abs(now - (real + 86400 * 30)), 1);
    EXPECT_LE(std::abs(::time(nullptr) - real), 1);
    // The offset is host state: another process sees it.
    Store::Close();
    EXPECT_LE(std::abs(HostOs::time(nullptr) - (real + 86400 * 30)), 1);

    const auto journal = host.Journal();
    ASSERT_EQ(journal.size(), 1u);
    EXPECT_EQ(journal[0],
              (nlohmann::json{{"kind", "settimeofday"}, {"seconds", real + 86400 * 30}}));

    const struct timeval bad = {real, 1000000};
    errno = 0;
    EXPECT_EQ(HostOs::settimeofday(&bad, nullptr), -1);
    EXPECT_EQ(errno, EINVAL);
    EXPECT_EQ(host.Journal().size(), 1u);

    // Local time is the machine's zone applied to the host's time.
    struct tm mine {};
    struct tm theirs {};
    ASSERT_NE(HostOs::localtime_r(&now, &mine), nullptr);
    ASSERT_NE(::localtime_r(&now, &theirs), nullptr);
    EXPECT_EQ(mine.tm_hour, theirs.tm_hour);
    EXPECT_EQ(HostOs::mktime(&mine), now);
}

TEST(HostOs, SleepIsScaledAndJournaled) {
    TempHost host;  // BRIXSIM_SLEEP_SCALE=0
    const auto start = std::chrono::steady_clock::now();
    const struct timespec request = {30, 500000000};
    struct timespec remaining = {9, 9};
    ASSERT_EQ(HostOs::nanosleep(&request, &remaining), 0);
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(2));
    EXPECT_EQ(remaining.tv_sec, 0);
    EXPECT_EQ(remaining.tv_nsec, 0);

    setenv("BRIXSIM_SLEEP_SCALE", "0.001", 1);  // 30.5 s becomes about 30 ms
    const auto scaledStart = std::chrono::steady_clock::now();
    ASSERT_EQ(HostOs::nanosleep(&request, nullptr), 0);
    const auto took = std::chrono::steady_clock::now() - scaledStart;
    EXPECT_GE(took, std::chrono::milliseconds(25));
    EXPECT_LT(took, std::chrono::seconds(2));
    setenv("BRIXSIM_SLEEP_SCALE", "0", 1);

    const struct timespec bad = {1, 1000000000};
    errno = 0;
    EXPECT_EQ(HostOs::nanosleep(&bad, nullptr), -1);
    EXPECT_EQ(errno, EINVAL);

    const auto journal = host.Journal();
    ASSERT_EQ(journal.size(), 2u);
    EXPECT_EQ(journal[0], (nlohmann::json{{"kind", "sleep"}, {"seconds", 30}}));
    EXPECT_EQ(journal[1], journal[0]);
}

TEST(HostOs, SyslogFormatsItsText) {
    TempHost host;
    HostOs::syslog(5, "The host is going down for %s by %s (%d)", "reboot", "root", 7);
    const auto journal = host.Journal();
    ASSERT_EQ(journal.size(), 1u);
    EXPECT_EQ(journal[0],
              (nlohmann::json{{"kind", "syslog"},
                              {"priority", 5},
                              {"text", "The host is going down for reboot by root (7)"}}));
}

TEST(HostOs, SignalsToInitRecordPowerActions) {
    TempHost host;
    auto& store = Store::Get();
    ASSERT_EQ(HostOs::kill(1, SIGTERM), 0);
    EXPECT_EQ(store.GetValue("power.last", ""), "reboot");
    ASSERT_EQ(HostOs::kill(1, SIGUSR2), 0);
    EXPECT_EQ(store.GetValue("power.last", ""), "poweroff");
    ASSERT_EQ(HostOs::kill(1, SIGTERM), 0);
    EXPECT_EQ(store.GetInt("power.reboots", 0), 2);
    EXPECT_EQ(store.GetInt("power.poweroffs", 0), 1);
    EXPECT_EQ(HostOs::kill(1, 0), 0);  // existence check: no record

    errno = 0;
    EXPECT_EQ(HostOs::kill(4242, SIGTERM), -1);
    EXPECT_EQ(errno, ESRCH);
    errno = 0;
    EXPECT_EQ(HostOs::kill(1, -5), -1);
    EXPECT_EQ(errno, EINVAL);

    const auto journal = host.Journal();
    ASSERT_EQ(journal.size(), 3u);
    EXPECT_EQ(journal[0], (nlohmann::json{{"kind", "signal"}, {"pid", 1}, {"signal", 15}}));
    EXPECT_EQ(journal[1]["signal"], 12);
}

TEST(HostOs, MountDispatchesByType) {
    TempHost host;
    testMounts.clear();
    errno = 0;
    EXPECT_EQ(HostOs::mount("none", "/mnt/x", "nosuchfs", 0, nullptr), -1);
    EXPECT_EQ(errno, ENODEV);
    errno = 0;
    EXPECT_EQ(HostOs::mount("none", "/busy", "testfs", 0, nullptr), -1);
    EXPECT_EQ(errno, EBUSY);
    ASSERT_EQ(HostOs::mount("ramdisk", "/tmp/scratch", "testfs", 3, "maxSize=64"), 0);
    EXPECT_EQ(testMounts, std::vector<std::string>{"/tmp/scratch"});
    errno = 0;
    EXPECT_EQ(HostOs::umount("/not/mounted"), -1);
    EXPECT_EQ(errno, EINVAL);
    ASSERT_EQ(HostOs::umount("/tmp/scratch"), 0);
    EXPECT_TRUE(testMounts.empty());

    const auto journal = host.Journal();
    ASSERT_EQ(journal.size(), 2u);
    EXPECT_EQ(journal[0], (nlohmann::json{{"kind", "mount"},
                                          {"source", "ramdisk"},
                                          {"target", "/tmp/scratch"},
                                          {"fstype", "testfs"},
                                          {"flags", 3},
                                          {"data", "maxSize=64"}}));
    EXPECT_EQ(journal[1], (nlohmann::json{{"kind", "umount"}, {"target", "/tmp/scratch"}}));
}

TEST(HostOs, UnlinkStaysInsideTheRoot) {
    TempHost host;
    const fs::path root = Store::Get().Root();
    fs::create_directories(root / "var/tmp");
    std::ofstream(root / "var/tmp/old.log") << "engine boots 3\n";
    fs::create_symlink("/etc/hostname", root / "var/tmp/escape");

    ASSERT_EQ(HostOs::unlink("/var/tmp/old.log"), 0);
    EXPECT_FALSE(fs::exists(root / "var/tmp/old.log"));

    struct Case {
        const char* path;
        int error;
    };
    const Case refused[] = {
        {"/var/tmp/old.log", ENOENT},  {"/var/tmp", EISDIR}, {"/../etc/hostname", EACCES},
        {"/var/tmp/escape/x", EACCES}, {"", ENOENT},
    };
    for (const auto& c : refused) {
        SCOPED_TRACE(c.path);
        errno = 0;
        EXPECT_EQ(HostOs::unlink(c.path), -1);
        EXPECT_EQ(errno, c.error);
    }
    // A link is removed itself, never what it points at.
    std::ofstream(root / "var/tmp/target") << "kept";
    fs::create_symlink("target", root / "var/tmp/link");
    ASSERT_EQ(HostOs::unlink("var/tmp/link"), 0);
    EXPECT_TRUE(fs::exists(root / "var/tmp/target"));

    const auto journal = host.Journal();
    ASSERT_EQ(journal.size(), 2u);
    EXPECT_EQ(journal[0], (nlohmann::json{{"kind", "unlink"}, {"path", "/var/tmp/old.log"}}));
    EXPECT_EQ(journal[1]["path"], "var/tmp/link");
}

}  // namespace

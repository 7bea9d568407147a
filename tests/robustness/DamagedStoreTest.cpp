// A host whose store is damaged, lost, read-only or on a full disk: every tool fails at once
// with one line that names the store and what is wrong with it, and help still answers.
#include <gtest/gtest.h>
#include <sys/mount.h>

#include <filesystem>
#include <fstream>
#include <functional>
#include <random>

#include "Robustness.h"
#include "hostsim/core/Store.h"
#include "support/TestHost.h"

namespace {

namespace fs = std::filesystem;

void Truncate(const fs::path& file, uintmax_t size) {
    fs::resize_file(file, size);
}

// The store's size, or -1 when it is gone.
intmax_t StoreSize(const fs::path& root) {
    std::error_code error;
    const auto size = fs::file_size(root / "host.db", error);
    return error ? -1 : static_cast<intmax_t>(size);
}

struct Damage {
    const char* name;
    std::function<void(const fs::path& root)> apply;
    std::string reason;  // what the message says is wrong
};

TEST(DamagedStore, EveryToolFailsAtOnceAndSaysWhy) {
    const Damage damages[] = {
        {"emptied", [](const fs::path& root) { Truncate(root / "host.db", 0); },
         "the store is empty; the host's state is lost (brixsim init --force makes a new host)"},
        {"removed",
         [](const fs::path& root) {
             for (const char* file : {"host.db", "host.db-wal", "host.db-shm"})
                 fs::remove(root / file);
         },
         "the store is missing; the host's state is lost (brixsim init --force makes a new host)"},
        {"random bytes",
         [](const fs::path& root) {
             std::mt19937 random(7);
             std::ofstream out(root / "host.db", std::ios::binary | std::ios::trunc);
             for (int i = 0; i < 64 * 1024; ++i) out.put(static_cast<char>(random()));
             fs::remove(root / "host.db-wal");
             fs::remove(root / "host.db-shm");
         },
         "file is not a database"},
        {"cut mid-page",
         [](const fs::path& root) {
             Truncate(root / "host.db", 1000);
             fs::remove(root / "host.db-wal");
             fs::remove(root / "host.db-shm");
         },
         "database disk image is malformed"},
    };
    for (const auto& damage : damages) {
        SCOPED_TRACE(damage.name);
        BrixTest::TempHost host;
        BrixSim::Store::Close();
        damage.apply(host.Root());
        const auto damaged = StoreSize(host.Root());
        const std::string line =
            "host store " + (host.Root() / "host.db").string() + ": " + damage.reason + "\n";
        auto run = host.Cli({"system", "uuid", "get"});
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, "Error: " + line);
        run = host.Sim({"export"});
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, "brixsim: " + line);
        EXPECT_EQ(host.Cli({"system", "uuid", "get", "--help"}).status, 0);
        // Nothing was made over the lost host.
        EXPECT_EQ(StoreSize(host.Root()), damaged);
    }
}

// A full disk at first use: the store cannot be made, and says so at once.
TEST(DamagedStore, FullDiskAtFirstUse) {
    BrixTest::TempHost host;
    const fs::path fresh = host.Root() / "fresh";
    const auto full = BrixTest::Run({"env", "BRIX_HOST_ROOT=" + fresh.string(), "sh", "-c",
                                     "ulimit -f 8; trap '' XFSZ; exec \"$0\" system uuid get",
                                     BrixRobust::Program("brixcli")});
    EXPECT_EQ(full.status, 1);
    EXPECT_EQ(full.err, "Error: host store " + (fresh / "host.db").string() +
                            ": disk I/O error (File too large)\n");
}

// A host on a folder nobody may write: getters read it, setters are refused by the store.
TEST(DamagedStore, ReadOnlyRootServesGetters) {
    BrixTest::TempHost host;
    ASSERT_EQ(host.Cli({"system", "welcomemsg", "set", "-m", "frozen"}).status, 0);
    BrixSim::Store::Close();
    fs::remove(host.Root() / "host.db-wal");
    fs::remove(host.Root() / "host.db-shm");
    const std::string root = host.Root().string();
    if (mount(root.c_str(), root.c_str(), nullptr, MS_BIND, nullptr) != 0 ||
        mount(nullptr, root.c_str(), nullptr, MS_BIND | MS_REMOUNT | MS_RDONLY, nullptr) != 0) {
        umount(root.c_str());
        GTEST_SKIP() << "cannot mount a read-only folder here";
    }
    const auto get = host.Cli({"system", "welcomemsg", "get"});
    const auto set = host.Cli({"system", "welcomemsg", "set", "-m", "thawed"});
    umount(root.c_str());
    EXPECT_EQ(get.status, 0) << get.err;
    EXPECT_EQ(get.out, "frozen\n");
    EXPECT_EQ(set.status, 1);
    EXPECT_EQ(set.err,
              "Error: host store " + root + "/host.db: attempt to write a readonly database\n");
}

}  // namespace

// What only reads writes nothing: help and the command list make no host, and a getter leaves
// the store's database and log as it found them, even when the log holds changes not yet folded
// back into the database.
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <sys/stat.h>

#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "hostsim/core/Store.h"
#include "support/BuildTree.h"
#include "support/TestHost.h"

namespace {

namespace fs = std::filesystem;

struct FileState {
    std::string bytes;
    int64_t modifiedNs = 0;
    bool operator==(const FileState&) const = default;
};

FileState StateOf(const fs::path& file) {
    FileState state;
    std::ostringstream bytes;
    bytes << std::ifstream(file, std::ios::binary).rdbuf();
    state.bytes = bytes.str();
    struct stat info {};
    if (stat(file.c_str(), &info) == 0) {
        state.modifiedNs = int64_t{info.st_mtim.tv_sec} * 1'000'000'000 + info.st_mtim.tv_nsec;
    }
    return state;
}

TEST(ReadOnly, HelpAndListingsMakeNoHost) {
    BrixTest::TempHost host;
    const fs::path none = host.Root() / "no-host-here";
    for (const std::vector<std::string>& args : {std::vector<std::string>{"--help"},
                                                 {"--list-commands"},
                                                 {"--completion", "bash"},
                                                 {"--reference"},
                                                 {"--version"},
                                                 {"system", "uuid", "get", "--help"}}) {
        std::vector<std::string> argv = {"env", "BRIX_HOST_ROOT=" + none.string(),
                                         (BrixTest::BinDir() / "brixcli").string()};
        argv.insert(argv.end(), args.begin(), args.end());
        EXPECT_EQ(BrixTest::Run(argv).status, 0) << args[0];
        EXPECT_FALSE(fs::exists(none)) << args[0];
    }
}

TEST(ReadOnly, GetterLeavesDatabaseAndLogAsTheyWere) {
    BrixTest::TempHost host;
    BrixSim::Store::Close();
    // Another reader stays open while a change is committed, so the change stays in the log.
    sqlite3* reader = nullptr;
    ASSERT_EQ(sqlite3_open((host.Root() / "host.db").c_str(), &reader), SQLITE_OK);
    sqlite3_db_config(reader, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 1, nullptr);
    ASSERT_EQ(sqlite3_exec(reader, "SELECT count(*) FROM host", nullptr, nullptr, nullptr),
              SQLITE_OK);
    ASSERT_EQ(host.Cli({"system", "welcomemsg", "set", "-m", "in the log"}).status, 0);
    sqlite3_close(reader);
    ASSERT_GT(fs::file_size(host.Root() / "host.db-wal"), 0u);

    const auto database = StateOf(host.Root() / "host.db");
    const auto log = StateOf(host.Root() / "host.db-wal");
    for (const std::vector<std::string>& getter :
         {std::vector<std::string>{"system", "welcomemsg", "get"},
          {"system", "uuid", "get"},
          {"--formatter=json", "system", "settings", "advanced", "list"}}) {
        const auto run = host.Cli(getter);
        EXPECT_EQ(run.status, 0) << run.err;
    }
    EXPECT_EQ(host.Cli({"system", "welcomemsg", "get"}).out, "in the log\n");
    EXPECT_TRUE(StateOf(host.Root() / "host.db") == database);
    EXPECT_TRUE(StateOf(host.Root() / "host.db-wal") == log);
}

}  // namespace

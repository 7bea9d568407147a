// `system coredump file`: real dump files on the simulated datastores, the removal rules and
// the listing of configured files the datastore scan misses.
#include <sys/stat.h>

#include <filesystem>
#include <fstream>

#include "Helpers.h"

namespace {

using namespace CoredumpTest;
namespace fs = std::filesystem;

constexpr const char* kSeeded = "/datastores/ds-local-01/coredump/coredump-1.dumpfile";
constexpr const char* kUnknownReads = "/datastores/ds-shared-02/coredump/coredump-1.dumpfile";
constexpr int64_t kDefaultBytes = 768LL * 1024 * 1024;  // for the seeded 128 GiB of memory
constexpr const char* kSmartMessage = "--smart can be specified only with --enable=true.";

fs::path OnDisk(const BrixTest::TempHost& host, const std::string& hostPath) {
    return host.Root() / hostPath.substr(1);
}

json FileRow(const std::string& path, bool active, bool configured, int64_t size) {
    return {{"Path", path}, {"Active", active}, {"Configured", configured}, {"Size", size}};
}

TEST(File, SetValidationMessagesInOrderChangeNothing) {
    BrixTest::TempHost host;
    const std::pair<std::vector<std::string>, std::string> cases[] = {
        {{"-e", "true", "-p", kSeeded},
         "--enable cannot be combined with --path or --unconfigure."},
        {{"-e", "true", "-u"}, "--enable cannot be combined with --path or --unconfigure."},
        {{"-s", "-p", kSeeded, "-u"}, kSmartMessage},
        {{"-p", kSeeded, "-u"}, "--unconfigure cannot be combined with --path."},
        {{}, "Please specify an action. Run with --help for details."},
        {{"-e", "false", "-s"}, kSmartMessage},
    };
    const size_t before = host.Journal().size();
    for (const auto& [args, message] : cases) {
        auto words = args;
        words.insert(words.begin(), {"file", "set"});
        SCOPED_TRACE(testing::PrintToString(args));
        ExpectFailure(Coredump(host, words), message);
    }
    EXPECT_EQ(CallsSince(host, before), std::vector<std::string>{});
}

TEST(File, SetActionsAndTheirCalls) {
    BrixTest::TempHost host;
    size_t before = host.Journal().size();
    ASSERT_EQ(Coredump(host, {"file", "set", "-u"}).status, 0);
    EXPECT_EQ(Short(CallsSince(host, before)),
              (std::vector<std::string>{"DeactivateDiagnosticFile", "UnconfigureDiagnosticFile"}));
    EXPECT_EQ(json::parse(Coredump(host, {"file", "get"}).out),
              json({{"Active", ""}, {"Configured", ""}}));
    ExpectFailure(Coredump(host, {"file", "set", "-e", "true"}), "No dump file is configured.");

    // Smart activation takes the first usable file; the configuration stays empty.
    ASSERT_EQ(Coredump(host, {"file", "set", "-e", "true", "-s"}).status, 0);
    EXPECT_EQ(json::parse(Coredump(host, {"file", "get"}).out),
              json({{"Active", kSeeded}, {"Configured", ""}}));

    before = host.Journal().size();
    ASSERT_EQ(Coredump(host, {"file", "set", "-p", kUnknownReads}).status, 0);
    EXPECT_EQ(LastCall(host, "KernCtl::Storage::StorageInfoImpl::SetDiagnosticFile")["args"],
              json({kUnknownReads, true}));
    EXPECT_EQ(json::parse(Coredump(host, {"file", "get"}).out),
              json({{"Active", kUnknownReads}, {"Configured", kUnknownReads}}));
    ExpectFailure(Coredump(host, {"file", "set", "-p", "/datastores/ds-local-01/none.dumpfile"}),
                  "Dump file /datastores/ds-local-01/none.dumpfile does not exist or is not a "
                  "valid dump file.");
}

TEST(File, AddCreatesSparseFilesThatListShows) {
    BrixTest::TempHost host;
    auto add = Coredump(host, {"file", "add"});
    ASSERT_EQ(add.status, 0) << add.err;
    EXPECT_EQ(add.out, "true\n");
    // The first datastore is too full for the default size; the next one has room.
    const std::string created = "/datastores/ds-local-01/coredump/coredump-2.dumpfile";
    EXPECT_EQ(LastCall(host, "KernCtl::Storage::StorageInfoImpl::CreateDiagnosticFile")["args"],
              json({0, "", "", false, created}));
    struct stat st {};
    ASSERT_EQ(::stat(OnDisk(host, created).c_str(), &st), 0);
    EXPECT_EQ(st.st_size, kDefaultBytes);
    EXPECT_LT(st.st_blocks * 512, 1024 * 1024) << "dump files are sparse";

    ASSERT_EQ(Coredump(host, {"file", "add", "-s", "100", "-d", "ds-shared-02", "-f", "spare", "-e",
                              "true"})
                  .status,
              0);
    const std::string spare = "/datastores/ds-shared-02/coredump/spare.dumpfile";
    auto list = Coredump(host, {"file", "list"});
    ASSERT_EQ(list.status, 0) << list.err;
    EXPECT_EQ(json::parse(list.out),
              json::array({FileRow(kSeeded, false, false, kDefaultBytes),
                           FileRow(created, false, false, kDefaultBytes),
                           FileRow(kUnknownReads, false, false, kDefaultBytes),
                           FileRow(spare, true, true, 100LL * 1024 * 1024)}));
}

TEST(File, AddRefusals) {
    BrixTest::TempHost host;
    const std::pair<std::vector<std::string>, std::string> cases[] = {
        {{"-d", "ds-nowhere"}, "Datastore ds-nowhere not found."},
        {{"-d", "ds-archive"},
         "Insufficient space on datastore ds-archive: 768 MB needed, 544 MB free."},
        {{"-s", "99999999"}, "No datastore has 99999999 MB free for a dump file."},
        {{"-f", "../escape"}, "Invalid dump file name '../escape'."},
        {{"-f", "coredump-1", "-d", "ds-local-01"},
         std::string("Dump file ") + kSeeded + " already exists."},
    };
    for (const auto& [args, message] : cases) {
        auto words = args;
        words.insert(words.begin(), {"file", "add"});
        SCOPED_TRACE(testing::PrintToString(args));
        ExpectFailure(Coredump(host, words), message);
    }
    EXPECT_EQ(json::parse(Coredump(host, {"file", "list"}).out).size(), 2u);
}

TEST(File, AutoAddOnlyWithoutFilesAndWithTheKernelOption) {
    BrixTest::TempHost host;
    ASSERT_EQ(Coredump(host, {"file", "add", "-a"}).status, 0);
    EXPECT_EQ(json::parse(Coredump(host, {"file", "list"}).out).size(), 2u);

    ASSERT_EQ(Coredump(host, {"file", "set", "-u"}).status, 0);
    fs::remove(OnDisk(host, kSeeded));
    fs::remove(OnDisk(host, kUnknownReads));
    SetHostValues(host, {{"coredump.autoCreateDumpFile", "0"}});
    ASSERT_EQ(Coredump(host, {"file", "add", "-a"}).status, 0);
    EXPECT_EQ(json::parse(Coredump(host, {"file", "list"}).out), json::array());

    SetHostValues(host, {{"coredump.autoCreateDumpFile", "1"}});
    ASSERT_EQ(Coredump(host, {"file", "add", "--auto", "-e", "true"}).status, 0);
    EXPECT_EQ(json::parse(Coredump(host, {"file", "get"}).out),
              json({{"Active", kSeeded}, {"Configured", kSeeded}}));
}

TEST(File, RemoveOfActiveFileNeedsForce) {
    BrixTest::TempHost host;
    const size_t before = host.Journal().size();
    ExpectFailure(Coredump(host, {"file", "remove"}),
                  std::string("Dump file ") + kSeeded + " currently active, --force is required.");
    EXPECT_EQ(CallsSince(host, before), std::vector<std::string>{});
    EXPECT_TRUE(fs::exists(OnDisk(host, kSeeded)));

    auto forced = Coredump(host, {"file", "remove", "-F"});
    ASSERT_EQ(forced.status, 0) << forced.err;
    EXPECT_EQ(Short(CallsSince(host, before)),
              (std::vector<std::string>{"DeactivateDiagnosticFile", "UnconfigureDiagnosticFile"}));
    EXPECT_FALSE(fs::exists(OnDisk(host, kSeeded)));
    bool unlinked = false;
    for (const auto& record : host.Journal()) {
        if (record["kind"] == "unlink" && record["path"] == kSeeded) unlinked = true;
    }
    EXPECT_TRUE(unlinked);
    EXPECT_EQ(json::parse(Coredump(host, {"file", "get"}).out),
              json({{"Active", ""}, {"Configured", ""}}));
}

TEST(File, RemoveOfConfiguredUnreadFileUnconfiguresThenStops) {
    BrixTest::TempHost host;
    ASSERT_EQ(
        Coredump(host, {"file", "add", "-s", "64", "-d", "ds-local-01", "-f", "fresh"}).status, 0);
    const std::string fresh = "/datastores/ds-local-01/coredump/fresh.dumpfile";
    ASSERT_EQ(Coredump(host, {"file", "set", "-p", fresh}).status, 0);
    ASSERT_EQ(Coredump(host, {"file", "set", "-e", "false"}).status, 0);
    const size_t before = host.Journal().size();
    ExpectFailure(Coredump(host, {"file", "remove"}),
                  "Dump file " + fresh + " not read yet; Use --force to override check.");
    EXPECT_EQ(Short(CallsSince(host, before)),
              std::vector<std::string>{"UnconfigureDiagnosticFile"});
    EXPECT_TRUE(fs::exists(OnDisk(host, fresh)));
    EXPECT_EQ(json::parse(Coredump(host, {"file", "get"}).out),
              json({{"Active", ""}, {"Configured", ""}}));
}

TEST(File, RemoveChecksReadCountsUnlessForced) {
    BrixTest::TempHost host;
    ExpectFailure(Coredump(host, {"file", "remove", "--file", kUnknownReads}),
                  std::string("Dump file ") + kUnknownReads +
                      " read count could not be determined; Use --force to override check.");
    EXPECT_TRUE(fs::exists(OnDisk(host, kUnknownReads)));
    ASSERT_EQ(Coredump(host, {"file", "remove", "-F", "-f", kUnknownReads}).status, 0);
    EXPECT_FALSE(fs::exists(OnDisk(host, kUnknownReads)));

    // The seeded file was read once: once inactive it goes without --force.
    ASSERT_EQ(Coredump(host, {"file", "set", "-e", "false"}).status, 0);
    auto run = Coredump(host, {"file", "remove"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_FALSE(fs::exists(OnDisk(host, kSeeded)));
    ExpectFailure(Coredump(host, {"file", "remove"}), "No configured file to remove.");
    ExpectFailure(Coredump(host, {"file", "remove", "-F", "-f", "/datastores/missing.dumpfile"}),
                  "Unlink of file /datastores/missing.dumpfile failed: No such file or directory");
}

TEST(File, ListShowsConfiguredAndActiveFilesTheScanMisses) {
    BrixTest::TempHost host;
    const std::string folder = "/datastores/ds-local-01/manual";
    fs::create_directories(OnDisk(host, folder));
    for (const char* name : {"a.dumpfile", "b.dumpfile"}) {
        std::ofstream(OnDisk(host, folder + "/" + name)) << "dump";
    }
    // Configured and active the same file: listed once, at the end.
    ASSERT_EQ(Coredump(host, {"file", "set", "-p", folder + "/a.dumpfile"}).status, 0);
    auto list = json::parse(Coredump(host, {"file", "list"}).out);
    ASSERT_EQ(list.size(), 3u);
    EXPECT_EQ(list[2], FileRow(folder + "/a.dumpfile", true, true, 4));

    // Configured and active differ: the configured one first, then the active one.
    SetHostValues(host, {{"coredump.file.configured", folder + "/b.dumpfile"}});
    list = json::parse(Coredump(host, {"file", "list"}).out);
    ASSERT_EQ(list.size(), 4u);
    EXPECT_EQ(list[2], FileRow(folder + "/b.dumpfile", false, true, 4));
    EXPECT_EQ(list[3], FileRow(folder + "/a.dumpfile", true, false, 4));

    // A configured file that no longer exists is not shown.
    fs::remove(OnDisk(host, folder + "/b.dumpfile"));
    EXPECT_EQ(json::parse(Coredump(host, {"file", "list"}).out).size(), 3u);
}

TEST(File, ListIgnoresUnreadableTargetsAndReportsScanFaults) {
    BrixTest::TempHost host;
    host.Fault("KernCtl::Storage::StorageInfoImpl::GetConfiguredDiagnosticFile", "x");
    auto run = Coredump(host, {"file", "list"});
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.err, "");
    EXPECT_EQ(json::parse(run.out)[0], FileRow(kSeeded, true, false, kDefaultBytes));

    BrixTest::TempHost other;
    other.Fault("KernCtl::Storage::StorageInfoImpl::GetPotentialDiagnosticFiles", "scan failed");
    ExpectFailure(Coredump(other, {"file", "list"}), "scan failed");
    other.Fault("KernCtl::Storage::StorageInfoImpl::CreateDiagnosticFile", "no room");
    ExpectFailure(Coredump(other, {"file", "add"}), "no room");
    other.Fault("KernCtl::Storage::StorageInfoImpl::GetDumpFileReadCount", "busy");
    ExpectFailure(Coredump(other, {"file", "remove", "-f", kUnknownReads}), "busy");
}

}  // namespace

// The brixsim tool: init, faults, export and import, feature switches, usage errors.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <sstream>

#include "hostsim/core/Store.h"
#include "support/BuildTree.h"
#include "support/TestHost.h"

namespace {

namespace fs = std::filesystem;
using BrixSim::Store;
using BrixTest::TempHost;

TEST(Brixsim, InitRefusesAnExistingHostUnlessForced) {
    TempHost host;
    const fs::path root = host.Root() / "fresh";
    auto first = host.Sim({"--root", root.string(), "init"});
    ASSERT_EQ(first.status, 0) << first.err;
    EXPECT_EQ(first.out, "Seeded host at " + root.string() + "\n");

    auto again = host.Sim({"init", "--root", root.string()});
    EXPECT_EQ(again.status, 1);
    EXPECT_EQ(again.err, "brixsim: a host already exists at " + root.string() +
                             "; use init --force to recreate it\n");

    ASSERT_EQ(host.Sim({"--root", root.string(), "feature", "set", "7", "on"}).status, 0);
    fs::create_directories(root / "leftover/dir");
    fs::remove(root / "etc/ostrel/snmp.xml");
    auto forced = host.Sim({"--root", root.string(), "init", "--force"});
    ASSERT_EQ(forced.status, 0) << forced.err;
    // What the host made is made afresh; what it did not make stays, and stays the user's.
    EXPECT_TRUE(fs::exists(root / "etc/ostrel/snmp.xml"));
    EXPECT_TRUE(fs::exists(root / "leftover/dir"));
    EXPECT_EQ(host.Sim({"--root", root.string(), "feature", "get", "7"}).out, "off\n");
    fs::remove_all(root / "leftover");
    ASSERT_EQ(host.Sim({"--root", root.string(), "init", "--force"}).status, 0);
    EXPECT_FALSE(fs::exists(root / "leftover"));
}

// brixsim makes a host only where it cannot destroy anything: never in /, never in a folder
// of someone else's files, and an empty --root is no folder at all.
TEST(Brixsim, RefusesFoldersThatAreNotHosts) {
    TempHost host;
    const fs::path mine = host.Root() / "mine";
    fs::create_directories(mine);
    std::ofstream(mine / "notes.txt") << "keep";
    struct Case {
        std::vector<std::string> args;
        int status;
        std::string err;  // its first line
    };
    const Case cases[] = {
        {{"--root", mine.string(), "init"},
         1,
         "brixsim: host store: " + mine.string() +
             " holds files but no host; a host is made only in an empty or new folder"},
        {{"--root", mine.string(), "init", "--force"},
         1,
         "brixsim: host store: " + mine.string() +
             " holds files but no host; a host is made only in an empty or new folder"},
        {{"--root", "/", "init"},
         1,
         "brixsim: host store: / cannot be a host root: name a folder of its own"},
        {{"--root", "", "init"}, 2, "brixsim: --root needs a folder"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.args[1]);
        const auto run = host.Sim(c.args);
        EXPECT_EQ(run.status, c.status);
        EXPECT_EQ(run.err.substr(0, run.err.find('\n')), c.err);
    }
    EXPECT_EQ(std::vector<fs::path>(fs::directory_iterator(mine), fs::directory_iterator()),
              std::vector<fs::path>{mine / "notes.txt"});
}

TEST(Brixsim, FaultsAreArmedCountedAndCleared) {
    TempHost host;
    const std::string op = "HostCtl::HostFactory::GetHost";
    ASSERT_EQ(host.Sim({"fault", "set", op, "No host", "--times", "3", "--detail", "d"}).status, 0);
    ASSERT_EQ(host.Sim({"fault", "set", "KernCtl::Util::Sysinfo::List", "Down"}).status, 0);
    EXPECT_EQ(host.Sim({"fault", "list"}).out,
              "{\"op\":\"HostCtl::HostFactory::GetHost\",\"message\":\"No host\",\"detail\":\"d\","
              "\"remaining\":3}\n"
              "{\"op\":\"KernCtl::Util::Sysinfo::List\",\"message\":\"Down\",\"detail\":null,"
              "\"remaining\":null}\n");
    // Arming again replaces the fault.
    ASSERT_EQ(host.Sim({"fault", "set", op, "Gone"}).status, 0);
    EXPECT_THROW(Store::Get().Check(BrixSim::Operation::Named(op)), std::exception);
    EXPECT_THROW(Store::Get().Check(BrixSim::Operation::Named(op)),
                 std::exception);  // until cleared
    ASSERT_EQ(host.Sim({"fault", "clear", op}).status, 0);
    EXPECT_NO_THROW(Store::Get().Check(BrixSim::Operation::Named(op)));
    EXPECT_THROW(Store::Get().Check(BrixSim::Operation::Named("KernCtl::Util::Sysinfo::List")),
                 std::exception);
    ASSERT_EQ(host.Sim({"fault", "clear"}).status, 0);
    EXPECT_EQ(host.Sim({"fault", "list"}).out, "");
    // Faults arm nothing in the journal.
    EXPECT_TRUE(host.Journal().empty());
}

TEST(Brixsim, FaultOpsListsRegisteredOperationsSorted) {
    TempHost host;
    const auto result = host.Sim({"fault", "ops"});
    ASSERT_EQ(result.status, 0);
    std::vector<std::string> ops;
    std::istringstream lines(result.out);
    for (std::string line; std::getline(lines, line);) ops.push_back(line);
    EXPECT_TRUE(std::is_sorted(ops.begin(), ops.end()));
    EXPECT_EQ(std::adjacent_find(ops.begin(), ops.end()), ops.end());
    for (const char* op : {"HostCtl::HostFactory::GetHost", "KernCtl::Util::Sysinfo::Get",
                           "KernCtl::Util::Sysinfo::List"}) {
        EXPECT_NE(std::find(ops.begin(), ops.end(), op), ops.end()) << op;
    }
}

TEST(Brixsim, WrongInvocationsExitTwoWithUsage) {
    TempHost host;
    const std::vector<std::vector<std::string>> wrong = {
        {},
        {"frobnicate"},
        {"fault"},
        {"fault", "set", "HostCtl::HostFactory::GetHost"},
        {"fault", "set", "HostCtl::HostFactory::GetHost", "m", "--times", "0"},
        {"fault", "set", "HostCtl::HostFactory::GetHost", "m", "--times", "two"},
        {"fault", "set", "HostCtl::HostFactory::GetHost", "m", "--bogus"},
        {"feature", "set", "256", "on"},
        {"feature", "set", "120", "maybe"},
        {"feature", "get"},
        {"import"},
        {"export", "extra"},
        {"journal", "--all"},
    };
    for (const auto& args : wrong) {
        const auto result = host.Sim(args);
        EXPECT_EQ(result.status, 2) << testing::PrintToString(args);
        EXPECT_NE(result.err.find("Usage: brixsim"), std::string::npos);
        EXPECT_EQ(result.out, "");
    }
    const auto unknown = host.Sim({"fault", "set", "No::Such::Op", "m"});
    EXPECT_EQ(unknown.status, 1);
    EXPECT_EQ(unknown.err,
              "brixsim: unknown operation No::Such::Op (brixsim fault ops lists them)\n");
    EXPECT_EQ(host.Sim({"--help"}).status, 0);
}

TEST(Brixsim, ExportImportRoundTrip) {
    TempHost host;
    Store::Get().SetValue("system.hostname", "brix-07");
    Store::Get().Journal("sleep", {{"seconds", int64_t{1}}});
    ASSERT_EQ(host.Sim({"feature", "set", "120", "on"}).status, 0);
    const auto before = host.Export();
    EXPECT_EQ(before["version"], 2);
    EXPECT_FALSE(before["tables"].contains("meta"));
    ASSERT_TRUE(before["tables"].contains("host"));
    ASSERT_TRUE(before["tables"].contains("journal"));

    // Change things, then bring the exported state back.
    Store::Get().SetValue("system.hostname", "other");
    Store::Get().SetValue("extra.key", "x");
    ASSERT_EQ(host.Sim({"feature", "set", "120", "off"}).status, 0);
    host.Import(before);
    EXPECT_EQ(host.Export(), before);
    EXPECT_EQ(Store::Get().GetValue("system.hostname", ""), "brix-07");
    EXPECT_FALSE(Store::Get().GetValue("extra.key").has_value());

    // The same document into a brand-new host gives the same state.
    TempHost other;
    other.Import(before);
    EXPECT_EQ(other.Export(), before);
}

TEST(Brixsim, ImportReplacesOnlyTheTablesGiven) {
    TempHost host;
    Store::Get().SetValue("kept", "yes");
    host.Import({{"features", {{{"entry", 120}, {"state", true}}}}});
    EXPECT_EQ(host.Sim({"feature", "get", "120"}).out, "on\n");
    EXPECT_EQ(host.Sim({"feature", "get", "0"}).out, "off\n");
    EXPECT_EQ(host.Export()["tables"]["features"].size(), 1u);
    EXPECT_EQ(Store::Get().GetValue("kept", ""), "yes");
}

TEST(Brixsim, BadImportsChangeNothing) {
    TempHost host;
    Store::Get().SetValue("kept", "yes");
    const auto before = host.Export();
    const fs::path file = host.Root().string() + "-state.json";
    struct Case {
        std::string document;
        std::string error;
    };
    const Case cases[] = {
        {R"({"version":1,"tables":{"host":[],"nosuch":[]}})", "unknown table \"nosuch\""},
        {R"({"version":1,"tables":{"host":[{"key":"a","value":"b","colour":"red"}]}})",
         "table \"host\" row 0: unknown column \"colour\""},
        {R"({"version":1,"tables":{"meta":[]}})", "unknown table \"meta\""},
        {R"({"version":3,"tables":{}})",
         "\"version\" must be 1 (tables only) or 2 (the whole host)"},
        {R"({"version":2,"tables":{}})", "\"files\" is missing"},
        // Files that would leave the root, or that cannot be written as given.
        {R"({"version":2,"tables":{},"files":[{"path":"../x","type":"folder","mode":"0755"}]})",
         "file entry 0: \"path\" must be a relative path of plain names"},
        {R"({"version":2,"tables":{},"files":[{"path":"/etc","type":"folder","mode":"0755"}]})",
         "file entry 0: \"path\" must be a relative path of plain names"},
        {R"({"version":2,"tables":{},"files":[{"path":"out","type":"link","target":"../../etc"}]})",
         "file entry 0: a link must point inside the host"},
        {R"({"version":2,"tables":{},"files":[{"path":"host.db","type":"file","mode":"0644","size":0,"extents":[]}]})",
         "file entry 0: host.db belongs to the store"},
        {R"({"version":2,"tables":{},"files":[{"path":"a","type":"file","mode":"0644","size":2,"extents":[{"offset":0,"base64":"QUJD"}]}]})",
         "file entry 0: an extent lies beyond the file's size"},
        {R"({"version":2,"tables":{},"files":[{"path":"a","type":"file","mode":"0644","size":9,"extents":[{"offset":0,"base64":"Q!=="}]}]})",
         "file entry 0: an extent's data is not base64"},
        {R"({"version":2,"tables":{},"files":[{"path":"a/b","type":"file","mode":"0644","size":0,"extents":[]}]})",
         "a/b is not in a folder of the document"},
        {R"({"version":2,"tables":{},"files":[{"path":"a","type":"file","mode":"rw","size":0,"extents":[]}]})",
         "file entry 0: \"mode\" must be an octal text such as \"0644\""},
        {R"({"version":1,"tables":{"host":{}}})", "table \"host\" is not an array of rows"},
        {R"({"version":1,"tables":{"host":[{"key":"a","value":[1]}]}})",
         "table \"host\" row 0 column \"value\": not a scalar value"},
        // Rows that break a constraint fail in the middle of the transaction.
        {R"({"version":1,"tables":{"host":[{"key":"a","value":"1"},{"key":"a","value":"2"}]}})",
         "UNIQUE constraint failed: host.key"},
        {R"({"version":1,"tables":{"features":[{"entry":300,"state":1}]}})",
         "CHECK constraint failed"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.document);
        std::ofstream(file, std::ios::trunc) << c.document;
        const auto result = host.Sim({"import", file.string()});
        EXPECT_EQ(result.status, 1);
        EXPECT_EQ(result.err.rfind("brixsim: import refused, nothing changed: ", 0), 0u)
            << result.err;
        EXPECT_NE(result.err.find(c.error), std::string::npos) << result.err;
        EXPECT_EQ(host.Export(), before);
    }
    std::ofstream(file, std::ios::trunc) << "{not json";
    EXPECT_EQ(host.Sim({"import", file.string()}).status, 1);
    EXPECT_EQ(host.Sim({"import", (host.Root() / "missing.json").string()}).status, 1);
    EXPECT_EQ(host.Export(), before);
    fs::remove(file);
}

TEST(Brixsim, ImportReadsStandardInput) {
    TempHost host;
    const auto result =
        BrixTest::Run({(BrixTest::BinDir() / "brixsim").string(), "import", "-"},
                      R"({"version":1,"tables":{"host":[{"key":"from","value":"stdin"}]}})");
    ASSERT_EQ(result.status, 0) << result.err;
    EXPECT_EQ(Store::Get().GetValue("from", ""), "stdin");
}

}  // namespace

// Rows a listing command prints as JSON.
size_t Listed(const TempHost& host, const std::vector<std::string>& command) {
    std::vector<std::string> args{"--formatter=json"};
    args.insert(args.end(), command.begin(), command.end());
    const auto run = host.Cli(args);
    EXPECT_EQ(run.status, 0) << run.err;
    return nlohmann::json::parse(run.out).size();
}

TEST(Brixsim, InitScaleGrowsEveryAreasTableToTheCountGiven) {
    TempHost host;
    const size_t seededWorlds = Listed(host, {"system", "process", "list"});
    const size_t seededOptions = Listed(host, {"system", "settings", "advanced", "list"});
    const size_t seededModules = Listed(host, {"system", "module", "list"});
    ASSERT_GT(seededWorlds, 5u);
    ASSERT_GT(seededOptions, 5u);
    ASSERT_LT(seededModules, 60u);
    // Below the seeded count a table keeps its seeded rows; the keys come in any order.
    auto init = host.Sim({"init", "--force", "--scale",
                          "modules=60,worlds=" + std::to_string(seededWorlds + 40) + ",options=5"});
    ASSERT_EQ(init.status, 0) << init.err;
    EXPECT_EQ(init.out, "Seeded host at " + host.Root().string() + "\n");

    EXPECT_EQ(Listed(host, {"system", "process", "list"}), seededWorlds + 40);
    EXPECT_EQ(Listed(host, {"system", "module", "list"}), 60u);
    EXPECT_EQ(Listed(host, {"system", "settings", "advanced", "list"}), seededOptions);

    // The added rows read back like seeded ones.
    const auto worlds = host.Cli({"--formatter=json", "system", "process", "list"});
    const auto last = nlohmann::json::parse(worlds.out).back();
    EXPECT_EQ(last["Name"], "jobrunner-" + std::to_string(seededWorlds + 39));
    EXPECT_EQ(last["Command Line"],
              "/usr/lib/brix/bin/jobrunner --slot " + std::to_string(seededWorlds + 39));
    EXPECT_EQ(last["Security Domain"], "shellTools");
    EXPECT_EQ(last["Cartel Id"].get<int64_t>() + 1, last["Id"].get<int64_t>());

    ASSERT_EQ(host.Sim({"init", "--force", "--scale", "options=1000"}).status, 0);
    const auto options = host.Cli({"--formatter=json", "system", "settings", "advanced", "list",
                                   "--tree", "LoadTest/Group0"});
    ASSERT_EQ(options.status, 0) << options.err;
    const auto group = nlohmann::json::parse(options.out);
    // What the seeded options leave of the thousand, all in the first branch of a thousand.
    ASSERT_EQ(group.size(), 1000 - seededOptions);
    EXPECT_EQ(group[0]["Path"], "/LoadTest/Group0/Option0");
    EXPECT_EQ(group.back()["Path"],
              "/LoadTest/Group0/Option" + std::to_string(1000 - seededOptions - 1));
    EXPECT_EQ(Listed(host, {"system", "settings", "advanced", "list"}), 1000u);
    EXPECT_EQ(Listed(host, {"system", "module", "list"}), seededModules);
}

TEST(Brixsim, InitScaleRefusesBadKeysAndNumbersBeforeCreatingAnything) {
    TempHost host;
    const fs::path root = host.Root() / "never";
    const std::vector<std::pair<std::vector<std::string>, std::string>> cases = {
        {{"--scale"}, "init: --scale needs KEY=N,..."},
        {{"--scale", "worlds"}, "init --scale: expected KEY=N, got \"worlds\""},
        {{"--scale", "frogs=3"}, "init --scale: unknown key \"frogs\""},
        {{"--scale", "worlds=0"},
         "init --scale: worlds must be a whole number from 1 to 10000000, got \"0\""},
        {{"--scale", "worlds=10000001"},
         "init --scale: worlds must be a whole number from 1 to 10000000, got \"10000001\""},
        {{"--scale", "options=-5"},
         "init --scale: options must be a whole number from 1 to 10000000, got \"-5\""},
        {{"--scale", "modules=1e3"},
         "init --scale: modules must be a whole number from 1 to 10000000, got \"1e3\""},
        {{"--scale", "worlds=3,worlds=4"}, "init --scale: worlds given twice"},
        {{"--scale", "worlds=3,"}, "init --scale: expected KEY=N,..., got \"worlds=3,\""},
        {{"--scale", ""}, "init --scale: expected KEY=N,..., got \"\""},
        {{"--scale", "worlds=3,frogs=1", "--force"}, "init --scale: unknown key \"frogs\""},
    };
    for (const auto& [words, message] : cases) {
        std::vector<std::string> args{"--root", root.string(), "init"};
        args.insert(args.end(), words.begin(), words.end());
        const auto result = host.Sim(args);
        EXPECT_EQ(result.status, 2) << message;
        EXPECT_EQ(result.err.substr(0, result.err.find('\n')), "brixsim: " + message);
        EXPECT_NE(result.err.find("Keys of init --scale:\n  modules"), std::string::npos);
        EXPECT_EQ(result.out, "");
        EXPECT_FALSE(fs::exists(root)) << message;
    }
    // A refused --force leaves the existing host as it was.
    ASSERT_EQ(host.Sim({"feature", "set", "9", "on"}).status, 0);
    EXPECT_EQ(host.Sim({"init", "--force", "--scale", "worlds=x"}).status, 2);
    EXPECT_EQ(host.Sim({"feature", "get", "9"}).out, "on\n");
}

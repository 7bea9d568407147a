// An export is the whole host: changed by every kind of change a command makes, exported,
// imported into a new root and exported again, it reads back the same, byte for byte, and every
// question a command can ask answers the same on both hosts.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <functional>
#include <sstream>
#include <string>
#include <vector>

#include "support/BuildTree.h"
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

// The entry of `path` among a document's files, or null.
nlohmann::json EntryOf(const nlohmann::json& files, const std::string& path) {
    for (const auto& entry : files) {
        if (entry["path"] == path) return entry;
    }
    return nullptr;
}

unsigned ModeOf(const fs::path& path) {
    struct stat info {};
    return ::lstat(path.c_str(), &info) == 0 ? info.st_mode & 07777 : 0;
}

// Writes `document` beside the host and imports it, through `shell` when given: a sh command
// line that runs "$0" (brixsim) with the arguments "$@".
BrixTest::RunResult ImportText(const BrixTest::TempHost& host, const std::string& document,
                               const std::string& shell = "exec \"$0\" \"$@\"") {
    const fs::path file = host.Root().string() + "-import.json";
    std::ofstream(file, std::ios::trunc) << document;
    auto result = BrixTest::Run(
        {"sh", "-c", shell, (BrixTest::BinDir() / "brixsim").string(), "import", file});
    fs::remove(file);
    return result;
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

    // The SNMP configuration is a secret and stays one; a dump file stays a hole.
    const auto files = nlohmann::json::parse(document.out)["files"];
    const auto snmp = EntryOf(files, "etc/ostrel/snmp.xml");
    EXPECT_EQ(snmp.value("secret", false), true);
    EXPECT_EQ(snmp["mode"], "0600");
    EXPECT_EQ(ModeOf(copy.Root() / "etc/ostrel/snmp.xml"), 0600u);
    EXPECT_EQ(EntryOf(files, "bin/mgmt-cmd").count("secret"), 0u);
    const auto dump = EntryOf(files, "datastores/ds-archive/coredump/extra.dumpfile");
    EXPECT_EQ(dump["size"], 100 << 20);
    EXPECT_EQ(dump["extents"], nlohmann::json::parse(R"([{"offset":0,"base64":"QlJYRFVNUDE="}])"));
    struct stat copied {};
    ASSERT_EQ(
        ::stat((copy.Root() / "datastores/ds-archive/coredump/extra.dumpfile").c_str(), &copied),
        0);
    EXPECT_EQ(copied.st_size, 100 << 20);
    EXPECT_LT(copied.st_blocks * 512, 1 << 20);
    // The engine id changed, so the boot state the new host was seeded with went.
    EXPECT_FALSE(fs::exists(copy.Root() / "var/tmp/snmp_boot.txt"));

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

// A file entry holding "abc", marked secret as an export marks it.
nlohmann::json FileEntry(const std::string& path, const std::string& mode = "0644") {
    nlohmann::json entry = {{"path", path},
                            {"type", "file"},
                            {"mode", mode},
                            {"size", 3},
                            {"extents", {{{"offset", 0}, {"base64", "YWJj"}}}}};
    if (mode == "0600") entry["secret"] = true;
    return entry;
}

struct Refusal {
    const char* what;
    std::function<void(nlohmann::json&)> spoil;  // of a document that would change the host
    std::string message;                         // after "import refused, nothing changed: "
};

TEST(Export, ImportRefusesABadDocumentWholeAndChangesNothing) {
    using nlohmann::json;
    auto front = [](json& document, const std::vector<json>& entries) {
        auto& files = document["files"];
        for (auto it = entries.rbegin(); it != entries.rend(); ++it)
            files.insert(files.begin(), *it);
    };
    const Refusal refusals[] = {
        {"unknown version", [](json& d) { d["version"] = 3; },
         "\"version\" must be 1 (tables only) or 2 (the whole host)"},
        {"version as text", [](json& d) { d["version"] = "2"; },
         "\"version\" must be 1 (tables only) or 2 (the whole host)"},
        {"unknown part", [](json& d) { d["comment"] = "x"; }, "the document has no \"comment\""},
        {"unknown table", [](json& d) { d["tables"]["nosuch"] = json::array(); },
         "unknown table \"nosuch\""},
        {"unknown column",
         [](json& d) {
             auto& rows = d["tables"]["host"];
             rows.insert(rows.begin(),
                         json::object({{"key", "k"}, {"value", "v"}, {"colour", "red"}}));
         },
         "table \"host\" row 0: unknown column \"colour\""},
        {"absolute path", [&](json& d) { front(d, {FileEntry("/etc/passwd")}); },
         "file entry 0: \"path\" must be a relative path of plain names"},
        {"climbing path", [&](json& d) { front(d, {FileEntry("tmp/../../x")}); },
         "file entry 0: \"path\" must be a relative path of plain names"},
        {"dot in path", [&](json& d) { front(d, {FileEntry("./tmp/x")}); },
         "file entry 0: \"path\" must be a relative path of plain names"},
        {"empty name", [&](json& d) { front(d, {FileEntry("tmp//x")}); },
         "file entry 0: \"path\" must be a relative path of plain names"},
        {"the store's file", [&](json& d) { front(d, {FileEntry("host.db-wal")}); },
         "file entry 0: host.db-wal belongs to the store"},
        {"link above the root",
         [&](json& d) {
             front(d, {{{"path", "var/up"}, {"type", "link"}, {"target", "../.."}}});
         },
         "file entry 0: a link must point inside the host"},
        {"link climbing past a name",
         [&](json& d) {
             front(d, {{{"path", "var/up"}, {"type", "link"}, {"target", "tmp/../../.."}}});
         },
         "file entry 0: a link must point inside the host"},
        {"absolute link",
         [&](json& d) {
             front(d, {{{"path", "var/up"}, {"type", "link"}, {"target", "/etc"}}});
         },
         "file entry 0: a link must point inside the host"},
        {"file under a link",
         [&](json& d) {
             front(d, {{{"path", "via"}, {"type", "link"}, {"target", "tmp"}}, FileEntry("via/x")});
         },
         "via/x is not in a folder of the document"},
        {"file outside any folder", [&](json& d) { front(d, {FileEntry("nowhere/x")}); },
         "nowhere/x is not in a folder of the document"},
        {"path twice",
         [&](json& d) {
             front(d, {FileEntry("twice"), FileEntry("twice")});
         },
         "file entry 1: twice given twice"},
        {"no type",
         [&](json& d) {
             front(d, {{{"path", "x"}, {"mode", "0644"}}});
         },
         "file entry 0: \"type\" must be file, folder or link"},
        {"not an object", [&](json& d) { front(d, {"tmp/x"}); }, "file entry 0 is not an object"},
        {"unknown key",
         [&](json& d) {
             json entry = FileEntry("x");
             entry["owner"] = "root";
             front(d, {entry});
         },
         "file entry 0: a file has no \"owner\""},
        {"mode not octal", [&](json& d) { front(d, {FileEntry("x", "0968")}); },
         "file entry 0: \"mode\" must be an octal text such as \"0644\""},
        {"secret others may read",
         [&](json& d) {
             json entry = FileEntry("x", "0640");
             entry["secret"] = true;
             front(d, {entry});
         },
         "file entry 0: a secret file must be readable by its owner only"},
        {"overlapping extents",
         [&](json& d) {
             json entry = FileEntry("x");
             entry["size"] = 9;
             entry["extents"].push_back({{"offset", 2}, {"base64", "YWJj"}});
             front(d, {entry});
         },
         "file entry 0: the extents overlap or are out of order"},
    };
    BrixTest::TempHost host;
    const auto before = host.Export();
    // Valid on its own: a row and a file more, and the SNMP configuration gone.
    json changed = before;
    changed["tables"]["host"].push_back({{"key", "refusal.probe"}, {"value", "x"}});
    changed["files"].push_back(FileEntry("tmp/probe"));
    for (auto& entry : changed["files"]) {
        if (entry["path"] == "etc/ostrel/snmp.xml")
            entry = FileEntry("etc/ostrel/snmp.xml", "0600");
    }
    std::sort(changed["files"].begin(), changed["files"].end(),
              [](const json& a, const json& b) { return a["path"] < b["path"]; });
    for (const auto& refusal : refusals) {
        SCOPED_TRACE(refusal.what);
        json document = changed;
        refusal.spoil(document);
        const auto result = ImportText(host, document.dump());
        EXPECT_EQ(result.status, 1);
        EXPECT_EQ(result.err,
                  "brixsim: import refused, nothing changed: " + refusal.message + "\n");
        EXPECT_TRUE(host.Export() == before) << "the host changed";
    }
    // The same document unspoilt is taken.
    const auto taken = ImportText(host, changed.dump());
    ASSERT_EQ(taken.status, 0) << taken.err;
    EXPECT_TRUE(host.Export() == changed) << "the export is not the document imported";
    std::ofstream("/tmp/dbg-changed.json") << changed.dump(1);
    std::ofstream("/tmp/dbg-after.json") << host.Export().dump(1);
}

TEST(Export, ImportNeverWritesThroughALinkOnTheHost) {
    BrixTest::TempHost host;
    const auto document = host.Sim({"export"});
    ASSERT_EQ(document.status, 0) << document.err;
    const fs::path outside = host.Root().string() + "-outside";
    fs::create_directories(outside);
    std::ofstream(outside / "snmp.xml") << "outside";
    // A folder and a file of the host replaced by links out of the root, and a stray file.
    fs::remove_all(host.Root() / "var/tmp");
    fs::create_directory_symlink(outside, host.Root() / "var/tmp");
    fs::remove(host.Root() / "etc/ostrel/snmp.xml");
    fs::create_symlink(outside / "snmp.xml", host.Root() / "etc/ostrel/snmp.xml");
    std::ofstream(host.Root() / "opt/stray") << "stray";

    const auto imported = ImportText(host, document.out);
    ASSERT_EQ(imported.status, 0) << imported.err;
    EXPECT_TRUE(host.Sim({"export"}).out == document.out) << "the export differs";
    EXPECT_TRUE(fs::is_directory(fs::symlink_status(host.Root() / "var/tmp")));
    EXPECT_EQ(ModeOf(host.Root() / "etc/ostrel/snmp.xml"), 0600u);
    std::vector<std::string> left;
    for (const auto& entry : fs::directory_iterator(outside)) {
        left.push_back(entry.path().filename().string());
    }
    EXPECT_EQ(left, std::vector<std::string>{"snmp.xml"});
    std::ifstream in(outside / "snmp.xml");
    EXPECT_EQ(std::string(std::istreambuf_iterator<char>(in), {}), "outside");
    fs::remove_all(outside);
}

TEST(Export, AFileThatCannotBeWrittenChangesNothing) {
    BrixTest::TempHost host;
    const auto before = host.Export();
    // New tables, a new SNMP configuration, and in a new folder a file larger than brixsim may
    // write under the file size limit it is run with.
    nlohmann::json document = before;
    document["tables"]["host"].push_back({{"key", "full.disk"}, {"value", "x"}});
    for (auto& entry : document["files"]) {
        if (entry["path"] == "etc/ostrel/snmp.xml")
            entry = FileEntry("etc/ostrel/snmp.xml", "0600");
    }
    document["files"].push_back({{"path", "vast"}, {"type", "folder"}, {"mode", "0755"}});
    document["files"].push_back({{"path", "vast/deeper"}, {"type", "folder"}, {"mode", "0755"}});
    nlohmann::json vast = FileEntry("vast/deeper/image");
    vast["size"] = int64_t{1} << 40;
    document["files"].push_back(vast);

    const auto result =
        ImportText(host, document.dump(), "trap '' XFSZ; ulimit -f 2097152; exec \"$0\" \"$@\"");
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(result.err, "brixsim: import refused, nothing changed: cannot size " +
                              (host.Root() / "vast/deeper/image").string() + ": File too large\n");
    EXPECT_TRUE(host.Export() == before) << "the host changed";
    EXPECT_FALSE(fs::exists(host.Root() / "vast"));
    for (const auto& entry : fs::recursive_directory_iterator(host.Root())) {
        EXPECT_EQ(entry.path().filename().string().find(".tmp-"), std::string::npos)
            << entry.path();
    }
}

TEST(Export, ANameThatIsNotUtf8IsRefusedNotAltered) {
    BrixTest::TempHost host;
    const auto files = host.Export()["files"];
    // The new name sorts right after its folder.
    const auto index = std::count_if(files.begin(), files.end(), [](const nlohmann::json& entry) {
        return entry["path"] <= "tmp";
    });
    std::ofstream(host.Root() / "tmp/q\xfe") << "x";
    const auto run = host.Sim({"export"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "brixsim: cannot export: the text at /files/" + std::to_string(index) +
                           "/path is not UTF-8\n");
    EXPECT_EQ(run.out, "");
}

}  // namespace

// Every platform operation that can fail, armed in every command that reaches it: the command
// reports the injected message the way its description says, with the right exit status, and
// never crashes, and a command that fails leaves the host's export as it was, but for what an
// earlier call of the command leaves standing (the failure table of docs/simulator.md). Which
// commands reach which operation is learned by tracing (BRIXSIM_TRACE_OPS) a table of sample
// invocations that covers every leaf of the command tree.
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <stdlib.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <filesystem>
#include <fstream>
#include <map>
#include <nlohmann/json.hpp>
#include <set>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "Robustness.h"
#include "hostsim/core/Store.h"
#include "support/TestHost.h"

namespace {

namespace fs = std::filesystem;
using BrixRobust::Words;
using BrixSim::Store;
using BrixTest::RunResult;
using BrixTest::TempHost;

// One invocation of the sweep: the command line, and command lines that bring the host into
// the state it needs first (run without faults, separated by ';').
struct Sample {
    const char* line;
    const char* setup = "";
};

constexpr const char* kNetdumpSetup =
    "system coredump network set -v vnic1 -j 127.0.0.1 -o 6599;"
    "system coredump network set -e true";
constexpr const char* kSnmpUsers =
    "system snmp set -a SHA1 -x AES128"
    " -u alice/0123456789abcdef0123456789abcdef01234567/fedcba9876543210fedcba9876543210/priv"
    " -R carol/SHA1/0123456789abcdef0123456789abcdef01234567/AES/fedcba9876543210fedcba9876543210"
    "/0x8000b7e504aabbccddeeff";

const std::vector<Sample>& Samples() {
    static const std::vector<Sample> samples = {
        {"system boot device get"},
        {"system settings kernel list"},
        {"system settings kernel list -o bootConsole"},
        {"system settings kernel list -d"},
        {"system settings kernel set -s bootVerbosity -v 3"},
        {"system settings advanced list"},
        {"system settings advanced list -d"},
        {"system settings advanced list -t /UserVars"},
        {"system settings advanced list -o /Cpu/IdleSpinUs"},
        {"system settings advanced list -o /Misc/HostName"},
        {"system settings advanced list -o /UserVars/SshSessionLimit"},
        {"system settings advanced list -o /UserVars/WebUiWelcomeMessage"},
        {"system settings advanced set -o /Cpu/IdleSpinUs -i 20"},
        {"system settings advanced set -o /Cpu/IdleSpinUs -d"},
        {"system settings advanced set -o /Misc/HostName -s node7"},
        {"system settings advanced set -o /Misc/HostName -d"},
        {"system settings advanced set -o /UserVars/SshSessionLimit -i 12"},
        {"system settings advanced set -o /UserVars/SshSessionLimit -d"},
        {"system settings advanced set -o /UserVars/WebUiWelcomeMessage -s hello"},
        {"system settings advanced set -o /UserVars/WebUiWelcomeMessage -d"},
        {"system settings keyboard layout get"},
        {"system settings keyboard layout set -l Belgian"},
        {"system settings keyboard layout set -l Belgian --no-persist"},
        {"system settings keyboard layout list"},
        {"system module get -m nvme_core"},
        {"system module parameters list -m nvme_core"},
        {"system module parameters set -m nvme_core -p io_queues=4"},
        {"system module parameters set -m nvme_core -p admin_timeout_ms=100 -a"},
        {"system module parameters set -m nvme_core -p io_queues=4 -f"},
        {"system module parameters copy -s qln_nic10g -t qln_nic25g -p rss_queues"},
        {"system module parameters copy -s qln_nic10g -t qln_nic25g -p rss_queues -f"},
        {"system module list"},
        {"system module list -l true -e false"},
        {"system module load -m cpu_hotplug"},
        {"system module load -m trace_buffer -f"},
        {"system module set -m trace_buffer -e true"},
        {"system module set -m trace_buffer -e true -f"},
        {"system coredump partition get"},
        {"system coredump partition list"},
        {"system coredump partition set -p naa.6000c29b7d03e145:2"},
        {"system coredump partition set -e true"},
        {"system coredump partition set -e true -s"},
        {"system coredump partition set -e false"},
        {"system coredump partition set -u"},
        {"system coredump network set -v vnic1 -j 127.0.0.1 -o 6599"},
        {"system coredump network set -v vnic0 -j ::1"},
        {"system coredump network set -v vnic1 -i 127.0.0.1"},
        {"system coredump network set -e true", kNetdumpSetup},
        {"system coredump network set -e false", kNetdumpSetup},
        {"system coredump network get", kNetdumpSetup},
        {"system coredump network check", kNetdumpSetup},
        {"system coredump file get"},
        {"system coredump file set -p /datastores/ds-shared-02/coredump/coredump-1.dumpfile"},
        {"system coredump file set -e true"},
        {"system coredump file set -e true -s"},
        {"system coredump file set -e false"},
        {"system coredump file set -u"},
        {"system coredump file add"},
        {"system coredump file add -d ds-archive -f extra -s 100 -e true"},
        {"system coredump file add -a"},
        {"system coredump file remove -F"},
        {"system coredump file remove -f /datastores/ds-shared-02/coredump/coredump-1.dumpfile"},
        {"system coredump file remove", "system coredump file set -e false"},
        {"system coredump file list"},
        {"system coredump dorna get"},
        {"system coredump dorna set -U b81f04d6-2e7c-4a93-9d58-16fa0c3e72ab"},
        {"system coredump dorna set -e true"},
        {"system coredump dorna set -e true -s"},
        {"system coredump dorna set -e false"},
        {"system coredump dorna set -u"},
        {"system coredump dorna add"},
        {"system coredump dorna add -s 200 -e true"},
        {"system coredump dorna add -a"},
        {"system coredump dorna remove -F"},
        {"system coredump dorna remove", "system coredump dorna set -e false"},
        {"system coredump dorna remove -u b81f04d6-2e7c-4a93-9d58-16fa0c3e72ab"},
        {"system coredump dorna list"},
        {"system secpolicy domain list"},
        {"system secpolicy domain set -n kernelCore -l permissive"},
        {"system secpolicy domain set -a -l permissive"},
        {"system process list"},
        {"system process stats load get"},
        {"system process stats running get"},
        {"system welcomemsg set -m 'Hello there'"},
        {"system welcomemsg get"},
        {"system quillfs get"},
        {"system quillfs ramdisk add -m 0 -M 16 -p 0755 -n scratch -t /scratch"},
        {"system quillfs ramdisk list"},
        {"system quillfs ramdisk remove -t /var/run/hostdiag"},
        {"system quillfs tardisk list"},
        {"system version get"},
        {"system time get"},
        {"system time set -y 2031 -M 5 -d 17 -H 8 -m 30 -s 0"},
        {"system time set -H 8"},
        {"system stats uptime get"},
        {"system stats installtime get"},
        {"system uuid get"},
        {"system hostname get"},
        {"system hostname set -H node7"},
        {"system hostname set -d lab.example"},
        {"system hostname set -H node7 -d lab.example"},
        {"system hostname set -f node7.lab.example"},
        {"system snmp get"},
        {"system snmp set -e true"},
        {"system snmp set -p 1161"},
        {"system snmp set -c public,ops"},
        {"system snmp set -t 127.0.0.1@6162/public"},
        {"system snmp set -y sensors -L 'Hall 3' -C 'ops desk' -l debug -n reset"},
        {"system snmp set -E 0x8000b7e50411223344"},
        {"system snmp set -a SHA1 -x AES128"},
        {"system snmp set -u alice/-/-/none"},
        {"system snmp set -R carol/SHA1/-/AES/-/0x8000b7e504aabbccddeeff"},
        {"system snmp set -i 127.0.0.1@6162/carol/priv/trap", kSnmpUsers},
        {"system snmp set -s false"},
        {"system snmp set -r"},
        {"system snmp test"},
        {"system snmp test -u alice -A secret-one -X secret-two -r", kSnmpUsers},
        {"system snmp test -u carol -A secret-one -r", kSnmpUsers},
        {"system snmp hash -A secret-one -X secret-two -r", "system snmp set -a SHA1 -x AES128"},
        {"system slp search"},
        {"system slp search -s service:wbem -p 1427"},
        {"system slp search -n 127.0.0.1 -P udp -p 1427"},
        {"system slp stats get"},
        {"system wbem get"},
        {"system wbem set -e true -W false -a certificate -p 5990 -l info"},
        {"system wbem set -r"},
        {"system wbem provider list"},
        {"system wbem provider set -n brix_storage -e false"},
        {"system shutdown poweroff -r 'planned work'", "system maintenanceMode set -e true"},
        {"system shutdown reboot -r 'planned work' -d 10", "system maintenanceMode set -e true"},
        {"system maintenanceMode set -e true"},
        {"system maintenanceMode set -e false", "system maintenanceMode set -e true"},
        {"system maintenanceMode get"},
    };
    return samples;
}

// How a command reports a fault of one of its operations.
enum class Report {
    Message,           // the message alone on stderr, nothing on stdout, exit 1
    Detailed,          // the message with its detail, "MESSAGE (DETAIL)"
    Prefixed,          // a fixed text, then the message
    MessageAndResult,  // the message, and the result is still printed
    OwnMessage,        // a fixed message of the command's own instead of the fault's
    OwnMessageAndResult,
    Skipped,  // the failing items are left out of the listing without a message
    Ignored,  // the command goes on as if nothing had failed
};

struct Expectation {
    const char* invocation;  // the start of the sample's command line
    const char* op;          // an operation, or "" for every operation of the command
    Report report;
    const char* text = "";  // the prefix or the command's own message
};

// The commands whose description asks for something else than the plain message; the first
// entry that matches counts.
const std::vector<Expectation>& Expectations() {
    static const std::vector<Expectation> expectations = {
        {"system version get", "", Report::Prefixed, "Unable to query product version: "},
        {"system stats installtime get", "", Report::Prefixed,
         "system inception timestamp missing: "},
        {"system stats uptime get", "", Report::Prefixed, "Unable to get system uptime: "},
        {"system maintenanceMode", "", Report::Detailed},
        // The event library's failures do not stop a shutdown.
        {"system shutdown", "EvtUserLib_Init", Report::Ignored},
        {"system shutdown", "EvtUserLib_AddEvt", Report::Ignored},
        // Nor do the preference store's: its initialiser's result is not used.
        {"system coredump dorna", "Preference_Init", Report::Ignored},
        {"system shutdown", "", Report::Detailed},
        {"system settings advanced set", "", Report::Detailed},
        // A listing of a whole tree skips the options and branches it cannot read; a single
        // option (--option) is reported.
        {"system settings advanced list -o", "", Report::Message},
        {"system settings advanced list", "KernCtl::Adv::AdvancedOptionImpl::", Report::Skipped},
        {"system settings advanced list", "KernCtl::Adv::AdvancedInteger", Report::Skipped},
        {"system settings advanced list", "KernCtl::Adv::AdvancedString", Report::Skipped},
        {"system settings advanced list", "KernCtl::Adv::AdvancedUser", Report::Skipped},
        {"system coredump partition list",
         "KernCtl::Storage::StorageInfoImpl::GetConfiguredDiagnosticPartition",
         Report::OwnMessageAndResult, "no configured dump partition found; skipping"},
        // The file and object listings go on without the configured or active entry.
        {"system coredump file list", "KernCtl::Storage::StorageInfoImpl::GetConfigured",
         Report::Skipped},
        {"system coredump file list", "KernCtl::Storage::StorageInfoImpl::GetActive",
         Report::Skipped},
        {"system coredump dorna list", "KernCtl::Storage::StorageInfoImpl::GetConfigured",
         Report::Skipped},
        {"system coredump dorna list", "KernCtl::Storage::StorageInfoImpl::GetActive",
         Report::Skipped},
        {"system coredump dorna remove", "KernCtl::Storage::DiagnosticDornaImpl::DumpDornaRemove",
         Report::OwnMessage, "Removal of object 3c9e7a41-5b2d-4f86-a1c0-7d84e2b9f615 failed"},
        {"system snmp set", "", Report::MessageAndResult},
        {"system snmp test", "", Report::MessageAndResult},
        {"system wbem set", "", Report::MessageAndResult},
    };
    return expectations;
}

// What a failing command leaves behind where an earlier call of it stands, as the failure table
// of docs/simulator.md says: the entries of the export that differ from before the command
// (see Changes). A failure that no entry names leaves nothing.
struct Remains {
    const char* line;  // the sample's command line
    const char* op;    // the failing operation
    std::vector<std::string> changed;
};

const std::vector<Remains>& Remainders() {
    static const std::vector<Remains> remainders = {
        // Deactivated before the unconfigure failed.
        {"system coredump partition set -u",
         "KernCtl::Storage::StorageInfoImpl::UnconfigureDiagnosticPartition",
         {"tables|host|coredump.partition.active"}},
        {"system coredump file set -u",
         "KernCtl::Storage::StorageInfoImpl::UnconfigureDiagnosticFile",
         {"tables|host|coredump.file.active"}},
        {"system coredump file remove -F",
         "KernCtl::Storage::StorageInfoImpl::UnconfigureDiagnosticFile",
         {"tables|host|coredump.file.active"}},
        {"system coredump dorna set -u",
         "KernCtl::Storage::StorageInfoImpl::UnconfigureDiagnosticDorna",
         {"tables|host|coredump.dorna.active"}},
        {"system coredump dorna remove -F",
         "KernCtl::Storage::StorageInfoImpl::UnconfigureDiagnosticDorna",
         {"tables|host|coredump.dorna.active"}},
        // Unconfigured, and deactivated, before the read count or the removal failed.
        {"system coredump file remove",
         "KernCtl::Storage::StorageInfoImpl::GetDumpFileReadCount",
         {"tables|host|coredump.file.configured"}},
        {"system coredump dorna remove",
         "KernCtl::Storage::StorageInfoImpl::GetDumpDornaReadCount",
         {"tables|host|coredump.dorna.configured"}},
        {"system coredump dorna remove",
         "KernCtl::Storage::DiagnosticDornaImpl::DumpDornaRemove",
         {"tables|host|coredump.dorna.configured"}},
        {"system coredump dorna remove -F",
         "KernCtl::Storage::DiagnosticDornaImpl::DumpDornaRemove",
         {"tables|host|coredump.dorna.active", "tables|host|coredump.dorna.configured"}},
        // Stored before loading it failed.
        {"system settings keyboard layout set -l Belgian",
         "KernCtl::System::SystemInfoImpl::LoadKeyboardMappings",
         {"tables|host|keyboard.layout"}},
    };
    return remainders;
}

// The index of the entry for a sample's line and a failing operation, or -1 for "nothing".
int RemainderFor(const std::string& line, const std::string& op) {
    const auto& remainders = Remainders();
    for (size_t i = 0; i < remainders.size(); ++i) {
        if (line == remainders[i].line && op == remainders[i].op) return static_cast<int>(i);
    }
    return -1;
}

// Operations that no command of the tree reaches, and why.
const std::map<std::string, std::string>& Unreached() {
    static const char* kLogLevels = "the kernel log-level commands are built but not attached";
    static const char* kReadCache = "the read-cache commands are built but not attached";
    static const std::map<std::string, std::string> unreached = {
        {"HostCtl::Network::NetworkInfo::GetVirtualNics",
         "offered by the network service; no command lists the virtual NICs"},
        {"KernCtl::System::ModuleImpl::GetLogLevels", kLogLevels},
        {"KernCtl::System::ModuleImpl::SetDefaultLogLevel", kLogLevels},
        {"KernCtl::System::ModuleImpl::SetLogLevel", kLogLevels},
        {"KernCtl::System::SystemInfoImpl::GetAllLogLevels", kLogLevels},
        {"KernCtl::System::SystemInfoImpl::GetModuleByName", kLogLevels},
        {"KernCtl::System::SystemInfoImpl::SetDefaultLogLevel", kLogLevels},
        {"KernCtl::System::SystemInfoImpl::SetLogLevel", kLogLevels},
        {"KernCtl::System::SystemInfoImpl::GetCbrcConfiguredEnabled", kReadCache},
        {"KernCtl::System::SystemInfoImpl::GetCbrcRuntimeEnabled", kReadCache},
        {"KernCtl::System::SystemInfoImpl::SetCbrcEnabled", kReadCache},
    };
    return unreached;
}

std::string CommandPath(const std::vector<std::string>& words) {
    std::string path;
    for (const auto& word : words) {
        if (word.rfind('-', 0) == 0) break;
        path += (path.empty() ? "" : " ") + word;
    }
    return path;
}

bool StartsWith(const std::string& text, const std::string& start) {
    return text.compare(0, start.size(), start) == 0;
}

// The index of the first expectation that matches, or -1 for the plain message.
int ExpectationFor(const std::string& line, const std::string& op) {
    const auto& expectations = Expectations();
    for (size_t i = 0; i < expectations.size(); ++i) {
        const std::string invocation = expectations[i].invocation;
        if (!StartsWith(line + " ", invocation + " ")) continue;
        if (!StartsWith(op, expectations[i].op)) continue;
        return static_cast<int>(i);
    }
    return -1;
}

// What a run showed, in short: its exit status, its standard error and whether it printed a
// result.
std::string Summary(int status, const std::string& err, bool result) {
    return "exit " + std::to_string(status) + ", stderr \"" + err + "\", " +
           (result ? "a result" : "no result");
}

std::string Summary(const RunResult& run) {
    return Summary(run.status, run.err, !run.out.empty());
}

std::string Expected(const Expectation& expectation, const std::string& message,
                     const std::string& detail, const RunResult& baseline) {
    switch (expectation.report) {
        case Report::Message:
            return Summary(1, message + "\n", false);
        case Report::Detailed:
            return Summary(1, message + " (" + detail + ")\n", false);
        case Report::Prefixed:
            return Summary(1, expectation.text + message + "\n", false);
        case Report::MessageAndResult:
            return Summary(1, message + "\n", true);
        case Report::OwnMessage:
            return Summary(1, expectation.text + std::string("\n"), false);
        case Report::OwnMessageAndResult:
            return Summary(1, expectation.text + std::string("\n"), true);
        case Report::Skipped:
        case Report::Ignored:
            break;
    }
    return Summary(baseline);
}

using nlohmann::json;

// Adds to `out` what differs between two parts of an export: a row (an element of an array) that
// changed, came or went by `name`|<its first member>, anything else by its path of members.
void Differences(const std::string& name, const json& before, const json& after,
                 std::set<std::string>& out) {
    if (before == after) return;
    const auto below = [&](const std::string& part) {
        return name.empty() ? part : name + "|" + part;
    };
    if (before.is_object() && after.is_object()) {
        for (const auto* side : {&before, &after}) {
            for (const auto& [member, unused] : side->items()) {
                Differences(below(member), before.value(member, json()),
                            after.value(member, json()), out);
            }
        }
    } else if (before.is_array() && after.is_array()) {
        for (const auto& [side, other] : {std::pair(&before, &after), std::pair(&after, &before)}) {
            for (const auto& row : *side) {
                if (std::find(other->begin(), other->end(), row) != other->end()) continue;
                const json& first = row.is_object() && !row.empty() ? row.front() : row;
                out.insert(below(first.is_string() ? first.get<std::string>() : first.dump()));
            }
        }
    } else {
        out.insert(name);
    }
}

// The entries that differ between two exports, leaving out the runs' bookkeeping (the journal
// and the armed faults), sorted.
std::vector<std::string> Changes(json before, json after) {
    for (auto* document : {&before, &after}) {
        if (!document->contains("tables")) continue;
        (*document)["tables"].erase("journal");
        (*document)["tables"].erase("faults");
    }
    std::set<std::string> changed;
    Differences("", before, after, changed);
    return {changed.begin(), changed.end()};
}

// Runs `work(item, worker)` for items 0..count-1 on `workers` threads.
template <class Work>
void InParallel(size_t count, size_t workers, const Work& work) {
    std::atomic<size_t> next{0};
    std::vector<std::thread> threads;
    for (size_t worker = 0; worker < workers; ++worker) {
        threads.emplace_back([&, worker] {
            for (size_t item = next++; item < count; item = next++) work(item, worker);
        });
    }
    for (auto& thread : threads) thread.join();
}

// Runs brixcli on the host at `root`, tracing its operations to `trace` when given. The
// environment goes on the command line (through env) so that threads can run on their own
// roots at once.
RunResult RunOn(const fs::path& root, const std::string& line, const fs::path& trace = {}) {
    std::vector<std::string> argv{"env", "BRIX_HOST_ROOT=" + root.string(),
                                  "BRIXSIM_SLEEP_SCALE=0"};
    if (!trace.empty()) argv.push_back("BRIXSIM_TRACE_OPS=" + trace.string());
    argv.push_back(BrixRobust::Program("brixcli"));
    for (auto& word : Words(line)) argv.push_back(word);
    return BrixTest::Run(argv);
}

// The export of the host at `root`, or null when it cannot be read.
json ExportOf(const fs::path& root) {
    const auto run = BrixTest::Run(
        {"env", "BRIX_HOST_ROOT=" + root.string(), BrixRobust::Program("brixsim"), "export"});
    return run.status == 0 ? json::parse(run.out, nullptr, false) : json();
}

// Arms the fault straight in the store's table, without waiting for the disk: the sweep needs
// no durability, and a flush per case would dominate its run time.
bool Arm(const fs::path& root, const std::string& op, const std::string& message,
         const std::string& detail) {
    sqlite3* db = nullptr;
    if (sqlite3_open((root / "host.db").c_str(), &db) != SQLITE_OK) {
        sqlite3_close(db);
        return false;
    }
    sqlite3_busy_timeout(db, 10000);
    sqlite3_exec(db, "PRAGMA synchronous=OFF", nullptr, nullptr, nullptr);
    sqlite3_stmt* insert = nullptr;
    sqlite3_prepare_v2(db, "INSERT OR REPLACE INTO faults VALUES (?, ?, ?, NULL)", -1, &insert,
                       nullptr);
    sqlite3_bind_text(insert, 1, op.c_str(), -1, SQLITE_TRANSIENT);
    sqlite3_bind_text(insert, 2, message.c_str(), -1, SQLITE_TRANSIENT);
    sqlite3_bind_text(insert, 3, detail.c_str(), -1, SQLITE_TRANSIENT);
    const int status = sqlite3_step(insert);
    sqlite3_finalize(insert);
    sqlite3_close(db);
    return status == SQLITE_DONE;
}

// A sample's baseline run and the operations it reaches, in the order of their first call.
struct Traced {
    RunResult baseline;
    std::vector<std::string> ops;
    std::string failure;  // a setup that did not work
};

// One (command, operation) pair with the fault armed.
struct FaultCase {
    size_t sample;
    std::string op;
    int expectation;
    int remainder;  // what a failure leaves behind, or -1 for nothing
    std::string message, detail;
    RunResult run;
    std::string failure;
    json before, after;  // the exports around the run
};

// The sweep's hosts: a template prepared once, and one work root per thread, reset from the
// template before every run.
class FaultSweep : public ::testing::Test {
  protected:
    void SetUp() override {
        Prepare(host_);
        // The runs need no durability: on a memory file system their flushes cost nothing.
        const char* tmp = getenv("TMPDIR");
        std::string pattern = access("/dev/shm", W_OK) == 0 ? "/dev/shm"
                              : tmp && *tmp                 ? tmp
                                                            : "/tmp";
        pattern += "/brixsweep-XXXXXX";
        ASSERT_NE(mkdtemp(pattern.data()), nullptr);
        scratch_ = pattern;
        templateRoot_ = scratch_ / "template";
        BrixRobust::CopyTree(host_.Root(), templateRoot_);
        workers_ = static_cast<size_t>(BrixRobust::EnvCount(
            "BRIX_ROBUST_JOBS",
            static_cast<int>(std::max(2u, std::thread::hardware_concurrency()))));
        for (size_t i = 0; i < workers_; ++i) {
            const fs::path root = scratch_ / ("w" + std::to_string(i));
            fs::create_directories(root);
            roots_.push_back(root);
            traces_.push_back(root.string() + ".trace");
        }
    }
    void TearDown() override {
        std::error_code ignored;
        if (!scratch_.empty()) fs::remove_all(scratch_, ignored);
    }

    static void Prepare(TempHost& host) {
        // The Dorna dump branch is attached only with feature 120 on; searches stay on the
        // loopback interface and wait briefly.
        ASSERT_EQ(host.Sim({"feature", "set", "120", "on"}).status, 0);
        auto& store = Store::Get();
        store.Write([&] {
            store.SetValue("slp.ua.interface", "127.0.0.1");
            store.SetValue("slp.ua.multicast_wait_ms", "20");
            store.SetValue("slp.ua.unicast_wait_ms", "20");
        });
        Store::Close();
        // A user option away from its default, so that the delta listing shows one.
        const auto set =
            host.Cli(Words("system settings advanced set -o /UserVars/WebUiWelcomeMessage -s hi"));
        ASSERT_EQ(set.status, 0) << set.err;
    }

    // Resets a worker's root and runs the sample's setup lines; the failure, if any.
    std::string Reset(size_t worker, const Sample& sample) {
        BrixRobust::ResetRoot(roots_[worker], templateRoot_);
        std::istringstream setup(sample.setup);
        for (std::string line; std::getline(setup, line, ';');) {
            const auto result = RunOn(roots_[worker], line);
            if (result.status != 0) return "setup " + line + ": " + result.err;
        }
        return "";
    }

    Traced Trace(size_t worker, const Sample& sample) {
        Traced traced;
        traced.failure = Reset(worker, sample);
        if (!traced.failure.empty()) return traced;
        fs::remove(traces_[worker]);
        traced.baseline = RunOn(roots_[worker], sample.line, traces_[worker]);
        std::ifstream in(traces_[worker]);
        for (std::string op; std::getline(in, op);) {
            if (std::find(traced.ops.begin(), traced.ops.end(), op) == traced.ops.end()) {
                traced.ops.push_back(op);
            }
        }
        return traced;
    }

    void RunCase(size_t worker, FaultCase& item) {
        const Sample& sample = Samples()[item.sample];
        item.failure = Reset(worker, sample);
        if (!item.failure.empty()) return;
        item.before = ExportOf(roots_[worker]);
        if (!Arm(roots_[worker], item.op, item.message, item.detail)) {
            item.failure = "cannot arm the fault";
            return;
        }
        item.run = RunOn(roots_[worker], sample.line);
        if (item.run.status != 0) item.after = ExportOf(roots_[worker]);
    }

    TempHost host_;
    fs::path scratch_;
    fs::path templateRoot_;
    size_t workers_ = 2;
    std::vector<fs::path> roots_;
    std::vector<fs::path> traces_;
};

TEST_F(FaultSweep, EveryCommandReportsEveryFaultOfItsOperations) {
    // The table covers every command of the tree.
    const auto listing = host_.Cli({"--list-commands"});
    ASSERT_EQ(listing.status, 0) << listing.err;
    std::set<std::string> sampled;
    for (const auto& sample : Samples()) sampled.insert(CommandPath(Words(sample.line)));
    std::istringstream lines(listing.out);
    std::string line;
    std::getline(lines, line);  // heading
    std::getline(lines, line);  // rule
    size_t commands = 0;
    while (std::getline(lines, line)) {
        const std::string path = line.substr(0, line.find("  "));
        if (path.empty()) continue;
        ++commands;
        EXPECT_TRUE(sampled.count(path)) << "no sample invocation of " << path;
    }
    EXPECT_GE(commands, 60u);

    const auto opsRun = host_.Sim({"fault", "ops"});
    ASSERT_EQ(opsRun.status, 0);
    std::set<std::string> allOps;
    std::istringstream opLines(opsRun.out);
    for (std::string op; std::getline(opLines, op);) allOps.insert(op);

    // What every sample reaches.
    const auto& samples = Samples();
    std::vector<Traced> traced(samples.size());
    InParallel(samples.size(), workers_,
               [&](size_t i, size_t worker) { traced[i] = Trace(worker, samples[i]); });

    // One case per command, operation and kind of report: samples of one command that reach
    // an operation the same way need it armed once.
    std::set<std::string> reached;
    std::set<std::string> done;
    std::vector<FaultCase> cases;
    for (size_t i = 0; i < samples.size(); ++i) {
        SCOPED_TRACE(samples[i].line);
        ASSERT_EQ(traced[i].failure, "");
        EXPECT_LT(traced[i].baseline.status, 2) << traced[i].baseline.err;
        for (const auto& op : traced[i].ops) {
            EXPECT_TRUE(allOps.count(op)) << op << " is traced but not in fault ops";
            reached.insert(op);
            const int expectation = ExpectationFor(samples[i].line, op);
            const int remainder = RemainderFor(samples[i].line, op);
            const std::string key = CommandPath(Words(samples[i].line)) + "|" + op + "|" +
                                    std::to_string(expectation) + "|" + std::to_string(remainder);
            if (!done.insert(key).second) continue;
            const std::string number = std::to_string(cases.size() + 1);
            cases.push_back({i,
                             op,
                             expectation,
                             remainder,
                             "Injected fault " + number + " of " + op,
                             "detail " + number,
                             {},
                             {},
                             {},
                             {}});
        }
    }

    InParallel(cases.size(), workers_, [&](size_t i, size_t worker) { RunCase(worker, cases[i]); });

    std::set<int> used;
    std::set<size_t> remaindersUsed;
    for (const auto& item : cases) {
        SCOPED_TRACE(samples[item.sample].line + std::string(" with ") + item.op);
        ASSERT_EQ(item.failure, "");
        used.insert(item.expectation);
        const auto& baseline = traced[item.sample].baseline;
        const Expectation expectation = item.expectation < 0
                                            ? Expectation{"", "", Report::Message}
                                            : Expectations()[static_cast<size_t>(item.expectation)];
        if (expectation.report == Report::Skipped) {
            // Exit 0 and no message, as the baseline, but a listing with fewer entries.
            EXPECT_EQ(Summary(item.run.status, item.run.err, false), Summary(0, "", false));
            EXPECT_NE(item.run.out, baseline.out) << "nothing was left out";
        } else {
            EXPECT_EQ(Summary(item.run),
                      Expected(expectation, item.message, item.detail, baseline));
        }
        // A failed command changed nothing, or only what its table entry says stands.
        if (item.run.status == 0) continue;
        ASSERT_FALSE(item.before.is_discarded() || item.before.is_null());
        ASSERT_FALSE(item.after.is_discarded() || item.after.is_null());
        std::vector<std::string> remains;
        if (item.remainder >= 0) {
            remains = Remainders()[static_cast<size_t>(item.remainder)].changed;
            remaindersUsed.insert(static_cast<size_t>(item.remainder));
        }
        EXPECT_EQ(Changes(item.before, item.after), remains);
    }
    std::cerr << "fault sweep: " << samples.size() << " invocations, " << cases.size()
              << " cases on " << workers_ << " threads\n";

    // The tables hold nothing stale.
    for (size_t i = 0; i < Expectations().size(); ++i) {
        EXPECT_TRUE(used.count(static_cast<int>(i)))
            << "expectation for " << Expectations()[i].invocation << " " << Expectations()[i].op
            << " matches no case";
    }
    for (size_t i = 0; i < Remainders().size(); ++i) {
        EXPECT_TRUE(remaindersUsed.count(i)) << "remainder for " << Remainders()[i].line << " with "
                                             << Remainders()[i].op << " matches no failing case";
    }
    // Every operation is reached, or listed with the reason why not.
    for (const auto& op : allOps) {
        if (reached.count(op)) {
            EXPECT_FALSE(Unreached().count(op)) << op << " is reached: drop it from Unreached()";
        } else {
            EXPECT_TRUE(Unreached().count(op)) << op << " is reached by no sample invocation";
        }
    }
    for (const auto& [op, reason] : Unreached()) {
        EXPECT_TRUE(allOps.count(op)) << op << " is no longer an operation (" << reason << ")";
    }
}

}  // namespace

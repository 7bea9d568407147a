// Maintenance mode and the content-based read cache of the simulated host, and the host's
// management-service program at /bin/mgmt-cmd that enters and leaves maintenance mode.
#include <dlfcn.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <system_error>
#include <vector>

#include "hostctl/HostCtlException.h"
#include "hostsim/core/DurableWrite.h"
#include "hostsim/core/Hooks.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"
#include "hostsim/identity/HostService.h"
#include "kernctl/SystemInfoImpl.h"

namespace fs = std::filesystem;

namespace {

const BrixSim::Operation kGetState{"KernCtl::System::SystemInfoImpl::GetMaintenanceModeState"};
const BrixSim::Operation kGetCbrcRuntime{"KernCtl::System::SystemInfoImpl::GetCbrcRuntimeEnabled"};
const BrixSim::Operation kGetCbrcConfigured{
    "KernCtl::System::SystemInfoImpl::GetCbrcConfiguredEnabled"};
const BrixSim::Operation kSetCbrc{"KernCtl::System::SystemInfoImpl::SetCbrcEnabled"};
const BrixSim::Operation kEnter{"HostSvc::EnterMaintenanceMode"};
const BrixSim::Operation kExit{"HostSvc::ExitMaintenanceMode"};

constexpr int kInMaintenance = 1;
constexpr int kNotInMaintenance = 2;

// The program that /bin/mgmt-cmd runs, built beside the simulator's tools.
constexpr const char* kProgram = "brixsim-mgmt-cmd";

bool IsProgramDir(const fs::path& dir) {
    std::error_code ec;
    return !dir.empty() && fs::is_regular_file(dir / kProgram, ec);
}

// Where brixsim-mgmt-cmd lives: $BRIXSIM_PROGRAM_DIR, else the folder of the running program,
// else the bin folder beside this library's lib folder. Empty when none has it.
fs::path FindProgramDir() {
    if (const char* dir = std::getenv("BRIXSIM_PROGRAM_DIR"); dir != nullptr && *dir != '\0') {
        return dir;
    }
    std::error_code ec;
    fs::path self = fs::read_symlink("/proc/self/exe", ec);
    if (!ec && IsProgramDir(self.parent_path())) return self.parent_path();
    Dl_info info{};
    if (dladdr(reinterpret_cast<void*>(&FindProgramDir), &info) != 0 && info.dli_fname != nullptr) {
        fs::path bin = fs::absolute(info.dli_fname, ec).parent_path().parent_path() / "bin";
        if (IsProgramDir(bin)) return bin;
    }
    return {};
}

std::string ShellQuote(const std::string& text) {
    std::string quoted = "'";
    for (char c : text) quoted += c == '\'' ? std::string("'\\''") : std::string(1, c);
    return quoted + "'";
}

// /bin/mgmt-cmd: a small script that runs the simulator's management-service program on the
// host whose root holds the script. BRIXSIM_PROGRAM_DIR, when set at run time, names the
// folder of brixsim-mgmt-cmd; otherwise the folder found when the host was made, then PATH.
std::string MgmtCmdScript() {
    return "#!/bin/sh\n"
           "# Management-service tool of the Brix host.\n"
           "root=$(CDPATH= cd -- \"$(dirname -- \"$0\")/..\" && pwd -P) || exit 127\n"
           "BRIX_HOST_ROOT=$root\n"
           "export BRIX_HOST_ROOT\n"
           "for dir in \"${BRIXSIM_PROGRAM_DIR:-}\" " +
           ShellQuote(FindProgramDir().string()) +
           "; do\n"
           "  if [ -n \"$dir\" ] && [ -x \"$dir/brixsim-mgmt-cmd\" ]; then\n"
           "    exec \"$dir/brixsim-mgmt-cmd\" \"$@\"\n"
           "  fi\n"
           "done\n"
           "if command -v brixsim-mgmt-cmd >/dev/null 2>&1; then\n"
           "  exec brixsim-mgmt-cmd \"$@\"\n"
           "fi\n"
           "echo \"mgmt-cmd: the management service is not available\" >&2\n"
           "exit 127\n";
}

void WriteMgmtCmd(const fs::path& root) {
    fs::create_directories(root / "bin");
    BrixSim::WriteDurably(root / "bin" / "mgmt-cmd", MgmtCmdScript(), 0755);
}

// The read cache runs as configured from the next boot on.
const bool restarts = BrixSim::RegisterBootStep(
    [](BrixSim::Store& store) { store.Exec("UPDATE read_cache SET active = enabled_on_reboot"); });

const bool registered = [] {
    return BrixSim::RegisterTables({
        "maintenance",
        "CREATE TABLE IF NOT EXISTS maintenance_mode ("
        " id INTEGER PRIMARY KEY CHECK (id = 1),"
        " state INTEGER NOT NULL,"     // 1 in maintenance mode, 2 not, other unknown
        " dorna_mode TEXT NOT NULL);"  // data action taken when it was last entered
        "CREATE TABLE IF NOT EXISTS read_cache ("
        " id INTEGER PRIMARY KEY CHECK (id = 1),"
        " active INTEGER NOT NULL,"               // running now
        " enabled_on_reboot INTEGER NOT NULL);",  // configured for the next boot
        [](BrixSim::Store& store) {
            store.Exec(
                "INSERT INTO maintenance_mode VALUES (1, 2, 'noAction');"
                "INSERT INTO read_cache VALUES (1, 0, 0);");
            WriteMgmtCmd(store.Root());
        },
    });
}();

int64_t ReadInt(const char* sql, int64_t fallback) {
    auto row = BrixSim::Store::Get().Prepare(sql);
    return row.Step() ? row.Int(0) : fallback;
}

// Moves the host into or out of maintenance mode; `dornaMode` is empty when leaving.
void SetState(const BrixSim::Operation& operation, int state, int64_t timeoutSeconds,
              const std::string& dornaMode) {
    auto& store = BrixSim::Store::Get();
    store.Write([&] {
        if (ReadInt("SELECT state FROM maintenance_mode", 0) == state) {
            throw HostCtl::Lib::HostCtlException(state == kInMaintenance
                                                     ? "The host is already in maintenance mode."
                                                     : "The host is not in maintenance mode.");
        }
        store
            .Prepare(
                "INSERT INTO maintenance_mode VALUES (1, ?, 'noAction')"
                " ON CONFLICT(id) DO UPDATE SET state = excluded.state")
            .Bind(1, state)
            .Run();
        std::vector<BrixSim::Value> args{timeoutSeconds};
        if (!dornaMode.empty()) {
            store.Prepare("UPDATE maintenance_mode SET dorna_mode = ?").Bind(1, dornaMode).Run();
            args.emplace_back(dornaMode);
        }
        store.JournalCall(operation, args);
    });
}

}  // namespace

namespace BrixSim::Maintenance {

bool IsDornaMode(const std::string& mode) {
    return mode == "noAction" || mode == "ensureObjectAccessibility" || mode == "evacuateAllData";
}

void Enter(int64_t timeoutSeconds, const std::string& dornaMode) {
    Store::Get().Check(kEnter);
    SetState(kEnter, kInMaintenance, timeoutSeconds, dornaMode);
}

void Exit(int64_t timeoutSeconds) {
    Store::Get().Check(kExit);
    SetState(kExit, kNotInMaintenance, timeoutSeconds, std::string());
}

}  // namespace BrixSim::Maintenance

namespace KernCtl::System {

int SystemInfoImpl::GetMaintenanceModeState() {
    auto& store = BrixSim::Store::Get();
    store.Check(kGetState);
    return static_cast<int>(ReadInt("SELECT state FROM maintenance_mode", 0));
}

bool SystemInfoImpl::GetCbrcRuntimeEnabled() {
    auto& store = BrixSim::Store::Get();
    store.Check(kGetCbrcRuntime);
    return ReadInt("SELECT active FROM read_cache", 0) != 0;
}

bool SystemInfoImpl::GetCbrcConfiguredEnabled() {
    auto& store = BrixSim::Store::Get();
    store.Check(kGetCbrcConfigured);
    return ReadInt("SELECT enabled_on_reboot FROM read_cache", 0) != 0;
}

void SystemInfoImpl::SetCbrcEnabled(bool enabled) {
    auto& store = BrixSim::Store::Get();
    store.Check(kSetCbrc);
    store.Write([&] {
        store
            .Prepare(
                "INSERT INTO read_cache VALUES (1, 0, ?) ON CONFLICT(id) DO UPDATE SET"
                " enabled_on_reboot = excluded.enabled_on_reboot")
            .Bind(1, enabled)
            .Run();
        store.JournalCall(kSetCbrc, {enabled});
    });
}

}  // namespace KernCtl::System

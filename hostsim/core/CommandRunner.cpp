// Runs host command lines for the framework: the program is the file at its host path under the
// root or, failing that, the simulator's own build of it (brixsim-<name> beside the tools).
#include <dlfcn.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <filesystem>

#include "cmdkit/AutoCli.h"
#include "hostsim/core/Store.h"

namespace {

namespace fs = std::filesystem;

bool IsExecutableFile(const fs::path& path) {
    struct stat info;
    return ::stat(path.c_str(), &info) == 0 && S_ISREG(info.st_mode) &&
           ::access(path.c_str(), X_OK) == 0;
}

// Where the simulator's host programs are: $BRIXSIM_PROGRAM_DIR, else the bin folder beside
// the folder of this library.
fs::path ProgramDir() {
    if (const char* dir = getenv("BRIXSIM_PROGRAM_DIR"); dir && *dir) return dir;
    Dl_info info;
    if (dladdr(reinterpret_cast<void*>(&ProgramDir), &info) == 0 || !info.dli_fname) return {};
    std::error_code ec;
    const fs::path library = fs::canonical(info.dli_fname, ec);
    if (ec) return {};
    return library.parent_path().parent_path() / "bin";
}

int Spawn(const fs::path& program, const std::vector<std::string>& argv, std::string& output) {
    return CmdKit::AutoCli::RunProgram(program.string(), argv, output);
}

int RunHostCommand(const std::vector<std::string>& argv, const std::string& user,
                   std::string& output) {
    output.clear();
    if (argv.empty() || argv[0].empty()) {
        output = "Cannot run: no program given";
        return 127;
    }
    int status = 127;
    try {
        auto& store = BrixSim::Store::Get();
        const std::string& name = argv[0];
        const fs::path builtin = ProgramDir() / ("brixsim-" + fs::path(name).filename().string());
        if (name.front() != '/') {
            output = "Cannot run " + name + ": not an absolute host path";
        } else if (const auto real = store.Resolve(name); !real) {
            output = "Cannot run " + name + ": Permission denied";
            status = 126;
        } else if (IsExecutableFile(*real)) {
            status = Spawn(*real, argv, output);
        } else if (!fs::exists(*real) && !fs::path(name).filename().empty() &&
                   IsExecutableFile(builtin)) {
            status = Spawn(builtin, argv, output);
        } else {
            output =
                "Cannot run " + name + ": " + std::strerror(fs::exists(*real) ? EACCES : ENOENT);
            status = fs::exists(*real) ? 126 : 127;
        }
        store.Write([&] {
            store.Journal("exec", {{"argv", argv}, {"user", user}, {"status", int64_t{status}}});
        });
    } catch (const std::exception& e) {
        output += std::string(e.what());
        if (status == 0) status = 126;
    }
    return status;
}

// A command reads the host in one read transaction: one consistent view, and the database's
// locks taken once instead of once a statement. Writes, and so the programs it runs (each
// journalled), end it and start a new one.
void InOneReadTransaction(const std::function<void()>& execute) {
    BrixSim::Store* store = nullptr;
    try {
        store = &BrixSim::Store::Get();
    } catch (const std::exception&) {
        // The command's own calls report the store that cannot be opened.
    }
    if (store) {
        store->Read(execute);
    } else {
        execute();
    }
}

const bool installed = [] {
    CmdKit::AutoCli::SetHostCommandRunner(&RunHostCommand);
    CmdKit::AutoCli::SetExecutionScope(&InOneReadTransaction);
    return true;
}();

}  // namespace

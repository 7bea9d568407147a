// brixcli: loads every plug-in of its plug-in folder, then runs one invocation or a batch.
#include <dlfcn.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <iostream>
#include <string>
#include <system_error>
#include <vector>

#include "ToolOutput.h"
#include "cmdkit/Cli.h"

namespace {

namespace fs = std::filesystem;

using RegisterFunction = void (*)(const std::shared_ptr<CmdKit::AutoCli::NamespaceNode>&);

// The plug-in folder, or empty (with `error` set) when the executable cannot be found: never a
// folder relative to wherever the tool happens to run.
fs::path PluginFolder(std::error_code& error) {
    if (const char* folder = std::getenv("BRIXCLI_PLUGIN_DIR"); folder && *folder) return folder;
    fs::path exe = fs::read_symlink("/proc/self/exe", error);
    if (error) return fs::path();
    return (exe.parent_path() / ".." / "lib" / "brixcli" / "plugins").lexically_normal();
}

// Loads each *.so of the folder in name order and lets it attach its branch to `root`. A
// plug-in that cannot be loaded is reported and skipped; the others still serve. A folder that
// cannot be read is reported with its path. Returns the paths of those loaded.
std::vector<std::string> LoadPlugins(const std::shared_ptr<CmdKit::AutoCli::NamespaceNode>& root) {
    std::vector<std::string> loaded;
    std::error_code error;
    const fs::path folder = PluginFolder(error);
    if (error) {
        std::cerr << "brixcli: cannot find the plug-in folder: the executable's path is unknown ("
                  << error.message() << ")\n";
        return loaded;
    }
    std::vector<fs::path> libraries;
    for (fs::directory_iterator it(folder, error), end; !error && it != end; it.increment(error)) {
        if (it->path().extension() == ".so") libraries.push_back(it->path());
    }
    if (error) {
        std::cerr << "brixcli: cannot read the plug-in folder " << folder.string() << ": "
                  << error.message() << '\n';
    }
    std::sort(libraries.begin(), libraries.end());
    for (const auto& library : libraries) {
        // Plug-ins stay loaded for the life of the process: the tree holds their objects.
        void* handle = dlopen(library.c_str(), RTLD_NOW | RTLD_LOCAL);
        if (!handle) {
            std::cerr << "brixcli: cannot load plug-in " << library.string() << ": " << dlerror()
                      << '\n';
            continue;
        }
        auto entry =
            reinterpret_cast<RegisterFunction>(dlsym(handle, "AutoCli_RegisterNamespaces"));
        if (!entry) {
            std::cerr << "brixcli: plug-in " << library.string()
                      << " has no AutoCli_RegisterNamespaces\n";
            continue;
        }
        try {
            entry(root);
            loaded.push_back(library.string());
        } catch (const std::exception& failure) {
            std::cerr << "brixcli: plug-in " << library.string()
                      << " failed to register: " << failure.what() << '\n';
        }
    }
    return loaded;
}

}  // namespace

int main(int argc, char** argv) {
    BrixTools::HoldClosedStandardDescriptors();
    const auto& output = BrixTools::CaptureStandardOutput();
    auto root = CmdKit::AutoCli::Namespace::New();
    CmdKit::AutoCli::Program program{"brixcli", BRIX_VERSION, LoadPlugins(root)};
    std::vector<std::string> args(argv + 1, argv + argc);
    const int status = CmdKit::AutoCli::RunCli(root, args, std::cout, std::cerr, program);
    return BrixTools::FinishOutput("brixcli", output, status);
}

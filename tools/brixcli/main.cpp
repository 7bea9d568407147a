// brixcli: loads every plug-in of its plug-in folder, then runs one invocation or a batch.
#include <dlfcn.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <iostream>
#include <string>
#include <system_error>
#include <vector>

#include "LargePageHeap.h"
#include "cmdkit/Cli.h"

namespace {

namespace fs = std::filesystem;

using RegisterFunction = void (*)(const std::shared_ptr<CmdKit::AutoCli::NamespaceNode>&);

fs::path PluginFolder() {
    if (const char* folder = std::getenv("BRIXCLI_PLUGIN_DIR"); folder && *folder) return folder;
    std::error_code error;
    fs::path exe = fs::read_symlink("/proc/self/exe", error);
    if (error) return fs::path("lib/brixcli/plugins");
    return (exe.parent_path() / ".." / "lib" / "brixcli" / "plugins").lexically_normal();
}

// Loads each *.so of the folder in name order and lets it attach its branch to `root`. A
// plug-in that cannot be loaded is reported and skipped; the others still serve. Returns the
// paths of those loaded.
std::vector<std::string> LoadPlugins(const std::shared_ptr<CmdKit::AutoCli::NamespaceNode>& root) {
    std::vector<std::string> loaded;
    const fs::path folder = PluginFolder();
    std::error_code error;
    std::vector<fs::path> libraries;
    for (fs::directory_iterator it(folder, error), end; !error && it != end; it.increment(error)) {
        if (it->path().extension() == ".so") libraries.push_back(it->path());
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
    BrixCli::ReserveLargePageHeap();
    // Nothing here writes through C stdio: the streams can keep their own buffers, which
    // long listings write much faster through.
    std::ios::sync_with_stdio(false);
    auto root = CmdKit::AutoCli::Namespace::New();
    CmdKit::AutoCli::Program program{"brixcli", BRIX_VERSION, LoadPlugins(root)};
    std::vector<std::string> args(argv + 1, argv + argc);
    int status = CmdKit::AutoCli::RunCli(root, args, std::cout, std::cerr, program);
    std::cout.flush();
    std::cerr.flush();
    return status;
}

// brixcli: loads every plug-in of its plug-in folder, then runs one invocation or a batch.
#include <dlfcn.h>
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
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

// A standard descriptor the caller left closed is held on /dev/null, opened for reading only:
// no file the run opens can take its number (and receive the output), and the output's writes
// still fail, to be reported.
void HoldClosedStandardDescriptors() {
    for (int fd = STDIN_FILENO; fd <= STDERR_FILENO; ++fd) {
        if (fcntl(fd, F_GETFD) == -1 && errno == EBADF) {
            const int held = open("/dev/null", O_RDONLY);
            if (held >= 0 && held != fd) close(held);
        }
    }
}

// Standard output's buffer: it remembers why a write failed, which the stream does not, and
// writes nothing more after that.
class OutputBuffer : public std::streambuf {
  public:
    OutputBuffer() { setp(buffer_, buffer_ + sizeof buffer_); }
    int Error() const { return error_; }

  protected:
    int_type overflow(int_type c) override {
        if (sync() != 0) return traits_type::eof();
        if (!traits_type::eq_int_type(c, traits_type::eof())) {
            *pptr() = traits_type::to_char_type(c);
            pbump(1);
        }
        return traits_type::not_eof(c);
    }
    std::streamsize xsputn(const char* data, std::streamsize size) override {
        if (size > epptr() - pptr()) {
            if (sync() != 0) return 0;
            if (size > epptr() - pptr()) return WriteAll(data, size) ? size : 0;
        }
        std::memcpy(pptr(), data, static_cast<size_t>(size));
        pbump(static_cast<int>(size));
        return size;
    }
    int sync() override {
        const bool written = WriteAll(pbase(), pptr() - pbase());
        setp(buffer_, buffer_ + sizeof buffer_);
        return written ? 0 : -1;
    }

  private:
    bool WriteAll(const char* data, std::streamsize size) {
        while (size > 0 && error_ == 0) {
            const ssize_t done = write(STDOUT_FILENO, data, static_cast<size_t>(size));
            if (done < 0 && errno != EINTR) error_ = errno;
            if (done > 0) {
                data += done;
                size -= done;
            }
        }
        return error_ == 0;
    }

    char buffer_[1 << 16];
    int error_ = 0;
};

// Flushes standard output; when any of it could not be written, says so on standard error.
// A listing cut short must not look complete.
bool OutputWritten(const OutputBuffer& buffer) {
    std::cout.flush();
    if (buffer.Error() == 0 && std::cout.good()) return true;
    std::cerr << "brixcli: cannot write the output: "
              << (buffer.Error() != 0 ? std::strerror(buffer.Error()) : "write error") << '\n';
    return false;
}

}  // namespace

int main(int argc, char** argv) {
    HoldClosedStandardDescriptors();
    BrixCli::ReserveLargePageHeap();
    // Nothing here writes through C stdio: the streams can keep their own buffers, which
    // long listings write much faster through.
    std::ios::sync_with_stdio(false);
    // Never freed: anything that writes to std::cout up to the very end still has it.
    auto* output = new OutputBuffer;
    std::cout.rdbuf(output);
    auto root = CmdKit::AutoCli::Namespace::New();
    CmdKit::AutoCli::Program program{"brixcli", BRIX_VERSION, LoadPlugins(root)};
    std::vector<std::string> args(argv + 1, argv + argc);
    int status = CmdKit::AutoCli::RunCli(root, args, std::cout, std::cerr, program);
    if (!OutputWritten(*output) && status == 0) status = 1;
    std::cerr.flush();
    if (!std::cerr.good() && status == 0) status = 1;
    return status;
}

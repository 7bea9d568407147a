// Secret files given by path are files of the simulated host: they live under its root.
#include <cerrno>
#include <exception>

#include "core/Store.h"
#include "os/HostFiles.h"

namespace HostOs {

std::string HostFileName(const std::string& path) {
    try {
        const auto resolved = BrixSim::Store::Get().Resolve(path);
        if (resolved) return resolved->string();
        errno = EACCES;
    } catch (const std::exception&) {
        errno = EIO;
    }
    return std::string();
}

}  // namespace HostOs

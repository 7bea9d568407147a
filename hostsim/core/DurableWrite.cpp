#include "core/DurableWrite.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <random>
#include <string>
#include <system_error>

#include "core/Fd.h"

namespace BrixSim {

namespace fs = std::filesystem;

namespace {

[[noreturn]] void Fail(const std::string& step, const fs::path& path, int error) {
    throw std::system_error(error, std::generic_category(), step + " " + path.string());
}

// Creates a temporary file of an unpredictable name in `folder`; a name taken already (or a
// link planted there) is never opened, another is drawn.
std::pair<Fd, fs::path> CreateTemporary(const fs::path& folder, const std::string& stem) {
    static thread_local std::mt19937_64 random(std::random_device{}());
    for (int attempt = 0; attempt < 100; ++attempt) {
        char suffix[17];
        snprintf(suffix, sizeof suffix, "%016llx", static_cast<unsigned long long>(random()));
        const fs::path temp = folder / ("." + stem + ".tmp-" + suffix);
        Fd fd(::open(temp.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
        if (fd) return {std::move(fd), temp};
        if (errno != EEXIST) Fail("cannot create a temporary file in", folder, errno);
    }
    Fail("cannot find a free temporary name in", folder, EEXIST);
}

void SyncFolder(const fs::path& folder) {
    Fd fd(::open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (fd.Get() < 0) Fail("cannot open folder", folder, errno);
    if (::fsync(fd.Get()) != 0) Fail("cannot sync folder", folder, errno);
}

}  // namespace

void WriteDurably(const fs::path& target, std::string_view content, mode_t mode, Publish how,
                  off_t size) {
    const fs::path folder = target.parent_path().empty() ? fs::path(".") : target.parent_path();
    auto [fd, temp] = CreateTemporary(folder, target.filename().string());
    try {
        const char* data = content.data();
        size_t left = content.size();
        while (left > 0) {
            const ssize_t done = ::write(fd.Get(), data, left);
            if (done < 0 && errno == EINTR) continue;
            if (done <= 0) Fail("cannot write", temp, done < 0 ? errno : ENOSPC);
            data += done;
            left -= static_cast<size_t>(done);
        }
        if (size > static_cast<off_t>(content.size()) && ::ftruncate(fd.Get(), size) != 0) {
            Fail("cannot size", temp, errno);
        }
        if (::fchmod(fd.Get(), mode) != 0) Fail("cannot set the mode of", temp, errno);
        if (::fsync(fd.Get()) != 0) Fail("cannot sync", temp, errno);
        if (how == Publish::Replace) {
            if (::rename(temp.c_str(), target.c_str()) != 0) Fail("cannot replace", target, errno);
        } else {
            if (::link(temp.c_str(), target.c_str()) != 0) Fail("cannot create", target, errno);
            ::unlink(temp.c_str());
        }
    } catch (...) {
        ::unlink(temp.c_str());
        throw;
    }
    SyncFolder(folder);
}

}  // namespace BrixSim

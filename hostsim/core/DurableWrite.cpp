#include "hostsim/core/DurableWrite.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <random>
#include <string>
#include <system_error>

namespace BrixSim {

namespace fs = std::filesystem;

namespace {

constexpr size_t kSuffixLength = 16;

[[noreturn]] void Fail(const std::string& step, const fs::path& path, int error) {
    throw std::system_error(error, std::generic_category(), step + " " + path.string());
}

std::string TemporaryPrefix(const fs::path& target) {
    return "." + target.filename().string() + ".tmp-";
}

fs::path Folder(const fs::path& target) {
    return target.parent_path().empty() ? fs::path(".") : target.parent_path();
}

// Creates a temporary file of an unpredictable name beside `target`; a name taken already (or a
// link planted there) is never opened, another is drawn.
Fd CreateTemporary(const fs::path& target, fs::path& temp) {
    static thread_local std::mt19937_64 random(std::random_device{}());
    for (int attempt = 0; attempt < 100; ++attempt) {
        char suffix[kSuffixLength + 1];
        snprintf(suffix, sizeof suffix, "%016llx", static_cast<unsigned long long>(random()));
        temp = Folder(target) / (TemporaryPrefix(target) + suffix);
        Fd fd(::open(temp.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
        if (fd) return fd;
        if (errno != EEXIST) Fail("cannot create a temporary file for", target, errno);
    }
    Fail("cannot find a free temporary name for", target, EEXIST);
}

void SyncFolder(const fs::path& folder) {
    Fd fd(::open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (!fd) Fail("cannot open folder", folder, errno);
    if (::fsync(fd.Get()) != 0) Fail("cannot sync folder", folder, errno);
}

}  // namespace

StagedFile::StagedFile(const fs::path& target, std::string_view content, mode_t mode, off_t size)
    : StagedFile(target, std::vector<Extent>{{0, std::string(content)}}, mode, size) {}

StagedFile::StagedFile(const fs::path& target, const std::vector<Extent>& extents, mode_t mode,
                       off_t size)
    : target_(target) {
    Fd fd = CreateTemporary(target, temp_);
    try {
        off_t end = 0;
        for (const auto& extent : extents) {
            const char* data = extent.data.data();
            size_t left = extent.data.size();
            off_t at = extent.offset;
            while (left > 0) {
                const ssize_t done = ::pwrite(fd.Get(), data, left, at);
                if (done < 0 && errno == EINTR) continue;
                if (done <= 0) Fail("cannot write", target, done < 0 ? errno : ENOSPC);
                data += done;
                at += done;
                left -= static_cast<size_t>(done);
            }
            end = std::max(end, at);
        }
        if (size > end && ::ftruncate(fd.Get(), size) != 0) Fail("cannot size", target, errno);
        if (::fchmod(fd.Get(), mode) != 0) Fail("cannot set the mode of", target, errno);
        if (::fsync(fd.Get()) != 0) Fail("cannot sync", target, errno);
    } catch (...) {
        ::unlink(temp_.c_str());
        throw;
    }
}

StagedFile::~StagedFile() {
    if (!published_) ::unlink(temp_.c_str());
}

void StagedFile::Publish(BrixSim::Publish how) {
    if (how == BrixSim::Publish::Replace) {
        if (::rename(temp_.c_str(), target_.c_str()) != 0) Fail("cannot replace", target_, errno);
    } else {
        if (::link(temp_.c_str(), target_.c_str()) != 0) Fail("cannot create", target_, errno);
        ::unlink(temp_.c_str());
    }
    published_ = true;
    SyncFolder(Folder(target_));
}

void WriteDurably(const fs::path& target, std::string_view content, mode_t mode, Publish how,
                  off_t size) {
    StagedFile(target, content, mode, size).Publish(how);
}

void RemoveStaleTemporaries(const fs::path& target) {
    const std::string prefix = TemporaryPrefix(target);
    std::error_code ignored;
    for (const auto& entry : fs::directory_iterator(Folder(target), ignored)) {
        const std::string name = entry.path().filename().string();
        if (name.size() == prefix.size() + kSuffixLength && name.rfind(prefix, 0) == 0) {
            ::unlink(entry.path().c_str());
        }
    }
}

}  // namespace BrixSim

#include "hostsim/core/StagedTree.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <set>
#include <system_error>

#include "hostsim/core/FileTransfer.h"

namespace BrixSim {

namespace fs = std::filesystem;

namespace {

// Modes a folder holds while it is filled: its owner may always add and remove.
constexpr mode_t kOwnerAll = S_IRWXU;

[[noreturn]] void Fail(const std::string& step, const fs::path& path, int error) {
    throw std::system_error(error, std::generic_category(), step + " " + path.string());
}

bool IsRealFolder(const fs::path& path) {
    struct stat info {};
    return ::lstat(path.c_str(), &info) == 0 && S_ISDIR(info.st_mode);
}

// Removes what stands at `path`, if anything, without following a link.
void RemoveAny(const fs::path& path) {
    std::error_code ec;
    fs::remove_all(path, ec);
    if (ec) Fail("cannot remove", path, ec.value());
}

}  // namespace

StagedTree::StagedTree(const fs::path& root, const std::vector<FileEntry>& files) : root_(root) {
    try {
        for (const auto& file : files) {
            Entry& entry = entries_[file.path];
            entry.file = &file;
            if (file.type != FileEntry::Type::File) continue;
            const fs::path target = root_ / file.path;
            if (PrepareFolder(target.parent_path())) {
                entry.staged.emplace(target, file.extents, file.mode, file.size);
            }
        }
    } catch (...) {
        Undo();
        throw;
    }
}

StagedTree::~StagedTree() {
    if (!applied_) Undo();
}

void StagedTree::Undo() {
    for (auto& [path, entry] : entries_) entry.staged.reset();
    for (auto it = loosenedFolders_.rbegin(); it != loosenedFolders_.rend(); ++it) {
        ::chmod(it->first.c_str(), it->second);
    }
    for (auto it = madeFolders_.rbegin(); it != madeFolders_.rend(); ++it) ::rmdir(it->c_str());
    loosenedFolders_.clear();
    madeFolders_.clear();
}

bool StagedTree::PrepareFolder(const fs::path& folder) {
    if (folder == root_) return true;
    if (!PrepareFolder(folder.parent_path())) return false;
    struct stat info {};
    if (::lstat(folder.c_str(), &info) != 0) {
        if (errno != ENOENT) Fail("cannot read", folder, errno);
        if (::mkdir(folder.c_str(), kOwnerAll) != 0) Fail("cannot create folder", folder, errno);
        madeFolders_.push_back(folder);
        return true;
    }
    if (!S_ISDIR(info.st_mode)) return false;
    if ((info.st_mode & kOwnerAll) != kOwnerAll) {
        if (::chmod(folder.c_str(), (info.st_mode & 07777) | kOwnerAll) != 0) {
            Fail("cannot open up folder", folder, errno);
        }
        loosenedFolders_.emplace_back(folder, info.st_mode & 07777);
    }
    return true;
}

void StagedTree::Apply() {
    // What the host has and the document does not: each unwanted subtree once.
    std::vector<fs::path> unwanted;
    std::error_code ec;
    for (fs::recursive_directory_iterator it(root_, fs::directory_options::none, ec), end;
         !ec && it != end; it.increment(ec)) {
        const fs::path relative = it->path().lexically_relative(root_);
        const bool leftOut = IsLeftOut(relative);
        if (leftOut || entries_.count(relative.generic_string()) == 0) {
            if (!leftOut) unwanted.push_back(it->path());
            if (it->is_directory(ec) && !it->is_symlink(ec)) it.disable_recursion_pending();
        }
    }
    if (ec) Fail("cannot read", root_, ec.value());
    for (const auto& path : unwanted) RemoveAny(path);

    // In path order, so every folder is in place before what it holds.
    for (auto& [path, entry] : entries_) {
        const FileEntry& file = *entry.file;
        const fs::path target = root_ / path;
        switch (file.type) {
            case FileEntry::Type::Folder:
                if (!IsRealFolder(target)) {
                    RemoveAny(target);
                    if (::mkdir(target.c_str(), kOwnerAll) != 0) {
                        Fail("cannot create folder", target, errno);
                    }
                } else if (::chmod(target.c_str(), file.mode | kOwnerAll) != 0) {
                    Fail("cannot open up folder", target, errno);
                }
                break;
            case FileEntry::Type::Link:
                RemoveAny(target);
                if (::symlink(file.target.c_str(), target.c_str()) != 0) {
                    Fail("cannot create link", target, errno);
                }
                break;
            case FileEntry::Type::File:
                // A rename cannot replace a folder.
                if (IsRealFolder(target)) RemoveAny(target);
                if (!entry.staged) entry.staged.emplace(target, file.extents, file.mode, file.size);
                entry.staged->Publish();
                break;
        }
    }
    // The folders' own modes last, deepest first.
    for (auto it = entries_.rbegin(); it != entries_.rend(); ++it) {
        if (it->second.file->type != FileEntry::Type::Folder) continue;
        const fs::path target = root_ / it->first;
        if (::chmod(target.c_str(), it->second.file->mode) != 0) {
            Fail("cannot set the mode of", target, errno);
        }
    }
    applied_ = true;
}

}  // namespace BrixSim

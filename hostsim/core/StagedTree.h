// The file entries of an export document, written out under a host root before anything the
// host has changes, then made the host's files at once.
#pragma once

#include <sys/types.h>

#include <filesystem>
#include <map>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "hostsim/core/DurableWrite.h"
#include "hostsim/core/FileTransfer.h"

namespace BrixSim {

class StagedTree {
  public:
    // Writes every file of `files` (from ParseFiles) to a temporary beside its place,
    // making the folders that are missing on the way. Throws a std::system_error when a file
    // cannot be written; what it wrote and made is then gone again and the host is as it was.
    // A file whose folder is something else on the host (a link, a file) is written by Apply.
    StagedTree(const std::filesystem::path& root, const std::vector<FileEntry>& files);
    // Removes the temporaries and the folders it made, unless applied.
    ~StagedTree();
    StagedTree(const StagedTree&) = delete;
    StagedTree& operator=(const StagedTree&) = delete;

    // Makes the host's files those of the document: what the host has and the document lacks
    // goes, whatever stands where the document has a folder is replaced by the folder (never
    // written through), links are made and the staged files renamed into place, and each folder
    // takes its mode last, so a folder without write permission is still filled.
    void Apply();

  private:
    struct Entry {
        const FileEntry* file = nullptr;
        std::optional<StagedFile> staged;  // empty for a file whose folder is not one yet
    };
    // The real folder `folder` is, or becomes (made owner-writable meanwhile); false when
    // something else stands on the way.
    bool PrepareFolder(const std::filesystem::path& folder);
    // Removes the temporaries, gives loosened folders their modes back, removes the folders made.
    void Undo();

    std::filesystem::path root_;
    std::map<std::string, Entry> entries_;            // by path: every folder before what it holds
    std::vector<std::filesystem::path> madeFolders_;  // in the order made
    std::vector<std::pair<std::filesystem::path, mode_t>> loosenedFolders_;
    bool applied_ = false;
};

}  // namespace BrixSim

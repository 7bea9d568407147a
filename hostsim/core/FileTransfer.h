// The files a host keeps under its root, as entries of an export document, and back.
#pragma once

#include <sys/types.h>

#include <filesystem>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "hostsim/core/DurableWrite.h"

namespace BrixSim {

// One file entry of a document, as checked and decoded.
struct FileEntry {
    enum class Type { File, Folder, Link };
    std::string path;  // relative to the root, plain names joined by '/'
    Type type = Type::File;
    mode_t mode = 0;              // files and folders
    std::string target;           // links
    off_t size = 0;               // files
    std::vector<Extent> extents;  // files: the data; the rest is a hole
};

// Every folder, file and link below `root` but what IsLeftOut names, sorted by path. A file
// carries its mode, its size and the bytes of its data extents (holes stay holes: a large sparse
// file costs what it holds), and is marked secret when only its owner may read it.
nlohmann::ordered_json ExportFiles(const std::filesystem::path& root);

// Decodes `files`, the file entries of a document, into `entries` (sorted by path, so every
// folder comes before what it holds). Returns what is wrong with them, or empty when nothing is.
std::string ParseFiles(const nlohmann::json& files, std::vector<FileEntry>& entries);

// What an export leaves out and an import leaves alone, by its path relative to the root: the
// store's files, the host's marker, and the temporaries and locks writers hold while writing.
bool IsLeftOut(const std::filesystem::path& relative);

}  // namespace BrixSim

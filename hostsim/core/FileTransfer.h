// The files a host keeps under its root, as entries of an export document, and back.
#pragma once

#include <filesystem>
#include <nlohmann/json.hpp>
#include <string>

namespace BrixSim {

// Every folder, file and link below `root` but the store's own files, the host marker and the
// temporaries and locks of writers, sorted by path. A file carries its mode, its size and the
// bytes of its data extents (holes stay holes: a large sparse file costs what it holds), and is
// marked secret when only its owner may read it.
nlohmann::ordered_json ExportFiles(const std::filesystem::path& root);

// What is wrong with `files` as the file entries of a document, or empty when nothing is.
std::string CheckFiles(const nlohmann::json& files);

// Makes the host's files those of `files` (checked by CheckFiles): entries the host has and the
// document lacks are removed, the others written as the document has them. Never writes through
// a link: whatever stands where a folder must be is replaced by the folder.
void ImportFiles(const std::filesystem::path& root, const nlohmann::json& files);

}  // namespace BrixSim

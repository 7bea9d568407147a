#include "core/FileTransfer.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <boost/archive/iterators/base64_from_binary.hpp>
#include <boost/archive/iterators/binary_from_base64.hpp>
#include <boost/archive/iterators/transform_width.hpp>
#include <cerrno>
#include <map>
#include <set>
#include <system_error>
#include <vector>

#include "core/DurableWrite.h"
#include "core/Fd.h"

namespace BrixSim {

namespace fs = std::filesystem;

namespace {

// Largest file a document may carry: more than any file the host keeps (dump files are sparse).
constexpr uint64_t kMaxFileSize = uint64_t{1} << 40;

// Names the export leaves out: the store, the marker, and what writers hold only while writing.
bool IsBookkeeping(const fs::path& relative) {
    const std::string name = relative.filename().string();
    if (relative.parent_path().empty()) {
        for (const char* own :
             {"host.db", "host.db-wal", "host.db-shm", "host.db-journal", ".brixhost"}) {
            if (name == own) return true;
        }
        if (name.rfind(".brixhost.", 0) == 0) return true;
    }
    if (name.size() > 1 && name[0] == '.') {
        if (name.size() > 5 && name.compare(name.size() - 5, 5, ".lock") == 0) return true;
        if (name.find(".tmp-") != std::string::npos) return true;
    }
    return false;
}

std::string Base64(const std::string& bytes) {
    using namespace boost::archive::iterators;
    using Encoder = base64_from_binary<transform_width<std::string::const_iterator, 6, 8>>;
    std::string text(Encoder(bytes.begin()), Encoder(bytes.end()));
    text.append((3 - bytes.size() % 3) % 3, '=');
    return text;
}

// nullopt when `text` is not canonical base64.
std::optional<std::string> FromBase64(const std::string& text) {
    using namespace boost::archive::iterators;
    if (text.size() % 4 != 0) return std::nullopt;
    const size_t padding = text.size() >= 2 && text[text.size() - 2] == '=' ? 2
                           : !text.empty() && text.back() == '='            ? 1
                                                                            : 0;
    const std::string body = text.substr(0, text.size() - padding);
    const bool alphabet = std::all_of(body.begin(), body.end(), [](char c) {
        return std::isalnum(static_cast<unsigned char>(c)) || c == '+' || c == '/';
    });
    if (!alphabet) return std::nullopt;
    using Decoder = transform_width<binary_from_base64<std::string::const_iterator>, 8, 6>;
    std::string bytes(Decoder(body.begin()), Decoder(body.end()));
    bytes.resize(body.size() * 3 / 4);
    if (Base64(bytes) != text) return std::nullopt;
    return bytes;
}

std::string ModeText(mode_t mode) {
    char text[8];
    snprintf(text, sizeof text, "%04o", static_cast<unsigned>(mode & 07777));
    return text;
}

std::optional<mode_t> ParseMode(const nlohmann::json& value) {
    if (!value.is_string()) return std::nullopt;
    const std::string text = value.get<std::string>();
    if (text.empty() || text.size() > 4 ||
        text.find_first_not_of("01234567") != std::string::npos) {
        return std::nullopt;
    }
    return static_cast<mode_t>(std::stoul(text, nullptr, 8));
}

// The data extents of a file, without the zeros at their ends, so a copy reads back the same.
nlohmann::ordered_json Extents(const fs::path& file, off_t size) {
    auto extents = nlohmann::ordered_json::array();
    Fd fd(::open(file.c_str(), O_RDONLY | O_NOFOLLOW | O_CLOEXEC));
    if (!fd)
        throw std::system_error(errno, std::generic_category(), "cannot read " + file.string());
    off_t at = 0;
    while (at < size) {
        const off_t data = ::lseek(fd.Get(), at, SEEK_DATA);
        if (data < 0) break;  // the rest is a hole
        off_t hole = ::lseek(fd.Get(), data, SEEK_HOLE);
        if (hole < 0) hole = size;
        std::string bytes(static_cast<size_t>(hole - data), '\0');
        size_t done = 0;
        while (done < bytes.size()) {
            const ssize_t n = ::pread(fd.Get(), bytes.data() + done, bytes.size() - done,
                                      data + static_cast<off_t>(done));
            if (n < 0 && errno == EINTR) continue;
            if (n <= 0) {
                throw std::system_error(n < 0 ? errno : EIO, std::generic_category(),
                                        "cannot read " + file.string());
            }
            done += static_cast<size_t>(n);
        }
        const size_t first = bytes.find_first_not_of('\0');
        if (first != std::string::npos) {
            const size_t last = bytes.find_last_not_of('\0');
            nlohmann::ordered_json extent;
            extent["offset"] = static_cast<int64_t>(data) + static_cast<int64_t>(first);
            extent["base64"] = Base64(bytes.substr(first, last - first + 1));
            extents.push_back(std::move(extent));
        }
        at = hole;
    }
    return extents;
}

// A relative path of plain names: no root, no "." or "..", nothing empty.
bool IsPlainRelative(const std::string& text) {
    if (text.empty() || text.front() == '/' || text.back() == '/' ||
        text.find('\0') != std::string::npos) {
        return false;
    }
    for (const auto& part : fs::path(text)) {
        if (part.empty() || part == "." || part == "..") return false;
    }
    return text.find("//") == std::string::npos;
}

// Removes what stands at `path` unless it is a real folder, and makes it one.
void EnsureFolder(const fs::path& path, mode_t mode) {
    struct stat info {};
    if (::lstat(path.c_str(), &info) == 0 && !S_ISDIR(info.st_mode)) fs::remove(path);
    if (::lstat(path.c_str(), &info) != 0) fs::create_directory(path);
    fs::permissions(path, static_cast<fs::perms>(mode));
}

}  // namespace

nlohmann::ordered_json ExportFiles(const fs::path& root) {
    std::map<std::string, nlohmann::ordered_json> entries;
    std::error_code ec;
    for (fs::recursive_directory_iterator it(root, fs::directory_options::none, ec), end;
         !ec && it != end; it.increment(ec)) {
        const fs::path relative = it->path().lexically_relative(root);
        if (IsBookkeeping(relative)) {
            if (it->is_directory(ec) && !it->is_symlink(ec)) it.disable_recursion_pending();
            continue;
        }
        struct stat info {};
        if (::lstat(it->path().c_str(), &info) != 0) continue;  // gone meanwhile
        nlohmann::ordered_json entry;
        entry["path"] = relative.generic_string();
        if (S_ISLNK(info.st_mode)) {
            entry["type"] = "link";
            entry["target"] = fs::read_symlink(it->path()).string();
        } else if (S_ISDIR(info.st_mode)) {
            entry["type"] = "folder";
            entry["mode"] = ModeText(info.st_mode);
        } else if (S_ISREG(info.st_mode)) {
            entry["type"] = "file";
            entry["mode"] = ModeText(info.st_mode);
            // Only its owner may read it: a secret, kept as such.
            if ((info.st_mode & 077) == 0) entry["secret"] = true;
            entry["size"] = static_cast<int64_t>(info.st_size);
            entry["extents"] = Extents(it->path(), info.st_size);
        } else {
            continue;  // sockets and the like are nothing a command reads
        }
        entries.emplace(entry["path"].get<std::string>(), std::move(entry));
    }
    if (ec) throw std::system_error(ec, "cannot read " + root.string());
    auto files = nlohmann::ordered_json::array();
    for (auto& [path, entry] : entries) files.push_back(std::move(entry));
    return files;
}

std::string CheckFiles(const nlohmann::json& files) {
    if (!files.is_array()) return "\"files\" must be an array";
    std::map<std::string, std::string> types;
    size_t index = 0;
    for (const auto& entry : files) {
        const std::string where = "file entry " + std::to_string(index++);
        if (!entry.is_object()) return where + " is not an object";
        if (!entry.contains("path") || !entry["path"].is_string() ||
            !IsPlainRelative(entry["path"].get<std::string>())) {
            return where + ": \"path\" must be a relative path of plain names";
        }
        const std::string path = entry["path"].get<std::string>();
        if (IsBookkeeping(path)) return where + ": " + path + " belongs to the store";
        const std::string type = entry.value("type", "");
        if (!types.emplace(path, type).second) return where + ": " + path + " given twice";
        if (type == "link") {
            if (!entry.contains("target") || !entry["target"].is_string()) {
                return where + ": a link needs a \"target\"";
            }
            const fs::path target = entry["target"].get<std::string>();
            const fs::path resolved = (fs::path(path).parent_path() / target).lexically_normal();
            if (target.empty() || target.is_absolute() || resolved.empty() ||
                *resolved.begin() == "..") {
                return where + ": a link must point inside the host";
            }
            continue;
        }
        if (type != "file" && type != "folder") {
            return where + ": \"type\" must be file, folder or link";
        }
        if (!entry.contains("mode") || !ParseMode(entry["mode"])) {
            return where + ": \"mode\" must be an octal text such as \"0644\"";
        }
        if (type == "folder") continue;
        if (!entry.contains("size") || !entry["size"].is_number_integer() ||
            entry["size"].get<int64_t>() < 0 ||
            static_cast<uint64_t>(entry["size"].get<int64_t>()) > kMaxFileSize) {
            return where + ": \"size\" must be a whole number of bytes";
        }
        const int64_t size = entry["size"].get<int64_t>();
        if (!entry.contains("extents") || !entry["extents"].is_array()) {
            return where + ": \"extents\" must be an array";
        }
        for (const auto& extent : entry["extents"]) {
            if (!extent.is_object() || !extent.contains("offset") ||
                !extent["offset"].is_number_integer() || extent["offset"].get<int64_t>() < 0 ||
                !extent.contains("base64") || !extent["base64"].is_string()) {
                return where + ": an extent needs an \"offset\" and \"base64\" data";
            }
            const auto bytes = FromBase64(extent["base64"].get<std::string>());
            if (!bytes) return where + ": an extent's data is not base64";
            if (extent["offset"].get<int64_t>() > size - static_cast<int64_t>(bytes->size())) {
                return where + ": an extent lies beyond the file's size";
            }
        }
    }
    // Everything but the top level lives in a folder of the document.
    for (const auto& [path, type] : types) {
        const std::string parent = fs::path(path).parent_path().generic_string();
        if (parent.empty()) continue;
        const auto found = types.find(parent);
        if (found == types.end() || found->second != "folder") {
            return path + " is not in a folder of the document";
        }
    }
    return {};
}

void ImportFiles(const fs::path& root, const nlohmann::json& files) {
    std::map<std::string, const nlohmann::json*> wanted;
    for (const auto& entry : files) wanted.emplace(entry["path"].get<std::string>(), &entry);

    // What the host has and the document does not, deepest first.
    std::vector<fs::path> unwanted;
    std::error_code ec;
    for (fs::recursive_directory_iterator it(root, fs::directory_options::none, ec), end;
         !ec && it != end; it.increment(ec)) {
        const fs::path relative = it->path().lexically_relative(root);
        if (IsBookkeeping(relative)) {
            if (it->is_directory(ec) && !it->is_symlink(ec)) it.disable_recursion_pending();
            continue;
        }
        if (wanted.count(relative.generic_string()) == 0) {
            unwanted.push_back(it->path());
            if (it->is_directory(ec) && !it->is_symlink(ec)) it.disable_recursion_pending();
        }
    }
    if (ec) throw std::system_error(ec, "cannot read " + root.string());
    for (const auto& path : unwanted) fs::remove_all(path);

    // Sorted, so every folder comes before what it holds.
    for (const auto& [path, entry] : wanted) {
        const fs::path target = root / path;
        const std::string type = (*entry)["type"].get<std::string>();
        if (type == "folder") {
            EnsureFolder(target, *ParseMode((*entry)["mode"]));
        } else if (type == "link") {
            fs::remove_all(target);
            fs::create_symlink((*entry)["target"].get<std::string>(), target);
        } else {
            struct stat info {};
            if (::lstat(target.c_str(), &info) == 0 && S_ISDIR(info.st_mode))
                fs::remove_all(target);
            std::vector<Extent> extents;
            for (const auto& extent : (*entry)["extents"]) {
                extents.push_back({static_cast<off_t>(extent["offset"].get<int64_t>()),
                                   *FromBase64(extent["base64"].get<std::string>())});
            }
            StagedFile(target, extents, *ParseMode((*entry)["mode"]),
                       static_cast<off_t>((*entry)["size"].get<int64_t>()))
                .Publish();
        }
    }
}

}  // namespace BrixSim

#include "hostsim/core/FileTransfer.h"

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

#include "hostsim/core/Fd.h"

namespace BrixSim {

namespace fs = std::filesystem;

namespace {

// Largest file a document may carry: more than any file the host keeps (dump files are sparse).
constexpr uint64_t kMaxFileSize = uint64_t{1} << 40;

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

// Whether a link at `path` with `target` leads to somewhere inside the root: a relative target
// whose ".." all lead, so it climbs only through the link's own folders (real ones, as the
// document has them) before it descends, and never above the root.
bool IsInsideFrom(const std::string& path, const std::string& target) {
    if (target.empty() || target.front() == '/' || target.find('\0') != std::string::npos) {
        return false;
    }
    size_t climbs = 0;
    bool descending = false;
    for (const auto& part : fs::path(target)) {
        if (part == "..") {
            if (descending) return false;
            ++climbs;
        } else if (!part.empty() && part != ".") {
            descending = true;
        }
    }
    const auto depth = static_cast<size_t>(
        std::distance(fs::path(path).parent_path().begin(), fs::path(path).parent_path().end()));
    return climbs <= depth;
}

}  // namespace

bool IsLeftOut(const fs::path& relative) {
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

nlohmann::ordered_json ExportFiles(const fs::path& root) {
    std::map<std::string, nlohmann::ordered_json> entries;
    std::error_code ec;
    for (fs::recursive_directory_iterator it(root, fs::directory_options::none, ec), end;
         !ec && it != end; it.increment(ec)) {
        const fs::path relative = it->path().lexically_relative(root);
        if (IsLeftOut(relative)) {
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

std::string ParseFiles(const nlohmann::json& files, std::vector<FileEntry>& entries) {
    if (!files.is_array()) return "\"files\" must be an array";
    std::map<std::string, FileEntry> parsed;
    size_t index = 0;
    for (const auto& json : files) {
        const std::string where = "file entry " + std::to_string(index++);
        if (!json.is_object()) return where + " is not an object";
        if (!json.contains("path") || !json["path"].is_string() ||
            !IsPlainRelative(json["path"].get<std::string>())) {
            return where + ": \"path\" must be a relative path of plain names";
        }
        FileEntry entry;
        entry.path = json["path"].get<std::string>();
        if (IsLeftOut(entry.path)) return where + ": " + entry.path + " belongs to the store";
        const std::string type = json.contains("type") && json["type"].is_string()
                                     ? json["type"].get<std::string>()
                                     : std::string();
        if (type != "file" && type != "folder" && type != "link") {
            return where + ": \"type\" must be file, folder or link";
        }
        entry.type = type == "file"     ? FileEntry::Type::File
                     : type == "folder" ? FileEntry::Type::Folder
                                        : FileEntry::Type::Link;
        const std::set<std::string> keys =
            type == "link" ? std::set<std::string>{"path", "type", "target"}
            : type == "folder"
                ? std::set<std::string>{"path", "type", "mode"}
                : std::set<std::string>{"path", "type", "mode", "secret", "size", "extents"};
        for (const auto& [key, value] : json.items()) {
            (void)value;
            if (keys.count(key) == 0) return where + ": a " + type + " has no \"" + key + "\"";
        }

        if (entry.type == FileEntry::Type::Link) {
            if (!json.contains("target") || !json["target"].is_string()) {
                return where + ": a link needs a \"target\"";
            }
            entry.target = json["target"].get<std::string>();
            if (!IsInsideFrom(entry.path, entry.target)) {
                return where + ": a link must point inside the host";
            }
        } else {
            const auto mode = json.contains("mode") ? ParseMode(json["mode"]) : std::nullopt;
            if (!mode) return where + ": \"mode\" must be an octal text such as \"0644\"";
            entry.mode = *mode;
        }

        if (entry.type == FileEntry::Type::File) {
            if (json.contains("secret")) {
                if (!json["secret"].is_boolean())
                    return where + ": \"secret\" must be true or false";
                if (json["secret"].get<bool>() && (entry.mode & 077) != 0) {
                    return where + ": a secret file must be readable by its owner only";
                }
            }
            if (!json.contains("size") || !json["size"].is_number_integer() ||
                json["size"].get<int64_t>() < 0 ||
                static_cast<uint64_t>(json["size"].get<int64_t>()) > kMaxFileSize) {
                return where + ": \"size\" must be a whole number of bytes";
            }
            entry.size = static_cast<off_t>(json["size"].get<int64_t>());
            if (!json.contains("extents") || !json["extents"].is_array()) {
                return where + ": \"extents\" must be an array";
            }
            off_t end = 0;
            for (const auto& extent : json["extents"]) {
                if (!extent.is_object() || extent.size() != 2 || !extent.contains("offset") ||
                    !extent["offset"].is_number_integer() || extent["offset"].get<int64_t>() < 0 ||
                    !extent.contains("base64") || !extent["base64"].is_string()) {
                    return where + ": an extent needs an \"offset\" and \"base64\" data";
                }
                auto bytes = FromBase64(extent["base64"].get<std::string>());
                if (!bytes) return where + ": an extent's data is not base64";
                const int64_t offset = extent["offset"].get<int64_t>();
                if (offset >
                    static_cast<int64_t>(entry.size) - static_cast<int64_t>(bytes->size())) {
                    return where + ": an extent lies beyond the file's size";
                }
                if (offset < end) return where + ": the extents overlap or are out of order";
                end = static_cast<off_t>(offset + static_cast<int64_t>(bytes->size()));
                entry.extents.push_back({static_cast<off_t>(offset), std::move(*bytes)});
            }
        }
        const std::string path = entry.path;
        if (!parsed.emplace(path, std::move(entry)).second) {
            return where + ": " + path + " given twice";
        }
    }
    // Everything but the top level lives in a folder of the document.
    for (const auto& [path, entry] : parsed) {
        const std::string parent = fs::path(path).parent_path().generic_string();
        if (parent.empty()) continue;
        const auto found = parsed.find(parent);
        if (found == parsed.end() || found->second.type != FileEntry::Type::Folder) {
            return path + " is not in a folder of the document";
        }
    }
    entries.clear();
    for (auto& [path, entry] : parsed) entries.push_back(std::move(entry));
    return {};
}

}  // namespace BrixSim

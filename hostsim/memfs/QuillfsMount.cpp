// Mounting and unmounting Quillfs RAM disks.
#include "hostsim/memfs/QuillfsMount.h"

#include <algorithm>
#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/split.hpp>
#include <cerrno>
#include <charconv>
#include <filesystem>
#include <optional>
#include <string>
#include <system_error>
#include <vector>

#include "hostsim/core/Hooks.h"
#include "hostsim/core/Store.h"
#include "hostsim/memfs/QuillfsState.h"

namespace {

using BrixSim::Store;

// Inodes a RAM disk may hold when the mount does not limit them.
constexpr int64_t kDefaultMaxInodes = 8192;
// Inodes are allocated to a RAM disk in chunks of this many.
constexpr int64_t kInodeChunk = 128;
// The kernel keeps a mount point in a 132-byte slot, NUL included.
constexpr size_t kMaxMountPoint = 131;
constexpr size_t kMaxName = 63;

// A decimal (or, with base 8, octal) number of at most `max`, digits only.
std::optional<int64_t> Number(const std::string& text, int base, int64_t max) {
    if (text.empty() || text.size() > 12) return std::nullopt;
    int64_t value = 0;
    const auto end = text.data() + text.size();
    const auto parsed = std::from_chars(text.data(), end, value, base);
    if (parsed.ec != std::errc() || parsed.ptr != end || text[0] == '-' || text[0] == '+' ||
        value > max) {
        return std::nullopt;
    }
    return value;
}

bool ValidName(const std::string& name) {
    if (name.empty() || name.size() > kMaxName) return false;
    for (char c : name) {
        const bool ok = (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') ||
                        (c >= '0' && c <= '9') || c == '_' || c == '-' || c == '.';
        if (!ok) return false;
    }
    return name != "." && name != "..";
}

}  // namespace

std::optional<BrixSim::Quillfs::RamdiskOptions> BrixSim::Quillfs::ParseMountData(
    const std::string& data) {
    std::vector<std::string> fields;
    boost::algorithm::split(fields, data, boost::algorithm::is_any_of(","));
    if (fields.size() != 7) return std::nullopt;
    constexpr int64_t u32 = 4294967295;
    const auto reservedMib = Number(fields[0], 10, u32);
    const auto maxMib = Number(fields[1], 10, u32);
    const auto reservedInodes = Number(fields[2], 10, u32);
    const auto maxInodes = Number(fields[3], 10, u32);
    const auto permissions = Number(fields[5], 8, 07777);
    if (!reservedMib || !maxMib || !reservedInodes || !maxInodes || !permissions) {
        return std::nullopt;
    }
    if (fields[4] != "0" && fields[4] != "1") return std::nullopt;
    if (!ValidName(fields[6])) return std::nullopt;

    RamdiskOptions options{*reservedMib,     *maxMib,      *reservedInodes, *maxInodes,
                           fields[4] == "1", *permissions, fields[6]};
    if (options.reservedMib > options.maxMib) return std::nullopt;
    if (options.maxInodes == 0) options.maxInodes = kDefaultMaxInodes;
    if (options.reservedInodes > options.maxInodes) return std::nullopt;
    return options;
}

namespace {

// The host path as the kernel names the mount: absolute, normalised, no trailing slash.
std::string MountPoint(const std::string& target) {
    const std::string absolute = target.front() == '/' ? target : "/" + target;
    std::string path = std::filesystem::path(absolute).lexically_normal().generic_string();
    while (path.size() > 1 && path.back() == '/') path.pop_back();
    return path;
}

int Mount(const std::string&, const std::string& target, unsigned long, const std::string& data) {
    auto& store = Store::Get();
    if (target.empty()) return ENOENT;
    const auto resolved = store.Resolve(target);
    if (!resolved) return EACCES;
    std::error_code error;
    const auto status = std::filesystem::status(*resolved, error);
    if (!std::filesystem::exists(status)) return ENOENT;
    if (!std::filesystem::is_directory(status)) return ENOTDIR;
    const std::string mountPoint = MountPoint(target);

    int result = 0;
    store.Write([&] {
        auto mounted = store.Prepare("SELECT 1 FROM quillfs_ramdisks WHERE mount_point = ?");
        mounted.Bind(1, mountPoint);
        if (mounted.Step()) {
            result = EBUSY;
            return;
        }
        const auto options = BrixSim::Quillfs::ParseMountData(data);
        if (!options) {
            result = EINVAL;
            return;
        }
        if (mountPoint.size() > kMaxMountPoint) {
            result = ENAMETOOLONG;
            return;
        }
        auto named = store.Prepare("SELECT 1 FROM quillfs_ramdisks WHERE name = ?");
        named.Bind(1, options->name);
        if (named.Step()) {
            result = EEXIST;
            return;
        }
        // A new RAM disk holds only its root directory: one inode in use, the reservation
        // (at least one chunk) allocated up front.
        const int64_t allocated = std::max(
            kInodeChunk, (options->reservedInodes + kInodeChunk - 1) / kInodeChunk * kInodeChunk);
        store
            .Prepare(
                "INSERT INTO quillfs_ramdisks (name, mount_point, reserved_mib, max_mib,"
                " used_pages, peak_pages, coredump, system, permissions, reserved_inodes,"
                " max_inodes, allocated_inodes, used_inodes)"
                " VALUES (?, ?, ?, ?, 0, 0, ?, 0, ?, ?, ?, ?, 1)")
            .Bind(1, options->name)
            .Bind(2, mountPoint)
            .Bind(3, options->reservedMib)
            .Bind(4, options->maxMib)
            .Bind(5, options->coredump)
            .Bind(6, options->permissions)
            .Bind(7, options->reservedInodes)
            .Bind(8, options->maxInodes)
            .Bind(9, std::min(allocated, options->maxInodes))
            .Run();
    });
    return result;
}

int Umount(const std::string& target) {
    auto& store = Store::Get();
    if (target.empty()) return EINVAL;
    const std::string mountPoint = MountPoint(target);
    int result = 0;
    store.Write([&] {
        auto row = store.Prepare("SELECT id, system FROM quillfs_ramdisks WHERE mount_point = ?");
        row.Bind(1, mountPoint);
        if (!row.Step()) {
            result = EINVAL;  // nothing of ours mounted there
            return;
        }
        const int64_t id = row.Int(0);
        // The host's own RAM disks are always in use, and so is one with a mount inside it.
        auto nested = store.Prepare(
            "SELECT 1 FROM quillfs_ramdisks WHERE substr(mount_point, 1, length(?) + 1) = ? || '/'"
            " AND id <> ?");
        nested.Bind(1, mountPoint).Bind(2, mountPoint).Bind(3, id);
        if (row.Int(1) != 0 || nested.Step()) {
            result = EBUSY;
            return;
        }
        BrixSim::Quillfs::RecordInodePeaks(store);
        store.Prepare("DELETE FROM quillfs_ramdisks WHERE id = ?").Bind(1, id).Run();
    });
    return result;
}

const bool registered = BrixSim::RegisterFileSystemType("quillfs", {Mount, Umount});

}  // namespace

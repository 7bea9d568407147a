// The kernel's system-information records: packed, little-endian, integers at fixed (possibly
// unaligned) offsets, texts NUL-terminated in fixed-width slots. The layouts are written here once,
// for the kernel side that fills the records and the commands that read them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>

namespace KernCtl::Ksi {

// KSI_NODE_system_worlds_info, one world.
namespace WorldRecord {
constexpr size_t kId = 0;
constexpr size_t kCartelId = 4;
constexpr size_t kParentCartelId = 8;
constexpr size_t kWorldGroupId = 12;
constexpr size_t kCartelGroupId = 16;
constexpr size_t kSessionId = 20;
constexpr size_t kFlags = 24;
constexpr size_t kState = 28;   // one byte
constexpr size_t kType = 29;    // one byte
constexpr size_t kDomain = 30;  // unaligned
constexpr size_t kName = 34;
constexpr size_t kNameWidth = 64;
constexpr size_t kCommandLine = 98;
constexpr size_t kCommandLineWidth = 512;
constexpr size_t kSize = 610;
}  // namespace WorldRecord

// KSI_NODE_system_quillfs_stats: inode counters of the whole in-memory file system.
namespace QuillfsStatusRecord {
constexpr size_t kTotal = 4, kUsed = 8, kPeakUsed = 12, kUnlinked = 16, kPeakUnlinked = 20,
                 kReserved = 24, kPeakReserved = 28;
constexpr size_t kSize = 1124;
}  // namespace QuillfsStatusRecord

// KSI_NODE_system_quillfs_ramdisks_stats, one RAM disk: limits in MiB, use in 4 KiB pages.
namespace RamdiskRecord {
constexpr size_t kReservedMib = 0, kMaximumMib = 4, kUsedPages = 8, kPeakPages = 12;
constexpr size_t kReservedInodes = 16, kPermissions = 20;
constexpr size_t kCoredump = 24, kSystem = 25;  // one byte each
constexpr size_t kMountPoint = 30, kMountPointWidth = 132;
constexpr size_t kMaxInodes = 162, kAllocatedInodes = 166, kUsedInodes = 170;
constexpr size_t kSize = 180;
}  // namespace RamdiskRecord

// KSI_NODE_system_quillfs_tardisks_stats, one tardisk: its size in a 32-bit counter.
namespace TardiskRecord {
constexpr size_t kBytes = 0, kSystem = 8;
constexpr size_t kSize = 28;
}  // namespace TardiskRecord

inline uint32_t ReadU32(const unsigned char* record, size_t offset) {
    return static_cast<uint32_t>(record[offset]) | static_cast<uint32_t>(record[offset + 1]) << 8 |
           static_cast<uint32_t>(record[offset + 2]) << 16 |
           static_cast<uint32_t>(record[offset + 3]) << 24;
}

// The NUL-terminated text in a slot of `width` bytes.
inline std::string ReadText(const unsigned char* record, size_t offset, size_t width) {
    const char* start = reinterpret_cast<const char*>(record + offset);
    return std::string(start, strnlen(start, width));
}

class RecordWriter {
  public:
    // Zero-fills the whole buffer.
    RecordWriter(void* buffer, size_t size)
        : bytes_(static_cast<unsigned char*>(buffer)), size_(size) {
        std::memset(bytes_, 0, size_);
    }

    void U8(size_t offset, uint8_t value) {
        if (offset < size_) bytes_[offset] = value;
    }
    void U32(size_t offset, uint32_t value) {
        for (size_t i = 0; i < 4; ++i) U8(offset + i, static_cast<uint8_t>(value >> (8 * i)));
    }
    // Stores at most width - 1 bytes of `text` followed by a NUL.
    void Text(size_t offset, size_t width, std::string_view text) {
        const size_t n = text.size() < width ? text.size() : width - 1;
        for (size_t i = 0; i < n; ++i) U8(offset + i, static_cast<uint8_t>(text[i]));
    }

  private:
    unsigned char* bytes_;
    size_t size_;
};

}  // namespace KernCtl::Ksi

// Packed little-endian kernel system-information records, as the kernel lays them out:
// integers at fixed (possibly unaligned) offsets, texts NUL-terminated in fixed-width slots.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>

#include "hostctl/HostCtlException.h"

namespace BrixSim::Ksi {

// Refuses a buffer too small for the node's record; a larger one is zero-padded.
inline void RequireSize(const char* node, size_t size, size_t recordSize) {
    if (size < recordSize) {
        throw HostCtl::Lib::HostCtlException(std::string("Sysinfo node ") + node + ": record is " +
                                             std::to_string(recordSize) + " bytes, buffer holds " +
                                             std::to_string(size));
    }
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

}  // namespace BrixSim::Ksi

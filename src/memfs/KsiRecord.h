// Reading the kernel's packed, little-endian system-information records.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "kernctl/Sysinfo.h"

namespace OstrelCli::System {

// The unsigned 32-bit integer at `offset` (records are packed, so it may be unaligned).
inline uint32_t RecordU32(const unsigned char* record, size_t offset) {
    return static_cast<uint32_t>(record[offset]) | static_cast<uint32_t>(record[offset + 1]) << 8 |
           static_cast<uint32_t>(record[offset + 2]) << 16 |
           static_cast<uint32_t>(record[offset + 3]) << 24;
}

// The NUL-terminated text in the `width` bytes at `offset`.
inline std::string RecordText(const unsigned char* record, size_t offset, size_t width) {
    const char* start = reinterpret_cast<const char*>(record + offset);
    return std::string(start, strnlen(start, width));
}

// Lists the instances of `listNode` and calls `visit(name, record)` with each one's record of
// `size` bytes, read from `recordNode`, in the kernel's order. A failing read ends the walk.
template <class Visit>
void ForEachInstance(uint32_t listNode, uint32_t recordNode, size_t size, Visit&& visit) {
    KernCtl::Util::Sysinfo list(listNode);
    KernCtl::Util::Sysinfo records(recordNode);
    std::vector<std::string> names;
    list.List(names);
    std::vector<unsigned char> record(size);
    for (const auto& name : names) {
        records.ResetInstance();
        records.AddInstancePath(name);
        records.Get(record.data(), record.size());
        visit(name, record.data());
    }
}

}  // namespace OstrelCli::System

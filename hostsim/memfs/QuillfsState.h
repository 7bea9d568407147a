// Quillfs state shared by the kernel's information nodes and its mount handler.
#pragma once

#include <cstdint>

namespace BrixSim {
class Store;
}

namespace BrixSim::Quillfs {

// Inode counters of the whole file system; peaks are never below the current values.
struct InodeStatus {
    int64_t total = 0;
    int64_t used = 0;
    int64_t peakUsed = 0;
    int64_t unlinked = 0;
    int64_t peakUnlinked = 0;
    int64_t reserved = 0;
    int64_t peakReserved = 0;
};

InodeStatus ReadInodeStatus(Store& store);
// Keeps the current counters as peaks before they drop (a RAM disk going away).
void RecordInodePeaks(Store& store);

}  // namespace BrixSim::Quillfs

#include "LargePageHeap.h"

#include <array>
#include <cstdint>
#include <cstdlib>  // defines __GLIBC__ with the C library's own headers

#if defined(__linux__) && defined(__GLIBC__)
#include <malloc.h>
#include <sys/mman.h>
#include <unistd.h>
#endif

namespace BrixCli {

void ReserveLargePageHeap() {
#if defined(__linux__) && defined(__GLIBC__)
    // A listing of many thousands of rows builds hundreds of megabytes of small objects; with
    // 4 KiB pages most of its time goes to page faults and TLB misses. The next growth of the
    // heap takes 256 MiB of address space at once (nothing is touched), and that range is
    // marked for huge pages past its first few megabytes, which a getter stays within.
    constexpr size_t kStep = size_t{256} << 20;
    constexpr uintptr_t kHugePage = uintptr_t{2} << 20;
    constexpr uintptr_t kSmallPages = uintptr_t{4} << 20;
    if (mallopt(M_TOP_PAD, static_cast<int>(kStep)) != 1) return;
    const auto start = reinterpret_cast<uintptr_t>(sbrk(0));
    // Blocks below the mmap threshold come from the heap: take them until it grows once.
    std::array<void*, 64> blocks{};
    size_t taken = 0;
    auto end = start;
    while (taken < blocks.size() && end == start) {
        blocks[taken++] = std::malloc(64 << 10);
        end = reinterpret_cast<uintptr_t>(sbrk(0));
    }
    // Marked before the blocks go back: freeing them may trim the heap's end a little.
    const uintptr_t from = ((start + kHugePage - 1) & ~(kHugePage - 1)) + kSmallPages;
    if (end > from) madvise(reinterpret_cast<void*>(from), end - from, MADV_HUGEPAGE);
    for (size_t i = 0; i < taken; ++i) std::free(blocks[i]);
#endif
}

}  // namespace BrixCli

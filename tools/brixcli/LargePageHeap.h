// Start-up tuning of the process heap for long listings.
#pragma once

namespace BrixCli {

// Makes the heap grow in one large step of address space marked for transparent huge pages.
// Does nothing where the C library or the kernel offers no such thing.
void ReserveLargePageHeap();

}  // namespace BrixCli

// Which boot of the host is running. State that the kernel keeps only in memory (log levels,
// the runtime values of boot settings) is stored with the boot it belongs to and counts as
// gone once another boot runs.
#pragma once

#include <cstdint>

namespace BrixSim {
class Store;
}

namespace BrixSim::Kernel {

// The running boot: 0 for the boot the host was created in, one more after every restart
// (a reboot, or a power-off and the power-on that follows).
int64_t CurrentBoot(Store& store);

}  // namespace BrixSim::Kernel

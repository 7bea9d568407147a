#include "hostsim/core/Boot.h"

#include "hostsim/core/Store.h"

namespace BrixSim::Kernel {

int64_t CurrentBoot(Store& store) {
    // Kept by the host's init when it is signalled to restart or stop.
    return store.GetInt("power.reboots", 0) + store.GetInt("power.poweroffs", 0);
}

}  // namespace BrixSim::Kernel

#include "hostsim/core/Fd.h"

#include <unistd.h>

namespace BrixSim {

// The one place the simulated host closes a descriptor.
void Fd::Reset() {
    if (fd_ >= 0) ::close(fd_);
    fd_ = -1;
}

}  // namespace BrixSim

// The host's SLP daemon as the simulated host keeps it: its process, start time and counters.
#pragma once

#include "hostctl/SlpAgent.h"

namespace BrixSim::Slp {

// Fills `stats` from the store, with the times as text.
void ReadDaemonStats(HostCtl::System::SLPStats& stats);

}  // namespace BrixSim::Slp

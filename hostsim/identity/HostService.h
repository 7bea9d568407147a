// The host service's maintenance-mode transitions, shared by the simulator library and the
// host's management-service program (/bin/mgmt-cmd).
#pragma once

#include <cstdint>
#include <string>

namespace BrixSim::Maintenance {

// The data actions a host may take on its distributed-storage disks before entering.
bool IsDornaMode(const std::string& mode);

// Enters maintenance mode within `timeoutSeconds` (0: no limit). Throws
// HostCtl::Lib::HostCtlException when the host is already in maintenance mode.
void Enter(int64_t timeoutSeconds, const std::string& dornaMode);
// Leaves maintenance mode. Throws when the host is not in maintenance mode.
void Exit(int64_t timeoutSeconds);

}  // namespace BrixSim::Maintenance

// The core's registries, read by the store, the OS seam and the brixsim tool.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "hostsim/core/Hooks.h"
#include "hostsim/core/Store.h"

namespace BrixSim {

// Every area's tables, in registration order.
const std::vector<TableSet>& RegisteredTables();
// Every operation name that can be made to fail, sorted and without duplicates.
const std::map<uint32_t, SysinfoNode>& RegisteredSysinfoNodes();
const std::map<std::string, FileSystemType>& RegisteredFileSystemTypes();
// The removal handler of a held file, or null.
const std::function<int()>* FindHeldFile(const std::string& hostPath);
// The keys of `brixsim init --scale`, by name.
const std::map<std::string, ScaleKey>& RegisteredScaleKeys();
// Restarts the host's running state; called inside a write transaction.
void RunBootSteps(Store& store);

}  // namespace BrixSim

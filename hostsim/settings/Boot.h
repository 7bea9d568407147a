// Which boot of the host is running. State that the kernel keeps only in memory (log levels,
// the runtime values of boot settings) is stored with the boot it belongs to and counts as
// gone once another boot runs.
#pragma once

#include <cstdint>
#include <optional>

namespace BrixSim {
class Store;
class Stmt;
}  // namespace BrixSim

namespace BrixSim::Kernel {

// The running boot's identifier.
int64_t CurrentBoot(Store& store);

// Whether state recorded during `boot` still holds in the boot `current`. A null boot is state
// the host was created with, which holds until the first restart.
bool SameBoot(Store& store, const std::optional<int64_t>& boot, int64_t current);

// The boot column at `column` of the current row.
std::optional<int64_t> BootColumn(const Stmt& row, int column);

}  // namespace BrixSim::Kernel

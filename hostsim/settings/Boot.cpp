// The running boot is identified by the time it started, as the host's statistics record it:
// a restart of the simulated host records a new start time.
#include "settings/Boot.h"

#include <string>

#include "core/Store.h"

namespace BrixSim::Kernel {

namespace {
constexpr char kCreationBootKey[] = "kernel.creation_boot";
}

int64_t CurrentBoot(Store& store) {
    auto row = store.Prepare("SELECT boot_time_us FROM server_stats WHERE id = 1");
    const int64_t boot = row.Step() ? row.Int(0) : 0;
    // The first look at the boot remembers the one the host was created in.
    if (!store.GetValue(kCreationBootKey)) {
        store.Write([&] { store.SetInt(kCreationBootKey, boot); });
    }
    return boot;
}

bool SameBoot(Store& store, const std::optional<int64_t>& boot, int64_t current) {
    if (boot) return *boot == current;
    return store.GetInt(kCreationBootKey, current) == current;
}

std::optional<int64_t> BootColumn(const Stmt& row, int column) {
    if (row.IsNull(column)) return std::nullopt;
    return row.Int(column);
}

}  // namespace BrixSim::Kernel

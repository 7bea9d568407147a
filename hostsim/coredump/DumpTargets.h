// State shared by the storage service's dump-target kinds: each kind keeps its active and its
// configured target as two host settings, and every change is one journaled transaction.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "hostsim/core/Hooks.h"
#include "hostsim/core/Store.h"

namespace BrixSim::Coredump {

// The two settings of one kind of dump target ("" = none).
struct TargetKeys {
    const char* active;
    const char* configured;
};

inline constexpr TargetKeys kPartitionKeys{"coredump.partition.active",
                                           "coredump.partition.configured"};
inline constexpr TargetKeys kFileKeys{"coredump.file.active", "coredump.file.configured"};
inline constexpr TargetKeys kDornaKeys{"coredump.dorna.active", "coredump.dorna.configured"};

// The host's memory, from which default dump sizes are computed.
inline constexpr const char* kMemoryKey = "coredump.memory_mb";
constexpr uint64_t kMiB = 1024 * 1024;

// Default size of a dump target in MiB for a host with this much memory.
inline uint64_t DefaultDumpSizeMb(int64_t memoryMb) {
    return 256 + static_cast<uint64_t>(memoryMb > 0 ? memoryMb : 0) / 256;
}

// Runs `change` in one write transaction and journals the call in it.
template <class Change>
void Mutate(const Operation& operation, const std::vector<Value>& args, Change&& change) {
    auto& store = Store::Get();
    store.Write([&] {
        change(store);
        store.JournalCall(operation, args);
    });
}

}  // namespace BrixSim::Coredump

// Server statistics from the host's state: uptime since the simulated boot, running processes
// and the load figures.
#include "hostctl/ServerStats.h"

#include <chrono>

#include "hostsim/core/Hooks.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"

namespace {

const BrixSim::Operation kFetchAllStats{"HostCtl::AdvStats::ServerStats::FetchAllStats"};

// Uptime is measured on the real clock, so setting the host's time does not move it.
int64_t RealNowMicros() {
    return std::chrono::duration_cast<std::chrono::microseconds>(
               std::chrono::system_clock::now().time_since_epoch())
        .count();
}

const bool registered = [] {
    return BrixSim::RegisterTables({
        "stats",
        "CREATE TABLE IF NOT EXISTS server_stats ("
        " id INTEGER PRIMARY KEY CHECK (id = 1),"
        " boot_time_us INTEGER NOT NULL,"  // real clock at the last boot, microseconds
        " running INTEGER NOT NULL,"
        " load_count INTEGER NOT NULL,"
        " load1 INTEGER NOT NULL, load5 INTEGER NOT NULL, load15 INTEGER NOT NULL);",
        [](BrixSim::Store& store) {
            // Booted a little over three days ago, lightly loaded.
            const int64_t now = RealNowMicros();
            store.Prepare("INSERT INTO server_stats VALUES (1, ?, 3, 1, 37, 52, 48)")
                .Bind(1, now - 273'645'120'000LL)
                .Run();
        },
    });
}();

const bool restarts = BrixSim::RegisterBootStep([](BrixSim::Store& store) {
    store.Prepare("UPDATE server_stats SET boot_time_us = ?").Bind(1, RealNowMicros()).Run();
});

}  // namespace

namespace HostCtl::AdvStats {

ServerStats::ServerStats() = default;
ServerStats::~ServerStats() = default;

void ServerStats::FetchAllStats() {
    auto& store = BrixSim::Store::Get();
    store.Check(kFetchAllStats);
    auto row = store.Prepare(
        "SELECT boot_time_us, running, load_count, load1, load5, load15 FROM server_stats");
    if (!row.Step()) return;
    uptime_ = RealNowMicros() - row.Int(0);
    running_ = static_cast<int32_t>(row.Int(1));
    loadCount_ = static_cast<int32_t>(row.Int(2));
    load1_ = static_cast<uint32_t>(row.Int(3));
    load5_ = static_cast<uint32_t>(row.Int(4));
    load15_ = static_cast<uint32_t>(row.Int(5));
}

}  // namespace HostCtl::AdvStats

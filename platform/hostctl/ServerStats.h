// Server statistics: a snapshot of uptime, running processes and load.
#pragma once

#include <cstdint>

namespace HostCtl::AdvStats {

class ServerStats {
  public:
    ServerStats();
    ~ServerStats();

    // Takes a fresh snapshot.
    void FetchAllStats();

    // Microseconds since the host booted.
    int64_t GetUptime() const { return uptime_; }

    // Processes currently running.
    int32_t GetRunningProcesses() const { return running_; }
    // The load group's count N: loads are kept as N x 100 times the average.
    int32_t GetLoadCount() const { return loadCount_; }
    // Load figures for the last 1, 5 and 15 minutes, scaled by N x 100.
    uint32_t GetLoad1() const { return load1_; }
    uint32_t GetLoad5() const { return load5_; }
    uint32_t GetLoad15() const { return load15_; }

  private:
    int64_t uptime_ = 0;
    int32_t running_ = 0;
    int32_t loadCount_ = 0;
    uint32_t load1_ = 0;
    uint32_t load5_ = 0;
    uint32_t load15_ = 0;
};

}  // namespace HostCtl::AdvStats

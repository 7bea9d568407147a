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

    // --- process statistics ---

private:
    int64_t uptime_ = 0;
};

}  // namespace HostCtl::AdvStats

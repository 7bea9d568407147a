// The mount data of a Quillfs RAM disk: "min-MiB,max-MiB,reserved-inodes,max-inodes,coredump,
// mode,name", e.g. "32,64,0,0,0,0755,r1".
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace BrixSim::Quillfs {

struct RamdiskOptions {
    int64_t reservedMib = 0;
    int64_t maxMib = 0;
    int64_t reservedInodes = 0;
    int64_t maxInodes = 0;  // the default limit when the data gives 0
    bool coredump = false;
    int64_t permissions = 0;
    std::string name;
};

// The options the data gives, or nullopt (the mount fails with EINVAL) for a wrong field count,
// a field that is not a number in range, a bad name, or a reservation above its limit.
std::optional<RamdiskOptions> ParseMountData(const std::string& data);

}  // namespace BrixSim::Quillfs

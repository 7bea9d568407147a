// What every system-information node handler checks before it fills a record.
#pragma once

#include <cstddef>
#include <string>

#include "hostctl/HostCtlException.h"
#include "kernctl/SysinfoRecords.h"

namespace BrixSim::Ksi {

using KernCtl::Ksi::RecordWriter;

// Refuses a buffer too small for the node's record; a larger one is zero-padded.
inline void RequireSize(const char* node, size_t size, size_t recordSize) {
    if (size < recordSize) {
        throw HostCtl::Lib::HostCtlException(std::string("Sysinfo node ") + node + ": record is " +
                                             std::to_string(recordSize) + " bytes, buffer holds " +
                                             std::to_string(size));
    }
}

}  // namespace BrixSim::Ksi

// Walking the instances of a kernel system-information node with their records.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "kernctl/Sysinfo.h"
#include "kernctl/SysinfoRecords.h"

namespace OstrelCli::System {

using KernCtl::Ksi::ReadText;
using KernCtl::Ksi::ReadU32;

// Calls `visit(name, record)` with the record of `size` bytes of each instance of `listNode`,
// read from `recordNode`, in the kernel's order. A failing read ends the walk.
template <class Visit>
void ForEachInstance(uint32_t listNode, uint32_t recordNode, size_t size, Visit&& visit) {
    KernCtl::Util::Sysinfo list(listNode);
    KernCtl::Util::Sysinfo records(recordNode);
    std::vector<unsigned char> record(size);
    list.Each([&](const std::string& name) {
        records.ResetInstance();
        records.AddInstancePath(name);
        records.Get(record.data(), record.size());
        visit(name, record.data());
    });
}

}  // namespace OstrelCli::System

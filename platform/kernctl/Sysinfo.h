// Kernel system-information (KSI) nodes: fixed-size records read by node and instance.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

// Node identifiers published by the kernel.
constexpr uint16_t KSI_NODE_system_version = 0x0101;
// --- memory file system nodes ---

namespace KernCtl::Util {

class Sysinfo {
public:
    explicit Sysinfo(uint32_t node);

    // Fills `buffer` with `size` bytes of the selected instance's record.
    void Get(void* buffer, size_t size);
    // The instance names below the selected instance path.
    void List(std::vector<std::string>& names);
    void ResetInstance();
    void AddInstancePath(const std::string& name);

private:
    uint32_t node_;
    std::vector<std::string> instancePath_;
};

}  // namespace KernCtl::Util

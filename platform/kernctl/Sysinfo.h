// Kernel system-information (KSI) nodes: fixed-size records read by node and instance.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

// Node identifiers published by the kernel.
constexpr uint16_t KSI_NODE_system_version = 0x0101;
// --- memory file system nodes ---
constexpr uint16_t KSI_NODE_system_quillfs_stats = 0x0701;
constexpr uint16_t KSI_NODE_system_quillfs_ramdisks = 0x0702;
constexpr uint16_t KSI_NODE_system_quillfs_ramdisks_stats = 0x0703;
constexpr uint16_t KSI_NODE_system_quillfs_tardisks = 0x0704;
constexpr uint16_t KSI_NODE_system_quillfs_tardisks_stats = 0x0705;
// User-level worlds: instance names are world ids in decimal.
constexpr uint16_t KSI_NODE_system_worlds = 0x0601;
constexpr uint16_t KSI_NODE_system_worlds_info = 0x0602;

namespace KernCtl::Util {

class Sysinfo {
  public:
    explicit Sysinfo(uint32_t node);

    // Fills `buffer` with `size` bytes of the selected instance's record.
    void Get(void* buffer, size_t size);
    // The instance names below the selected instance path.
    void List(std::vector<std::string>& names);
    // As List, one name at a time, for a node with more instances than are worth holding.
    void Each(const std::function<void(const std::string& name)>& name);
    void ResetInstance();
    void AddInstancePath(const std::string& name);

  private:
    uint32_t node_;
    std::vector<std::string> instancePath_;
};

}  // namespace KernCtl::Util

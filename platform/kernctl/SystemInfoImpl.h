// Kernel-control system information: identity, banner, and the kernel facilities that hang off
// the system object. Methods are grouped by the area that uses them.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace HostCtl::System {
class Module;
class LogLevel;
}  // namespace HostCtl::System

namespace KernCtl::System {

class SystemInfoImpl {
public:
    SystemInfoImpl();
    ~SystemInfoImpl();

    // --- identity ---
    std::string GetSystemUuid();
    std::string GetBootNicMacAddress();
    std::string GetBootFsUUID();
    std::string GetStatelessBootNicMacAddress();
    std::string GetWelcomeMessage();
    void SetWelcomeMessage(const std::string& text);

    // --- maintenance mode and read cache ---
    // 1 = in maintenance mode, 2 = not in maintenance mode, any other value = unknown.
    int GetMaintenanceModeState();
    // The content-based read cache: running now, and configured for the next boot.
    bool GetCbrcRuntimeEnabled();
    bool GetCbrcConfiguredEnabled();
    // Changes the configured state; it takes effect at the next boot.
    void SetCbrcEnabled(bool enabled);

    // --- modules and log levels ---

    // --- keyboard ---
};

}  // namespace KernCtl::System

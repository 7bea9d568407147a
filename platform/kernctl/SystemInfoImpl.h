// Kernel-control system information: identity, banner, and the kernel facilities that hang off
// the system object. Methods are grouped by the area that uses them.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace HostCtl::System {
class Module;
class ModuleList;
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
    // Every module the kernel knows, in the kernel's order, read while the list lives.
    std::shared_ptr<HostCtl::System::ModuleList> GetModules();
    // The module of exactly that name, or null.
    std::unique_ptr<HostCtl::System::Module> GetModuleByName(const std::string& name);
    // The kernel core's log levels; changes last until the host restarts.
    std::vector<HostCtl::System::LogLevel> GetAllLogLevels();
    void SetLogLevel(const std::string& name, uint32_t level);
    void SetDefaultLogLevel(const std::string& name);

    // --- keyboard ---
    // The stored console keyboard layout, and every layout available.
    std::string GetKeyboardLayout();
    std::vector<std::string> GetKeyboardLayouts();
    // Stores the layout for later boots; LoadKeyboardMappings applies one to the running
    // console (the stored one for an empty name).
    void SetKeyboardLayout(const std::string& name);
    void LoadKeyboardMappings(const std::string& name);
};

}  // namespace KernCtl::System

// The host's system interface, reached through HostCtl::Host::GetSystemInfo().
#pragma once

#include <memory>
#include <string>

namespace HostCtl::System {

class Module;
class WbemAgentConfig;

class SystemInfo {
  public:
    SystemInfo();
    ~SystemInfo();

    // --- identity ---
    // The install ("inception") time stamp as the host records it.
    std::string GetInceptionTime();

    // --- modules ---
    // The module object for a name; its operations check the name.
    std::unique_ptr<Module> GetModule(const std::string& name);

    // --- agents ---
    // The WBEM services' configuration, read when this is called.
    std::unique_ptr<WbemAgentConfig> GetWbemAgentConfig();
};

}  // namespace HostCtl::System

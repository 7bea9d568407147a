// Reaching the WBEM configuration: host, then its system interface, then the configuration.
#pragma once

#include <memory>

#include "hostctl/SystemInfo.h"
#include "hostctl/WbemAgentConfig.h"

namespace OstrelCli::System {

// Keeps the system interface alive as long as the configuration object it made; the host object
// is released as soon as the system interface is obtained.
struct WbemAgentAccess {
    std::unique_ptr<HostCtl::System::SystemInfo> system;
    std::unique_ptr<HostCtl::System::WbemAgentConfig> config;

    HostCtl::System::WbemAgentConfig* operator->() const { return config.get(); }
};

// Throws HostCtl::Lib::HostCtlException when the host refuses any of the three steps.
WbemAgentAccess OpenWbemAgentConfig();

}  // namespace OstrelCli::System

#include "agents/WbemAgentAccess.h"

#include "hostctl/Host.h"

namespace OstrelCli::System {

WbemAgentAccess OpenWbemAgentConfig() {
    WbemAgentAccess access;
    {
        auto host = HostCtl::HostFactory::GetHost();
        access.system = host->GetSystemInfo();
    }
    access.config = access.system->GetWbemAgentConfig();
    return access;
}

}  // namespace OstrelCli::System

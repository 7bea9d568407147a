// The host object and the interfaces reached through it.
#pragma once

#include <memory>
#include <string>

namespace HostCtl::System {
class SystemInfo;
}
namespace HostCtl::Network {
class NetworkInfo;
}

namespace HostCtl {

class Host {
  public:
    Host();
    ~Host();

    std::unique_ptr<System::SystemInfo> GetSystemInfo();
    // --- network ---
    std::unique_ptr<Network::NetworkInfo> GetNetworkInfo();
};

namespace HostFactory {
std::unique_ptr<Host> GetHost();
}

}  // namespace HostCtl

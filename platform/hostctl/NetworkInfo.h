// The host's network service, reached through HostCtl::Host::GetNetworkInfo(): the network
// core-dump configuration and the address types it takes.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

namespace HostCtl::Network {

// An IPv4 address as text; constructing one does not validate it.
class Ipv4Address {
  public:
    explicit Ipv4Address(std::string address) : address_(std::move(address)) {}
    const std::string& ToString() const { return address_; }
    // Whether `address` is a dotted-quad IPv4 address.
    static bool IsValidAddress(const std::string& address);

  private:
    std::string address_;
};

// An IPv6 address as text; constructing one does not validate it.
class Ipv6Address {
  public:
    explicit Ipv6Address(std::string address) : address_(std::move(address)) {}
    const std::string& ToString() const { return address_; }
    static bool IsValidAddress(const std::string& address);

  private:
    std::string address_;
};

class NetworkInfo {
  public:
    NetworkInfo();
    virtual ~NetworkInfo();

    // The network dump configuration; `isIpv6` tells the family of `serverIp`.
    virtual void GetNetworkDumpConfig(std::string& interfaceName, std::string& serverIp,
                                      uint32_t& serverPort, bool& isIpv6);
    // The names of the host's virtual network interfaces.
    virtual std::vector<std::string> GetVirtualNics();
    // The port is passed as the caller has it; the service refuses one it cannot keep, and an
    // address that is not of the setter's family.
    virtual void SetNetworkDumpServerIpv4(const std::string& interfaceName,
                                          const Ipv4Address& server, int64_t port);
    virtual void SetNetworkDumpServerIpv6(const std::string& interfaceName,
                                          const Ipv6Address& server, int64_t port);
    virtual void EnableNetworkDump();
    virtual void DisableNetworkDump();
    virtual bool IsNetworkDumpEnabled();
    // Probes the server through the interface; `error` is empty when it answered.
    virtual void CheckNetworkDumpServer(const std::string& interfaceName,
                                        const std::string& serverIp, uint32_t port,
                                        std::string& error);
};

}  // namespace HostCtl::Network

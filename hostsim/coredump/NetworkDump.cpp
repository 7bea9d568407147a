// Network core dump of the simulated host: the dump server configuration, the host's virtual
// network interfaces it may use, and a server check that really probes the server over UDP.
#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstring>

#include "cmdkit/Text.h"
#include "hostctl/Host.h"
#include "hostctl/HostCtlException.h"
#include "hostctl/NetworkInfo.h"
#include "hostsim/core/Fd.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"

namespace {

using BrixSim::Store;
using HostCtl::Lib::HostCtlException;

const BrixSim::Operation kGetNetworkInfo{"HostCtl::Host::GetNetworkInfo"};
const BrixSim::Operation kGetConfig{"HostCtl::Network::NetworkInfo::GetNetworkDumpConfig"};
const BrixSim::Operation kGetVnics{"HostCtl::Network::NetworkInfo::GetVirtualNics"};
const BrixSim::Operation kSetIpv4{"HostCtl::Network::NetworkInfo::SetNetworkDumpServerIpv4"};
const BrixSim::Operation kSetIpv6{"HostCtl::Network::NetworkInfo::SetNetworkDumpServerIpv6"};
const BrixSim::Operation kEnable{"HostCtl::Network::NetworkInfo::EnableNetworkDump"};
const BrixSim::Operation kDisable{"HostCtl::Network::NetworkInfo::DisableNetworkDump"};
const BrixSim::Operation kIsEnabled{"HostCtl::Network::NetworkInfo::IsNetworkDumpEnabled"};
const BrixSim::Operation kCheck{"HostCtl::Network::NetworkInfo::CheckNetworkDumpServer"};

constexpr const char* kEnabledKey = "coredump.netdump.enabled";
constexpr const char* kInterfaceKey = "coredump.netdump.interface";
constexpr const char* kServerKey = "coredump.netdump.server";
constexpr const char* kPortKey = "coredump.netdump.port";
constexpr const char* kIpv6Key = "coredump.netdump.ipv6";
// How long the server check waits for an answer, in milliseconds (at most one second).
constexpr const char* kCheckTimeoutKey = "coredump.netdump.check_timeout_ms";
constexpr int kMaxCheckTimeoutMs = 1000;

// What the check sends; a dump server answers any datagram on its port.
constexpr char kProbe[] = "BRIX-NETDUMP-PROBE 1\n";

const bool registered = [] {
    return BrixSim::RegisterTables({
        "coredump.network",
        "CREATE TABLE IF NOT EXISTS coredump_vnics ("
        " name TEXT PRIMARY KEY,"
        " ord INTEGER NOT NULL,"
        " portgroup TEXT NOT NULL,"
        " ipv4 TEXT NOT NULL,"
        " ipv6 TEXT NOT NULL);",
        [](Store& store) {
            struct Vnic {
                const char* name;
                const char* portgroup;
                const char* ipv4;
                const char* ipv6;
            };
            const Vnic vnics[] = {
                {"vnic0", "Management Network", "192.168.40.21", "fd00:40::21"},
                {"vnic1", "Storage Network", "10.20.0.21", ""},
                {"vnic2", "Migration Network", "10.30.0.21", "fd00:30::21"},
            };
            auto insert = store.Prepare("INSERT INTO coredump_vnics VALUES (?, ?, ?, ?, ?)");
            int ord = 0;
            for (const auto& v : vnics) {
                insert.Bind(1, v.name).Bind(2, ord++).Bind(3, v.portgroup).Bind(4, v.ipv4);
                insert.Bind(5, v.ipv6).Run();
                insert.Reset();
            }
            // A server is on record, but network dump is switched off.
            store.SetInt(kEnabledKey, 0);
            store.SetValue(kInterfaceKey, "vnic0");
            store.SetValue(kServerKey, "192.168.40.5");
            store.SetInt(kPortKey, 6500);
            store.SetInt(kIpv6Key, 0);
        },
    });
}();

bool HasVnic(Store& store, const std::string& name) {
    auto row = store.Prepare("SELECT 1 FROM coredump_vnics WHERE name = ?");
    row.Bind(1, name);
    return row.Step();
}

// The service keeps the port as a 32-bit number and the address as one of its family.
constexpr int64_t kMaxPort = 4294967295;

void SetServer(const BrixSim::Operation& operation, const std::string& interfaceName,
               const std::string& server, int64_t port, bool ipv6) {
    auto& store = Store::Get();
    store.Check(operation);
    if (ipv6 ? !HostCtl::Network::Ipv6Address::IsValidAddress(server)
             : !HostCtl::Network::Ipv4Address::IsValidAddress(server)) {
        throw HostCtlException(std::string("Invalid netdump server address: not an IPv") +
                               (ipv6 ? "6" : "4") + " address.");
    }
    if (port < 1 || port > kMaxPort) {
        throw HostCtlException("Invalid netdump server port " + std::to_string(port) +
                               ": the port must be from 1 to " + std::to_string(kMaxPort) + ".");
    }
    store.Write([&] {
        if (!HasVnic(store, interfaceName)) {
            throw HostCtlException("Interface " + CmdKit::MessageExcerpt(interfaceName) +
                                   " is not a valid vnic.");
        }
        store.SetValue(kInterfaceKey, interfaceName);
        store.SetValue(kServerKey, server);
        store.SetInt(kPortKey, port);
        store.SetInt(kIpv6Key, ipv6 ? 1 : 0);
        store.JournalCall(operation, {interfaceName, server, port});
    });
}

// Sends the probe to server:port and waits for any answer; the error text, empty on success.
std::string Probe(const std::string& server, uint32_t port, int timeoutMs) {
    const std::string where = server + " port " + std::to_string(port);
    if (port == 0 || port > 65535) return "Invalid netdump server port " + std::to_string(port);
    sockaddr_storage address{};
    socklen_t length = 0;
    int family = AF_INET;
    if (auto* v4 = reinterpret_cast<sockaddr_in*>(&address);
        inet_pton(AF_INET, server.c_str(), &v4->sin_addr) == 1) {
        v4->sin_family = AF_INET;
        v4->sin_port = htons(static_cast<uint16_t>(port));
        length = sizeof *v4;
    } else if (auto* v6 = reinterpret_cast<sockaddr_in6*>(&address);
               inet_pton(AF_INET6, server.c_str(), &v6->sin6_addr) == 1) {
        family = AF_INET6;
        v6->sin6_family = AF_INET6;
        v6->sin6_port = htons(static_cast<uint16_t>(port));
        length = sizeof *v6;
    } else {
        return "Invalid netdump server address " + server;
    }
    const BrixSim::Fd socket(::socket(family, SOCK_DGRAM | SOCK_CLOEXEC, 0));
    if (!socket) return std::string("Unable to open a socket: ") + std::strerror(errno);
    const int fd = socket.Get();
    std::string error;
    // A connected socket reports a refused port as an error on the next receive.
    if (::connect(fd, reinterpret_cast<sockaddr*>(&address), length) != 0 ||
        ::send(fd, kProbe, sizeof kProbe - 1, 0) < 0) {
        error = "Unable to reach netdump server at " + where + ": " + std::strerror(errno);
    } else {
        pollfd waiting{fd, POLLIN, 0};
        const int ready = ::poll(&waiting, 1, timeoutMs);
        char answer[512];
        if (ready == 0) {
            error = "Netdump server at " + where + " did not respond within " +
                    std::to_string(timeoutMs) + " ms";
        } else if (ready < 0 || ::recv(fd, answer, sizeof answer, 0) < 0) {
            error = "Netdump server at " + where + " is not reachable: " + std::strerror(errno);
        }
    }
    return error;
}

}  // namespace

namespace HostCtl {

std::unique_ptr<Network::NetworkInfo> Host::GetNetworkInfo() {
    Store::Get().Check(kGetNetworkInfo);
    return std::make_unique<Network::NetworkInfo>();
}

}  // namespace HostCtl

namespace HostCtl::Network {

bool Ipv4Address::IsValidAddress(const std::string& address) {
    in_addr parsed{};
    return inet_pton(AF_INET, address.c_str(), &parsed) == 1;
}

bool Ipv6Address::IsValidAddress(const std::string& address) {
    in6_addr parsed{};
    return inet_pton(AF_INET6, address.c_str(), &parsed) == 1;
}

NetworkInfo::NetworkInfo() = default;
NetworkInfo::~NetworkInfo() = default;

void NetworkInfo::GetNetworkDumpConfig(std::string& interfaceName, std::string& serverIp,
                                       uint32_t& serverPort, bool& isIpv6) {
    auto& store = Store::Get();
    store.Check(kGetConfig);
    interfaceName = store.GetValue(kInterfaceKey, "");
    serverIp = store.GetValue(kServerKey, "");
    serverPort = static_cast<uint32_t>(store.GetInt(kPortKey, 0));
    isIpv6 = store.GetInt(kIpv6Key, 0) != 0;
}

std::vector<std::string> NetworkInfo::GetVirtualNics() {
    auto& store = Store::Get();
    store.Check(kGetVnics);
    auto rows = store.Prepare("SELECT name FROM coredump_vnics ORDER BY ord, name");
    std::vector<std::string> result;
    while (rows.Step()) result.push_back(rows.Text(0));
    return result;
}

void NetworkInfo::SetNetworkDumpServerIpv4(const std::string& interfaceName,
                                           const Ipv4Address& server, int64_t port) {
    SetServer(kSetIpv4, interfaceName, server.ToString(), port, false);
}

void NetworkInfo::SetNetworkDumpServerIpv6(const std::string& interfaceName,
                                           const Ipv6Address& server, int64_t port) {
    SetServer(kSetIpv6, interfaceName, server.ToString(), port, true);
}

void NetworkInfo::EnableNetworkDump() {
    auto& store = Store::Get();
    store.Check(kEnable);
    store.Write([&] {
        if (store.GetValue(kServerKey, "").empty() || store.GetValue(kInterfaceKey, "").empty()) {
            throw HostCtlException("Network dump server is not configured.");
        }
        store.SetInt(kEnabledKey, 1);
        store.JournalCall(kEnable, {});
    });
}

void NetworkInfo::DisableNetworkDump() {
    auto& store = Store::Get();
    store.Check(kDisable);
    store.Write([&] {
        store.SetInt(kEnabledKey, 0);
        store.JournalCall(kDisable, {});
    });
}

bool NetworkInfo::IsNetworkDumpEnabled() {
    auto& store = Store::Get();
    store.Check(kIsEnabled);
    return store.GetInt(kEnabledKey, 0) != 0;
}

void NetworkInfo::CheckNetworkDumpServer(const std::string& interfaceName,
                                         const std::string& serverIp, uint32_t port,
                                         std::string& error) {
    auto& store = Store::Get();
    store.Check(kCheck);
    if (!HasVnic(store, interfaceName)) {
        error = "Interface " + interfaceName + " is not a valid vnic";
        return;
    }
    const int timeoutMs = static_cast<int>(std::clamp<int64_t>(
        store.GetInt(kCheckTimeoutKey, kMaxCheckTimeoutMs), 0, kMaxCheckTimeoutMs));
    error = Probe(serverIp, port, timeoutMs);
}

}  // namespace HostCtl::Network

// The host's SLP agent: searches for services on the network (as an SLPv2 user agent) and
// reports the statistics of the host's SLP daemon.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace HostCtl::System {

// One service that answered a search.
struct SLPSvc {
    std::string entry;     // the service entry (its service URL)
    int32_t lifetime = 0;  // seconds the entry stays valid
};

// The SLP daemon's operational statistics.
struct SLPStats {
    std::string date;               // when these statistics were taken
    std::string processId;          // the daemon's process id
    std::string uptime;             // how long the daemon has been running
    std::string lastTcpAccept;      // time of the last accepted TCP connection
    int32_t tcpAccepts = 0;         // completed TCP accepts
    int32_t tcpAcceptsFailed = 0;   // TCP accepts that failed
    int32_t tcpAcceptsTooMany = 0;  // TCP connections refused for too many open
    std::string lastUdpReceived;    // time of the last UDP packet received
    int32_t udpReceived = 0;
    int32_t udpReceiveFailed = 0;
    int64_t udpReceivedBytes = 0;
    int32_t udpSent = 0;
    int32_t udpSendFailed = 0;
    int64_t udpSentBytes = 0;
    int32_t srvRqstReceived = 0;
    int32_t srvRplySent = 0;
    int32_t srvRegReceived = 0;
    int32_t srvDeRegReceived = 0;
    int32_t srvAckSent = 0;
    int32_t attrRqstReceived = 0;
    int32_t attrRplySent = 0;
    int32_t daAdvertReceived = 0;
    int32_t srvTypeRqstReceived = 0;
    int32_t srvTypeRplySent = 0;
    int32_t saAdvertReceived = 0;
    int32_t srvRegFailed = 0;
    int32_t srvDeRegFailed = 0;
    int32_t saSrvRqstReceived = 0;  // service requests answered as a service agent
    int32_t daSrvRqstReceived = 0;  // service requests answered as a directory agent
    int32_t noReplySent = 0;
    int32_t udpTruncated = 0;  // replies cut to fit a UDP datagram
    int32_t internalErrors = 0;
};

class SlpAgent {
  public:
    virtual ~SlpAgent();

    // Multicast search on the local network with the current search settings.
    virtual void Search(std::vector<SLPSvc>& services) = 0;
    // Unicast search to one host (name or address) with the current search settings.
    virtual void SearchNode(const std::string& node, std::vector<SLPSvc>& services) = 0;
    // Restores the default search settings: service "service-agent", port 427, TCP.
    virtual void ResetSearch() = 0;
    virtual void SetSearchPort(uint16_t port) = 0;
    virtual void SetSearchService(const std::string& service) = 0;
    // Unicast over TCP (true) or UDP (false).
    virtual void SetSearchTcp(bool tcp) = 0;
    virtual void GetStats(SLPStats& stats) = 0;

  protected:
    SlpAgent() = default;
};

std::unique_ptr<SlpAgent> SlpAgentFactory();

}  // namespace HostCtl::System

// A small SLP service agent for the tests: answers service requests on loopback over UDP (unicast
// and multicast to 239.255.255.253 joined on 127.0.0.1) and TCP, on one port number. It has its
// own encoding and decoding, independent of the code under test, and records every request.
#pragma once

#include <atomic>
#include <cstdint>
#include <mutex>
#include <string>
#include <thread>
#include <utility>
#include <vector>

namespace SlpTest {

struct Service {
    std::string url;
    uint16_t lifetime;
};

enum class Behaviour {
    Answer,          // a SrvRply (or a SAAdvert for "service:service-agent")
    MalformedFirst,  // over UDP: a broken reply, one for another request, then the answer
    MalformedOnly,   // only a broken reply (a SrvRply claiming more entries than it holds)
    Silent,          // reads requests, answers nothing
    Error,           // a SrvRply with error code 4 (SCOPE_NOT_SUPPORTED)
};

struct Request {
    std::string transport;  // "udp" or "tcp"
    std::string source;     // the sender's IPv4 address, over UDP
    uint8_t function = 0;
    uint16_t flags = 0;
    uint16_t xid = 0;
    std::string language;
    std::string previousResponders;
    std::string serviceType;
    std::string scopes;
    std::string predicate;
};

class Responder {
  public:
    Responder(std::vector<Service> services, Behaviour behaviour = Behaviour::Answer);
    ~Responder();
    Responder(const Responder&) = delete;
    Responder& operator=(const Responder&) = delete;

    uint16_t Port() const { return port_; }
    std::vector<Request> Requests();

    // Raw reply builders, also used by the parser tests.
    static std::vector<uint8_t> ServiceReply(uint16_t xid, const std::vector<Service>& services,
                                             uint16_t errorCode = 0);
    static std::vector<uint8_t> AgentAdvert(uint16_t xid, const std::string& url);

  private:
    void Run();
    void HandleUdp();
    void HandleTcp();
    std::vector<std::vector<uint8_t>> Replies(const Request& request) const;

    std::vector<Service> services_;
    Behaviour behaviour_;
    int udp_ = -1;
    int tcp_ = -1;
    uint16_t port_ = 0;
    std::atomic<bool> stop_{false};
    std::mutex mutex_;
    std::vector<Request> requests_;
    std::thread thread_;
};

}  // namespace SlpTest

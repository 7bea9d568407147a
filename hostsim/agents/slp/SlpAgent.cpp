// The host's SLP user agent: multicast and unicast service requests on the real network, and the
// daemon's statistics from the store.
//
// Host settings read at each search (all optional):
//   slp.ua.interface          IPv4 address of the interface that sends multicast requests
//                             (empty: loopback; a search leaves this machine only when the
//                             user names another interface)
//   slp.ua.scopes             scope list of the requests (default "DEFAULT")
//   slp.ua.multicast_wait_ms  how long a multicast search collects answers (default 1500)
//   slp.ua.unicast_wait_ms    how long a unicast search waits for its answer (default 1500)
#include "hostctl/SlpAgent.h"

#include <arpa/inet.h>
#include <fcntl.h>
#include <netdb.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <boost/algorithm/string/predicate.hpp>
#include <cerrno>
#include <chrono>
#include <cstring>
#include <memory>
#include <random>
#include <set>
#include <string>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/agents/slp/SlpDaemon.h"
#include "hostsim/agents/slp/SlpWire.h"
#include "hostsim/core/Fd.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"

namespace {

using BrixSim::Store;
using HostCtl::Lib::HostCtlException;
using HostCtl::System::SLPStats;
using HostCtl::System::SLPSvc;
using Clock = std::chrono::steady_clock;
using namespace BrixSim::Slp;

const BrixSim::Operation kFactory{"HostCtl::System::SlpAgentFactory"};
const BrixSim::Operation kSearch{"HostCtl::System::SlpAgent::Search"};
const BrixSim::Operation kSearchNode{"HostCtl::System::SlpAgent::SearchNode"};
const BrixSim::Operation kResetSearch{"HostCtl::System::SlpAgent::ResetSearch"};
const BrixSim::Operation kSetSearchPort{"HostCtl::System::SlpAgent::SetSearchPort"};
const BrixSim::Operation kSetSearchService{"HostCtl::System::SlpAgent::SetSearchService"};
const BrixSim::Operation kSetSearchTcp{"HostCtl::System::SlpAgent::SetSearchTcp"};
const BrixSim::Operation kGetStats{"HostCtl::System::SlpAgent::GetStats"};

constexpr const char* kDefaultService = "service-agent";
constexpr int64_t kDefaultWaitMs = 1500;
// Where multicast searches go unless the user names an interface: this machine only.
constexpr const char* kLoopback = "127.0.0.1";
constexpr int64_t kMaxWaitMs = 60'000;
// Largest reply accepted over TCP; anything longer is not an answer to a service request.
constexpr uint32_t kMaxTcpReply = 1 << 20;

const bool registered = [] {
    // The user agent's settings, written out so that an exported host shows them.
    return BrixSim::RegisterTables({"slp-ua", "", [](Store& store) {
                                        store.SetValue("slp.ua.interface", kLoopback);
                                        store.SetValue("slp.ua.scopes", "DEFAULT");
                                        store.SetInt("slp.ua.multicast_wait_ms", kDefaultWaitMs);
                                        store.SetInt("slp.ua.unicast_wait_ms", kDefaultWaitMs);
                                    }});
}();

std::string ErrnoText(int error) {
    return std::strerror(error);
}

struct Settings {
    std::string interface;
    std::string scopes;
    std::chrono::milliseconds multicastWait;
    std::chrono::milliseconds unicastWait;
};

Settings ReadSettings() {
    auto& store = Store::Get();
    auto wait = [&](const char* key) {
        return std::chrono::milliseconds(
            std::clamp<int64_t>(store.GetInt(key, kDefaultWaitMs), 0, kMaxWaitMs));
    };
    std::string interface = store.GetValue("slp.ua.interface", "");
    if (interface.empty()) interface = kLoopback;
    return {interface, store.GetValue("slp.ua.scopes", "DEFAULT"), wait("slp.ua.multicast_wait_ms"),
            wait("slp.ua.unicast_wait_ms")};
}

uint16_t NewXid() {
    std::random_device random;
    return static_cast<uint16_t>(random());
}

// Waits until `fd` is readable (true) or `deadline` passes (false).
bool WaitReadable(int fd, Clock::time_point deadline) {
    for (;;) {
        const auto left =
            std::chrono::duration_cast<std::chrono::milliseconds>(deadline - Clock::now());
        if (left.count() <= 0) return false;
        pollfd entry{fd, POLLIN, 0};
        const int ready = ::poll(&entry, 1, static_cast<int>(left.count()));
        if (ready > 0) return true;
        if (ready < 0 && errno != EINTR) return false;
    }
}

// True for a well-formed reply to the request with transaction id `xid`.
bool Answers(const std::optional<Reply>& reply, uint16_t xid) {
    return reply && reply->xid == xid;
}

void AddEntries(const Reply& reply, std::set<std::string>& seen, std::vector<SLPSvc>& services) {
    for (const auto& entry : reply.entries) {
        if (seen.insert(entry.url).second) services.push_back({entry.url, entry.lifetime});
    }
}

class SlpAgentImpl final : public HostCtl::System::SlpAgent {
  public:
    void Search(std::vector<SLPSvc>& services) override {
        Store::Get().Check(kSearch);
        services.clear();
        const Settings settings = ReadSettings();

        BrixSim::Fd socket(::socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0));
        if (socket.Get() < 0) Fail("SLP multicast search failed: " + ErrnoText(errno));
        const int ttl = 255;
        ::setsockopt(socket.Get(), IPPROTO_IP, IP_MULTICAST_TTL, &ttl, sizeof ttl);
        {
            in_addr address{};
            if (::inet_pton(AF_INET, settings.interface.c_str(), &address) != 1) {
                Fail("Invalid SLP multicast interface address: " +
                     CmdKit::MessageExcerpt(settings.interface));
            }
            if (::setsockopt(socket.Get(), IPPROTO_IP, IP_MULTICAST_IF, &address, sizeof address) !=
                0) {
                Fail("SLP multicast search failed: " + ErrnoText(errno));
            }
        }
        sockaddr_in group{};
        group.sin_family = AF_INET;
        group.sin_port = htons(port_);
        ::inet_pton(AF_INET, kMulticastGroup, &group.sin_addr);

        ServiceRequest request;
        request.xid = NewXid();
        request.multicast = true;
        request.serviceType = ServiceType();
        request.scopes = settings.scopes;

        // Two rounds: the request, then once more naming those that answered, so that answers
        // lost on the way are asked for again while the responders stay quiet.
        std::set<std::string> responders;
        std::set<std::string> seen;
        const auto start = Clock::now();
        const Clock::time_point roundEnds[] = {start + settings.multicastWait / 3,
                                               start + settings.multicastWait};
        for (const auto roundEnd : roundEnds) {
            std::string previous;
            for (const auto& responder : responders) {
                previous += (previous.empty() ? "" : ",") + responder;
            }
            request.previousResponders = previous;
            const auto message = BuildServiceRequest(request);
            if (::sendto(socket.Get(), message.data(), message.size(), 0,
                         reinterpret_cast<const sockaddr*>(&group), sizeof group) < 0) {
                Fail("SLP multicast search failed: " + ErrnoText(errno));
            }
            std::vector<uint8_t> buffer(65536);
            while (WaitReadable(socket.Get(), roundEnd)) {
                sockaddr_in from{};
                socklen_t fromLength = sizeof from;
                const ssize_t size = ::recvfrom(socket.Get(), buffer.data(), buffer.size(), 0,
                                                reinterpret_cast<sockaddr*>(&from), &fromLength);
                if (size <= 0) continue;
                const auto reply = ParseReply(buffer.data(), static_cast<size_t>(size));
                // Errors are not answers to a multicast request: the agent should have kept
                // quiet, and the other agents may still answer.
                if (!Answers(reply, request.xid) || reply->errorCode != 0) continue;
                char address[INET_ADDRSTRLEN] = {};
                ::inet_ntop(AF_INET, &from.sin_addr, address, sizeof address);
                responders.insert(address);
                AddEntries(*reply, seen, services);
            }
        }
    }

    void SearchNode(const std::string& node, std::vector<SLPSvc>& services) override {
        Store::Get().Check(kSearchNode);
        services.clear();
        const Settings settings = ReadSettings();

        addrinfo hints{};
        hints.ai_family = AF_UNSPEC;
        hints.ai_socktype = tcp_ ? SOCK_STREAM : SOCK_DGRAM;
        addrinfo* found = nullptr;
        const int status =
            ::getaddrinfo(node.c_str(), std::to_string(port_).c_str(), &hints, &found);
        if (status != 0) {
            Fail("Unable to resolve host '" + CmdKit::MessageExcerpt(node) +
                 "': " + ::gai_strerror(status));
        }
        std::unique_ptr<addrinfo, decltype(&::freeaddrinfo)> addresses(found, ::freeaddrinfo);

        ServiceRequest request;
        request.xid = NewXid();
        request.serviceType = ServiceType();
        request.scopes = settings.scopes;
        const auto message = BuildServiceRequest(request);
        const auto deadline = Clock::now() + settings.unicastWait;

        std::optional<Reply> reply = tcp_ ? AskOverTcp(node, *addresses, message, deadline)
                                          : AskOverUdp(*addresses, message, deadline);
        if (!Answers(reply, request.xid)) return;
        if (reply->errorCode != 0) {
            Fail("SLP search of '" + CmdKit::MessageExcerpt(node) +
                 "' failed: " + ErrorName(reply->errorCode));
        }
        std::set<std::string> seen;
        AddEntries(*reply, seen, services);
    }

    void ResetSearch() override {
        Store::Get().Check(kResetSearch);
        service_ = kDefaultService;
        port_ = kDefaultPort;
        tcp_ = true;
    }

    void SetSearchPort(uint16_t port) override {
        Store::Get().Check(kSetSearchPort);
        port_ = port;
    }

    void SetSearchService(const std::string& service) override {
        Store::Get().Check(kSetSearchService);
        service_ = service;
    }

    void SetSearchTcp(bool tcp) override {
        Store::Get().Check(kSetSearchTcp);
        tcp_ = tcp;
    }

    void GetStats(SLPStats& stats) override {
        Store::Get().Check(kGetStats);
        ReadDaemonStats(stats);
    }

  private:
    [[noreturn]] static void Fail(const std::string& message) { throw HostCtlException(message); }

    // Service types are URL schemes below "service:", in any case; a bare name is taken as such
    // a type.
    std::string ServiceType() const {
        constexpr std::string_view kScheme = "service:";
        if (boost::algorithm::istarts_with(service_, kScheme)) {
            return std::string(kScheme) + service_.substr(kScheme.size());
        }
        return std::string(kScheme) + service_;
    }

    // Sends over UDP and waits for the first well-formed answer, asking once more a third of
    // the way in. Returns nullopt when nobody answers.
    std::optional<Reply> AskOverUdp(const addrinfo& addresses, const std::vector<uint8_t>& message,
                                    Clock::time_point deadline) {
        const uint16_t xid = static_cast<uint16_t>(message[10] << 8 | message[11]);
        const auto start = Clock::now();
        const Clock::time_point roundEnds[] = {start + (deadline - start) / 3, deadline};
        for (const addrinfo* address = &addresses; address; address = address->ai_next) {
            BrixSim::Fd socket(::socket(address->ai_family, SOCK_DGRAM | SOCK_CLOEXEC, 0));
            if (socket.Get() < 0) continue;
            // Connected, so that only the node's datagrams arrive and a closed port is
            // reported at once instead of after the whole wait.
            if (::connect(socket.Get(), address->ai_addr, address->ai_addrlen) != 0) continue;
            std::vector<uint8_t> buffer(65536);
            bool refused = false;
            for (const auto roundEnd : roundEnds) {
                if (::send(socket.Get(), message.data(), message.size(), 0) < 0) {
                    refused = errno == ECONNREFUSED;
                    if (!refused) Fail("SLP search failed: " + ErrnoText(errno));
                    break;
                }
                while (!refused && WaitReadable(socket.Get(), roundEnd)) {
                    const ssize_t size = ::recv(socket.Get(), buffer.data(), buffer.size(), 0);
                    if (size < 0 && errno == EINTR) continue;
                    if (size < 0) {
                        refused = errno == ECONNREFUSED;
                        break;
                    }
                    auto reply = ParseReply(buffer.data(), static_cast<size_t>(size));
                    if (Answers(reply, xid)) return reply;
                }
                if (refused) break;
            }
            // Nobody listens at this address; try the node's next one.
        }
        return std::nullopt;
    }

    // Connects over TCP, sends, and reads one reply message. A reply that is cut short or does
    // not parse counts as no answer.
    std::optional<Reply> AskOverTcp(const std::string& node, const addrinfo& addresses,
                                    const std::vector<uint8_t>& message,
                                    Clock::time_point deadline) {
        int lastError = ETIMEDOUT;
        for (const addrinfo* address = &addresses; address; address = address->ai_next) {
            BrixSim::Fd socket(
                ::socket(address->ai_family, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0));
            if (socket.Get() < 0) {
                lastError = errno;
                continue;
            }
            if (!Connect(socket.Get(), *address, deadline, lastError)) continue;
            if (!SendAll(socket.Get(), message, deadline)) return std::nullopt;
            return ReadReply(socket.Get(), deadline);
        }
        Fail("Unable to connect to '" + CmdKit::MessageExcerpt(node) + "' port " +
             std::to_string(port_) + ": " + ErrnoText(lastError));
    }

    static bool Connect(int fd, const addrinfo& address, Clock::time_point deadline, int& error) {
        if (::connect(fd, address.ai_addr, address.ai_addrlen) == 0) return true;
        if (errno != EINPROGRESS) {
            error = errno;
            return false;
        }
        for (;;) {
            const auto left =
                std::chrono::duration_cast<std::chrono::milliseconds>(deadline - Clock::now());
            if (left.count() <= 0) {
                error = ETIMEDOUT;
                return false;
            }
            pollfd entry{fd, POLLOUT, 0};
            const int ready = ::poll(&entry, 1, static_cast<int>(left.count()));
            if (ready < 0 && errno == EINTR) continue;
            if (ready <= 0) {
                error = ready == 0 ? ETIMEDOUT : errno;
                return false;
            }
            socklen_t length = sizeof error;
            if (::getsockopt(fd, SOL_SOCKET, SO_ERROR, &error, &length) != 0) error = errno;
            return error == 0;
        }
    }

    static bool SendAll(int fd, const std::vector<uint8_t>& message, Clock::time_point deadline) {
        size_t sent = 0;
        while (sent < message.size()) {
            const ssize_t count =
                ::send(fd, message.data() + sent, message.size() - sent, MSG_NOSIGNAL);
            if (count > 0) {
                sent += static_cast<size_t>(count);
                continue;
            }
            if (count < 0 && errno == EINTR) continue;
            if (count < 0 && errno == EAGAIN) {
                pollfd entry{fd, POLLOUT, 0};
                const auto left =
                    std::chrono::duration_cast<std::chrono::milliseconds>(deadline - Clock::now());
                if (left.count() <= 0 || ::poll(&entry, 1, static_cast<int>(left.count())) <= 0) {
                    return false;
                }
                continue;
            }
            return false;
        }
        return true;
    }

    // Reads exactly `size` more bytes into `buffer`; false on end of stream, error or timeout.
    static bool ReadExactly(int fd, std::vector<uint8_t>& buffer, size_t size,
                            Clock::time_point deadline) {
        const size_t target = buffer.size() + size;
        std::vector<uint8_t> chunk(4096);
        while (buffer.size() < target) {
            if (!WaitReadable(fd, deadline)) return false;
            const ssize_t count =
                ::recv(fd, chunk.data(), std::min(chunk.size(), target - buffer.size()), 0);
            if (count < 0 && (errno == EINTR || errno == EAGAIN)) continue;
            if (count <= 0) return false;
            buffer.insert(buffer.end(), chunk.begin(), chunk.begin() + count);
        }
        return true;
    }

    static std::optional<Reply> ReadReply(int fd, Clock::time_point deadline) {
        std::vector<uint8_t> buffer;
        if (!ReadExactly(fd, buffer, 5, deadline)) return std::nullopt;
        const auto length = PeekLength(buffer.data(), buffer.size());
        if (!length || *length < kHeaderFixedSize || *length > kMaxTcpReply) return std::nullopt;
        if (!ReadExactly(fd, buffer, *length - buffer.size(), deadline)) return std::nullopt;
        return ParseReply(buffer.data(), buffer.size());
    }

    std::string service_ = kDefaultService;
    uint16_t port_ = kDefaultPort;
    bool tcp_ = true;
};

}  // namespace

namespace HostCtl::System {

SlpAgent::~SlpAgent() = default;

std::unique_ptr<SlpAgent> SlpAgentFactory() {
    Store::Get().Check(kFactory);
    return std::make_unique<SlpAgentImpl>();
}

}  // namespace HostCtl::System

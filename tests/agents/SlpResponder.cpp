#include "SlpResponder.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <optional>
#include <stdexcept>

namespace SlpTest {

namespace {

void Put16(std::vector<uint8_t>& out, uint32_t value) {
    out.push_back(static_cast<uint8_t>(value >> 8));
    out.push_back(static_cast<uint8_t>(value));
}

void PutText(std::vector<uint8_t>& out, const std::string& text) {
    Put16(out, static_cast<uint32_t>(text.size()));
    out.insert(out.end(), text.begin(), text.end());
}

// Header with language "en" around `body`.
std::vector<uint8_t> Message(uint8_t function, uint16_t xid, const std::vector<uint8_t>& body) {
    std::vector<uint8_t> out = {2, function};
    const uint32_t length = 14 + 2 + static_cast<uint32_t>(body.size());
    out.push_back(static_cast<uint8_t>(length >> 16));
    Put16(out, length & 0xffff);
    Put16(out, 0);  // flags
    out.insert(out.end(), {0, 0, 0});
    Put16(out, xid);
    PutText(out, "en");
    out.insert(out.end(), body.begin(), body.end());
    return out;
}

struct Cursor {
    const std::vector<uint8_t>& data;
    size_t pos = 0;
    uint32_t Take(size_t bytes) {
        if (data.size() - pos < bytes) throw std::out_of_range("short request");
        uint32_t value = 0;
        for (size_t i = 0; i < bytes; ++i) value = value << 8 | data[pos++];
        return value;
    }
    std::string Text() {
        const size_t length = Take(2);
        if (data.size() - pos < length) throw std::out_of_range("short request");
        std::string text(data.begin() + static_cast<long>(pos),
                         data.begin() + static_cast<long>(pos + length));
        pos += length;
        return text;
    }
};

std::optional<Request> ParseRequest(const std::vector<uint8_t>& data, const char* transport) {
    try {
        Cursor in{data};
        Request request;
        request.transport = transport;
        if (in.Take(1) != 2) return std::nullopt;
        request.function = static_cast<uint8_t>(in.Take(1));
        if (in.Take(3) != data.size()) return std::nullopt;
        request.flags = static_cast<uint16_t>(in.Take(2));
        in.Take(3);
        request.xid = static_cast<uint16_t>(in.Take(2));
        request.language = in.Text();
        request.previousResponders = in.Text();
        request.serviceType = in.Text();
        request.scopes = in.Text();
        request.predicate = in.Text();
        in.Text();  // SPI
        if (in.pos != data.size()) return std::nullopt;
        return request;
    } catch (const std::out_of_range&) {
        return std::nullopt;
    }
}

}  // namespace

std::vector<uint8_t> Responder::ServiceReply(uint16_t xid, const std::vector<Service>& services,
                                             uint16_t errorCode) {
    std::vector<uint8_t> body;
    Put16(body, errorCode);
    Put16(body, static_cast<uint32_t>(services.size()));
    for (const auto& service : services) {
        body.push_back(0);
        Put16(body, service.lifetime);
        PutText(body, service.url);
        body.push_back(0);  // no authentication blocks
    }
    return Message(2, xid, body);
}

std::vector<uint8_t> Responder::AgentAdvert(uint16_t xid, const std::string& url) {
    std::vector<uint8_t> body;
    PutText(body, url);
    PutText(body, "DEFAULT");
    PutText(body, "(service-type=service:wbem)");
    body.push_back(0);
    return Message(11, xid, body);
}

Responder::Responder(std::vector<Service> services, Behaviour behaviour)
    : services_(std::move(services)), behaviour_(behaviour) {
    // One port number for UDP and TCP: take a free UDP port, then the same for TCP.
    for (int attempt = 0; attempt < 20 && port_ == 0; ++attempt) {
        udp_ = ::socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0);
        const int on = 1;
        ::setsockopt(udp_, SOL_SOCKET, SO_REUSEADDR, &on, sizeof on);
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_ANY);
        ::bind(udp_, reinterpret_cast<sockaddr*>(&address), sizeof address);
        socklen_t length = sizeof address;
        ::getsockname(udp_, reinterpret_cast<sockaddr*>(&address), &length);
        tcp_ = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
        ::setsockopt(tcp_, SOL_SOCKET, SO_REUSEADDR, &on, sizeof on);
        sockaddr_in tcpAddress = address;
        tcpAddress.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        if (::bind(tcp_, reinterpret_cast<sockaddr*>(&tcpAddress), sizeof tcpAddress) == 0 &&
            ::listen(tcp_, 8) == 0) {
            port_ = ntohs(address.sin_port);
        } else {
            ::close(udp_);
            ::close(tcp_);
        }
    }
    if (port_ == 0) throw std::runtime_error("no free port for the SLP responder");
    ip_mreq group{};
    ::inet_pton(AF_INET, "239.255.255.253", &group.imr_multiaddr);
    ::inet_pton(AF_INET, "127.0.0.1", &group.imr_interface);
    ::setsockopt(udp_, IPPROTO_IP, IP_ADD_MEMBERSHIP, &group, sizeof group);
    thread_ = std::thread([this] { Run(); });
}

Responder::~Responder() {
    stop_ = true;
    thread_.join();
    ::close(udp_);
    ::close(tcp_);
}

std::vector<Request> Responder::Requests() {
    std::lock_guard<std::mutex> lock(mutex_);
    return requests_;
}

void Responder::Run() {
    while (!stop_) {
        pollfd fds[] = {{udp_, POLLIN, 0}, {tcp_, POLLIN, 0}};
        if (::poll(fds, 2, 20) <= 0) continue;
        if (fds[0].revents & POLLIN) HandleUdp();
        if (fds[1].revents & POLLIN) HandleTcp();
    }
}

std::vector<std::vector<uint8_t>> Responder::Replies(const Request& request) const {
    if (behaviour_ == Behaviour::Silent) return {};
    if (behaviour_ == Behaviour::Error) return {ServiceReply(request.xid, {}, 4)};
    std::vector<uint8_t> answer;
    if (request.serviceType == "service:service-agent") {
        answer = AgentAdvert(request.xid, "service:service-agent://127.0.0.1");
    } else {
        answer = ServiceReply(request.xid, services_);
    }
    // Claims one entry more than it carries.
    auto broken = ServiceReply(request.xid, services_);
    broken[19] = static_cast<uint8_t>(services_.size() + 1);
    if (behaviour_ == Behaviour::MalformedOnly) return {broken};
    if (behaviour_ == Behaviour::MalformedFirst) {
        return {broken, ServiceReply(static_cast<uint16_t>(request.xid + 1), services_), answer};
    }
    return {answer};
}

void Responder::HandleUdp() {
    std::vector<uint8_t> buffer(65536);
    sockaddr_in from{};
    socklen_t length = sizeof from;
    const ssize_t size = ::recvfrom(udp_, buffer.data(), buffer.size(), 0,
                                    reinterpret_cast<sockaddr*>(&from), &length);
    if (size <= 0) return;
    buffer.resize(static_cast<size_t>(size));
    auto request = ParseRequest(buffer, "udp");
    if (!request) return;
    char source[INET_ADDRSTRLEN] = "";
    ::inet_ntop(AF_INET, &from.sin_addr, source, sizeof source);
    request->source = source;
    {
        std::lock_guard<std::mutex> lock(mutex_);
        requests_.push_back(*request);
    }
    for (const auto& reply : Replies(*request)) {
        ::sendto(udp_, reply.data(), reply.size(), 0, reinterpret_cast<sockaddr*>(&from), length);
    }
}

void Responder::HandleTcp() {
    const int connection = ::accept4(tcp_, nullptr, nullptr, SOCK_CLOEXEC);
    if (connection < 0) return;
    std::vector<uint8_t> buffer;
    uint8_t chunk[4096];
    // Read the header's length, then the rest.
    size_t wanted = 5;
    while (buffer.size() < wanted) {
        pollfd fd{connection, POLLIN, 0};
        if (::poll(&fd, 1, 2000) <= 0) break;
        const ssize_t count = ::recv(connection, chunk, sizeof chunk, 0);
        if (count <= 0) break;
        buffer.insert(buffer.end(), chunk, chunk + count);
        if (buffer.size() >= 5 && wanted == 5) {
            wanted = static_cast<size_t>(buffer[2]) << 16 | static_cast<size_t>(buffer[3]) << 8 |
                     buffer[4];
        }
    }
    const auto request = ParseRequest(buffer, "tcp");
    if (request) {
        {
            std::lock_guard<std::mutex> lock(mutex_);
            requests_.push_back(*request);
        }
        // One reply per connection: the first one the behaviour calls for.
        const auto replies = Replies(*request);
        if (!replies.empty()) {
            ::send(connection, replies.front().data(), replies.front().size(), MSG_NOSIGNAL);
        } else {
            // Silent: keep the connection open until the client gives up.
            pollfd fd{connection, POLLIN, 0};
            ::poll(&fd, 1, 3000);
        }
    }
    ::close(connection);
}

}  // namespace SlpTest

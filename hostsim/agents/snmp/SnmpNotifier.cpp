#include "hostsim/agents/snmp/SnmpNotifier.h"

#include <arpa/inet.h>
#include <netdb.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstring>
#include <map>
#include <optional>
#include <stdexcept>

#include "hostsim/agents/snmp/Ber.h"
#include "hostsim/agents/snmp/SnmpMessages.h"
#include "hostsim/agents/snmp/UsmKeys.h"
#include "hostsim/core/Fd.h"

namespace BrixSim::Snmp {

namespace {

constexpr int kReplyTimeoutMs = 1000;
constexpr int kTries = 2;

// The USM statistics a receiver reports, by object identifier.
const std::map<std::string, const char*> kReportNames = {
    {"1.3.6.1.6.3.15.1.1.1.0", "an unsupported security level"},
    {"1.3.6.1.6.3.15.1.1.2.0", "a message outside its time window"},
    {"1.3.6.1.6.3.15.1.1.3.0", "an unknown user name"},
    {"1.3.6.1.6.3.15.1.1.4.0", "an unknown engine id"},
    {"1.3.6.1.6.3.15.1.1.5.0", "a wrong digest (the authentication key does not match)"},
    {"1.3.6.1.6.3.15.1.1.6.0", "a decryption error (the privacy key does not match)"},
};
constexpr const char* kNotInTimeWindow = "1.3.6.1.6.3.15.1.1.2.0";

[[noreturn]] void Fail(const std::string& message) {
    throw std::runtime_error(message);
}

int32_t RandomId() {
    const std::string bytes = RandomBytes(4);
    uint32_t value = 0;
    for (const char byte : bytes) value = (value << 8) | static_cast<uint8_t>(byte);
    return static_cast<int32_t>(value & 0x7fffffff);
}

std::string Describe(const Endpoint& to) {
    return to.host + "@" + std::to_string(to.port);
}

// A connected UDP socket to one receiver.
class UdpPeer {
  public:
    explicit UdpPeer(const Endpoint& to) {
        addrinfo hints{};
        hints.ai_socktype = SOCK_DGRAM;
        hints.ai_flags = AI_NUMERICSERV;
        addrinfo* found = nullptr;
        const int status =
            getaddrinfo(to.host.c_str(), std::to_string(to.port).c_str(), &hints, &found);
        if (status != 0) Fail("cannot resolve " + to.host + ": " + gai_strerror(status));
        std::string error;
        for (addrinfo* at = found; at != nullptr && !fd_; at = at->ai_next) {
            BrixSim::Fd fd(socket(at->ai_family, at->ai_socktype | SOCK_CLOEXEC, at->ai_protocol));
            if (!fd || connect(fd.Get(), at->ai_addr, at->ai_addrlen) != 0) {
                error = std::strerror(errno);
                continue;
            }
            fd_ = std::move(fd);
        }
        freeaddrinfo(found);
        if (!fd_) Fail("cannot reach " + Describe(to) + ": " + error);
    }
    UdpPeer(const UdpPeer&) = delete;
    UdpPeer& operator=(const UdpPeer&) = delete;

    void Send(const std::string& message) {
        const ssize_t sent = send(fd_.Get(), message.data(), message.size(), 0);
        if (sent != static_cast<ssize_t>(message.size())) {
            Fail(std::string("send failed: ") + std::strerror(errno));
        }
    }

    // The next datagram, or nullopt when none came within the timeout.
    std::optional<std::string> Receive(int timeoutMs) {
        pollfd waiting{fd_.Get(), POLLIN, 0};
        const int ready = poll(&waiting, 1, timeoutMs);
        if (ready < 0) Fail(std::string("poll failed: ") + std::strerror(errno));
        if (ready == 0) return std::nullopt;
        std::string buffer(65536, '\0');
        const ssize_t got = recv(fd_.Get(), buffer.data(), buffer.size(), 0);
        if (got < 0) Fail(std::string("no answer: ") + std::strerror(errno));
        buffer.resize(static_cast<size_t>(got));
        return buffer;
    }

    // The local IPv4 address the datagrams leave from; 0.0.0.0 over IPv6.
    std::string LocalIpv4() const {
        sockaddr_storage local{};
        socklen_t size = sizeof local;
        if (getsockname(fd_.Get(), reinterpret_cast<sockaddr*>(&local), &size) == 0 &&
            local.ss_family == AF_INET) {
            const auto& address = reinterpret_cast<const sockaddr_in&>(local).sin_addr;
            return std::string(reinterpret_cast<const char*>(&address), 4);
        }
        return std::string(4, '\0');
    }

  private:
    BrixSim::Fd fd_;
};

std::vector<VarBind> WarmStartBindings(const AgentState& agent) {
    return {{kSysUpTimeOid, Ber::Unsigned(Ber::kTimeTicks, agent.upTime)},
            {kSnmpTrapOid, Ber::Oid(kWarmStartOid)}};
}

// The security of a remote user at the target's level, for messages to `engineId`.
UsmParameters Security(const RemoteUser& user, const std::string& level) {
    UsmParameters usm;
    usm.userName = user.name;
    if (level == "none") return usm;
    const auto auth = ParseAuthProtocol(user.authProtocol);
    const auto authKey = FromHex(user.authHash);
    if (!auth || !authKey) Fail("remote user '" + user.name + "' has no authentication key");
    usm.auth = *auth;
    usm.authKey = *authKey;
    if (level == "priv") {
        const auto privKey = FromHex(user.privHash);
        if (user.privProtocol != "AES" || !privKey || privKey->size() < 16) {
            Fail("remote user '" + user.name + "' has no privacy key");
        }
        usm.privacy = true;
        usm.privKey = *privKey;
    }
    return usm;
}

void SendV1(const V1Target& target, const AgentState& agent) {
    UdpPeer peer(target.to);
    peer.Send(BuildV1Trap(target.community, kAgentObjectId, peer.LocalIpv4(), kGenericWarmStart, 0,
                          agent.upTime));
}

void SendV3Trap(const V3Target& target, const RemoteUser& user, const AgentState& agent) {
    // A trap comes from the agent's own engine: keys, where the level needs them, must be
    // localized for it. Without authentication the user's engine id is no concern.
    if (target.level != "none" && FromHex(user.engineId) != agent.engineId) {
        Fail("remote user '" + user.name + "' is localized for engine id " + user.engineId +
             ", but traps are sent from this agent's engine id " + ToHex(agent.engineId));
    }
    UsmParameters usm = Security(user, target.level);
    usm.engineId = agent.engineId;
    usm.engineBoots = agent.engineBoots;
    usm.engineTime = agent.engineTime;
    UdpPeer peer(target.to);
    peer.Send(BuildV3Message(RandomId(), false, usm, agent.engineId,
                             BuildPdu(Ber::kTrapV2, RandomId(), WarmStartBindings(agent))));
}

// Sends `message` and waits for an SNMPv3 answer, retrying once.
V3Message Exchange(UdpPeer& peer, const std::string& message, int64_t messageId, const char* what) {
    for (int attempt = 0; attempt < kTries; ++attempt) {
        peer.Send(message);
        const auto deadline =
            std::chrono::steady_clock::now() + std::chrono::milliseconds(kReplyTimeoutMs);
        while (true) {
            const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(
                                  deadline - std::chrono::steady_clock::now())
                                  .count();
            if (left <= 0) break;
            const auto reply = peer.Receive(static_cast<int>(left));
            if (!reply) break;
            try {
                V3Message answer = ParseV3Message(*reply);
                if (answer.messageId == messageId) return answer;
            } catch (const Ber::DecodeError&) {
                // Not an answer of ours: keep waiting.
            }
        }
    }
    Fail(std::string("no answer to the ") + what);
}

void SendV3Inform(const V3Target& target, const RemoteUser& user, const AgentState& agent) {
    UdpPeer peer(target.to);

    // Learn the receiver's engine id, boots and time from its report to an empty request.
    const int32_t probeId = RandomId();
    const V3Message report = Exchange(peer,
                                      BuildV3Message(probeId, true, UsmParameters{}, "",
                                                     BuildPdu(Ber::kGetRequest, RandomId(), {})),
                                      probeId, "engine id discovery");
    if (report.engineId.empty()) Fail("the receiver did not tell its engine id");
    if (target.level != "none" && FromHex(user.engineId) != report.engineId) {
        Fail("the receiver's engine id is " + ToHex(report.engineId) + ", but remote user '" +
             user.name + "' is localized for engine id " + user.engineId);
    }

    UsmParameters usm = Security(user, target.level);
    usm.engineId = report.engineId;
    usm.engineBoots = report.engineBoots;
    usm.engineTime = report.engineTime;
    for (int attempt = 0; attempt < 2; ++attempt) {
        const int32_t messageId = RandomId();
        const int32_t requestId = RandomId();
        const V3Message answer = Exchange(
            peer,
            BuildV3Message(messageId, true, usm, agent.engineId,
                           BuildPdu(Ber::kInformRequest, requestId, WarmStartBindings(agent))),
            messageId, "inform");
        if ((answer.flags & kFlagAuth) && !VerifyV3Message(answer, usm.auth, usm.authKey)) {
            Fail("the answer to the inform failed authentication");
        }
        const std::string scoped =
            (answer.flags & kFlagPriv) ? DecryptScopedPdu(answer, usm.privKey) : answer.scopedPdu;
        const Pdu pdu = ParseScopedPdu(scoped).second;
        if (pdu.tag == Ber::kResponse && pdu.requestId == requestId) {
            if (pdu.errorStatus != 0) {
                Fail("the receiver answered the inform with error status " +
                     std::to_string(pdu.errorStatus));
            }
            return;
        }
        if (pdu.tag != Ber::kReport || pdu.bindings.empty()) {
            Fail("unexpected answer to the inform");
        }
        const std::string& reported = pdu.bindings.front().first;
        if (reported == kNotInTimeWindow && attempt == 0) {
            // Resynchronise with the receiver's clock and try once more.
            usm.engineBoots = answer.engineBoots;
            usm.engineTime = answer.engineTime;
            continue;
        }
        const auto name = kReportNames.find(reported);
        Fail(std::string("the receiver reported ") +
             (name != kReportNames.end() ? name->second : reported.c_str()));
    }
    Fail("the receiver kept reporting a message outside its time window");
}

}  // namespace

std::vector<Delivery> SendWarmStarts(const Settings& settings, const AgentState& agent) {
    std::vector<Delivery> deliveries;
    for (const auto& entry : settings.targets) {
        Delivery delivery;
        try {
            const V1Target target = ParseV1Target(entry);
            delivery.what = "v1 trap to " + Describe(target.to);
            SendV1(target, agent);
        } catch (const std::exception& error) {
            if (delivery.what.empty()) delivery.what = "v1 target " + entry;
            delivery.error = error.what();
        }
        deliveries.push_back(std::move(delivery));
    }
    std::map<std::string, RemoteUser> users;
    for (const auto& entry : settings.remoteUsers) {
        try {
            auto user = ParseRemoteUser(entry);
            users.emplace(user.name, std::move(user));
        } catch (const std::exception&) {
            // A v3 target naming it reports it as missing.
        }
    }
    for (const auto& entry : settings.v3Targets) {
        Delivery delivery;
        try {
            const V3Target target = ParseV3Target(entry);
            delivery.what = std::string("v3 ") + (target.inform ? "inform" : "trap") + " to " +
                            Describe(target.to) + " as " + target.user;
            const auto user = users.find(target.user);
            if (user == users.end()) Fail("remote user '" + target.user + "' is not configured");
            if (target.inform) {
                SendV3Inform(target, user->second, agent);
            } else {
                SendV3Trap(target, user->second, agent);
            }
        } catch (const std::exception& error) {
            if (delivery.what.empty()) delivery.what = "v3 target " + entry;
            delivery.error = error.what();
        }
        deliveries.push_back(std::move(delivery));
    }
    return deliveries;
}

}  // namespace BrixSim::Snmp

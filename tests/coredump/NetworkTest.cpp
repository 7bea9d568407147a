// `system coredump network`: validation order, IPv4 and IPv6 servers, and the server check
// against a UDP responder on loopback.
#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <atomic>
#include <thread>

#include "Helpers.h"
#include "hostsim/core/Store.h"

namespace {

using namespace CoredumpTest;

constexpr const char* kEnableConflict =
    "--enable cannot be combined with --interface-name, --server-ipv4, --server-ip or "
    "--server-port.";
constexpr const char* kNoAddress = "Missing parameter: network server IP address.";
constexpr const char* kNoInterface = "Missing parameter: interface name.";
constexpr const char* kNotIpv4 = "Invalid netdump server address: not an IPv4 address.";

std::string PortRefused(const std::string& port) {
    return "Invalid netdump server port " + port + ": the port must be from 1 to 4294967295.";
}

// A UDP socket on a loopback address; with `answer` it replies to every datagram.
class Responder {
  public:
    Responder(int family, bool answer) {
        fd_ = ::socket(family, SOCK_DGRAM | SOCK_CLOEXEC, 0);
        sockaddr_storage address{};
        socklen_t length;
        if (family == AF_INET) {
            auto* v4 = reinterpret_cast<sockaddr_in*>(&address);
            v4->sin_family = AF_INET;
            v4->sin_addr.s_addr = htonl(INADDR_LOOPBACK);
            length = sizeof *v4;
        } else {
            auto* v6 = reinterpret_cast<sockaddr_in6*>(&address);
            v6->sin6_family = AF_INET6;
            v6->sin6_addr = in6addr_loopback;
            length = sizeof *v6;
        }
        ok_ = fd_ >= 0 && ::bind(fd_, reinterpret_cast<sockaddr*>(&address), length) == 0 &&
              ::getsockname(fd_, reinterpret_cast<sockaddr*>(&address), &length) == 0;
        port_ = ntohs(family == AF_INET ? reinterpret_cast<sockaddr_in*>(&address)->sin_port
                                        : reinterpret_cast<sockaddr_in6*>(&address)->sin6_port);
        if (ok_) thread_ = std::thread([this, answer] { Serve(answer); });
    }
    ~Responder() {
        stop_ = true;
        if (thread_.joinable()) thread_.join();
        if (fd_ >= 0) ::close(fd_);
    }
    bool Ok() const { return ok_; }
    std::string Port() const { return std::to_string(port_); }
    int Received() const { return received_; }

  private:
    void Serve(bool answer) {
        while (!stop_) {
            pollfd waiting{fd_, POLLIN, 0};
            if (::poll(&waiting, 1, 50) <= 0) continue;
            char buffer[512];
            sockaddr_storage peer{};
            socklen_t length = sizeof peer;
            const ssize_t n = ::recvfrom(fd_, buffer, sizeof buffer, 0,
                                         reinterpret_cast<sockaddr*>(&peer), &length);
            if (n < 0) continue;
            ++received_;
            if (answer) {
                ::sendto(fd_, "ok", 2, 0, reinterpret_cast<sockaddr*>(&peer), length);
            }
        }
    }

    int fd_ = -1;
    bool ok_ = false;
    uint16_t port_ = 0;
    std::atomic<bool> stop_{false};
    std::atomic<int> received_{0};
    std::thread thread_;
};

TEST(Network, SetValidationMessagesInOrderChangeNothing) {
    BrixTest::TempHost host;
    const std::pair<std::vector<std::string>, std::string> cases[] = {
        {{"-e", "true", "-o", "0"}, "Invalid server port number."},
        {{"-v", "vnic0", "-j", "10.0.0.9", "-o", "-5"}, "Invalid server port number."},
        {{"-e", "true", "-v", "vnic0"}, kEnableConflict},
        {{"-e", "false", "-o", "7"}, kEnableConflict},
        {{"-e", "false", "-j", "10.0.0.9"}, kEnableConflict},
        {{"-e", "true", "-i", "10.0.0.9"}, kEnableConflict},
        {{}, kNoAddress},
        {{"-v", "vnic0"}, kNoAddress},
        {{"-j", "10.0.0.9"}, kNoInterface},
        {{"-i", "10.0.0.9", "-j", "10.0.0.8"}, kNoInterface},
        {{"-v", "vnic0", "-i", "10.0.0.9", "-j", "10.0.0.8"}, "Cannot set 2 server ip parameters."},
        {{"-v", "vnic0", "-j", "dumps.example"}, "Invalid ip address provided."},
        {{"-v", "vnic0", "-j", "10.0.0.256"}, "Invalid ip address provided."},
        // The host refuses what it cannot keep: the port whole, an address of the other form.
        {{"-v", "vnic0", "-j", "127.0.0.1", "-o", "4294967296"}, PortRefused("4294967296")},
        {{"-v", "vnic0", "-j", "127.0.0.1", "-o", "4294967376"}, PortRefused("4294967376")},
        {{"-v", "vnic0", "-j", "::1", "-o", "9223372036854775807"},
         PortRefused("9223372036854775807")},
        {{"-v", "vnic0", "-i", "../../etc/passwd"}, kNotIpv4},
        {{"-v", "vnic0", "-i", "10.20.0.300"}, kNotIpv4},
        {{"-v", "vnic0", "-i", "::1"}, kNotIpv4},
    };
    const size_t before = host.Journal().size();
    for (const auto& [args, message] : cases) {
        auto words = args;
        words.insert(words.begin(), {"network", "set"});
        SCOPED_TRACE(testing::PrintToString(args));
        ExpectFailure(Coredump(host, words), message);
    }
    EXPECT_EQ(CallsSince(host, before), std::vector<std::string>{});
}

TEST(Network, IpVersionsPortsAndGet) {
    BrixTest::TempHost host;
    // Disabled: only Enabled is filled in.
    auto get = Coredump(host, {"network", "get"});
    ASSERT_EQ(get.status, 0) << get.err;
    EXPECT_EQ(nlohmann::ordered_json::parse(get.out).dump(),
              R"({"Enabled":false,"Host VNic":"","Network Server IP":"",)"
              R"("Network Server Port":null,"Is Using IPv6":false})");

    ASSERT_EQ(Coredump(host, {"network", "set", "-v", "vnic0", "-j", "::1"}).status, 0);
    EXPECT_EQ(LastCall(host, "HostCtl::Network::NetworkInfo::SetNetworkDumpServerIpv6")["args"],
              json({"vnic0", "::1", 6500}));
    ASSERT_EQ(Coredump(host, {"network", "set", "-e", "true"}).status, 0);
    EXPECT_EQ(json::parse(Coredump(host, {"network", "get"}).out),
              json::parse(R"({"Enabled":true,"Host VNic":"vnic0","Network Server IP":"::1",
                              "Network Server Port":6500,"Is Using IPv6":true})"));

    // Any positive port the host can keep is passed on, also one above 65535.
    ASSERT_EQ(Coredump(host, {"network", "set", "--interface-name", "vnic2", "--server-ip",
                              "10.30.0.5", "--server-port", "70000"})
                  .status,
              0);
    EXPECT_EQ(json::parse(Coredump(host, {"network", "get"}).out),
              json::parse(R"({"Enabled":true,"Host VNic":"vnic2","Network Server IP":"10.30.0.5",
                              "Network Server Port":70000,"Is Using IPv6":false})"));
    ASSERT_EQ(Coredump(host, {"network", "set", "-v", "vnic1", "-i", "10.20.0.30"}).status, 0);
    EXPECT_EQ(LastCall(host, "HostCtl::Network::NetworkInfo::SetNetworkDumpServerIpv4")["args"],
              json({"vnic1", "10.20.0.30", 6500}));
    // An address the service would refuse, stored by other means, fails the check's test.
    auto& store = BrixSim::Store::Get();
    store.Write([&] { store.SetValue("coredump.netdump.server", "10.20.0.300"); });
    ExpectFailure(Coredump(host, {"network", "check"}), "Invalid netdump server ip configured");

    ExpectFailure(Coredump(host, {"network", "set", "-v", "vnic9", "-j", "10.0.0.1"}),
                  "Interface vnic9 is not a valid vnic.");
    ASSERT_EQ(Coredump(host, {"network", "set", "-e", "false"}).status, 0);
    EXPECT_EQ(json::parse(Coredump(host, {"network", "get"}).out)["Enabled"], false);
    ExpectFailure(Coredump(host, {"network", "check"}), "Network coredump not enabled");
}

TEST(Network, CheckProbesTheServer) {
    for (int family : {AF_INET, AF_INET6}) {
        BrixTest::TempHost host;
        Responder responder(family, true);
        ASSERT_TRUE(responder.Ok());
        const std::string address = family == AF_INET ? "127.0.0.1" : "::1";
        ASSERT_EQ(
            Coredump(host, {"network", "set", "-v", "vnic0", "-j", address, "-o", responder.Port()})
                .status,
            0);
        ASSERT_EQ(Coredump(host, {"network", "set", "-e", "true"}).status, 0);
        auto check = Coredump(host, {"network", "check"}, false);
        EXPECT_EQ(check.status, 0) << check.err;
        EXPECT_NE(check.out.find("Verified the configured netdump server is running"),
                  std::string::npos)
            << check.out;
        EXPECT_EQ(json::parse(Coredump(host, {"network", "check"}).out),
                  "Verified the configured netdump server is running");
        EXPECT_GE(responder.Received(), 2);
    }
}

TEST(Network, CheckReportsAServerThatDoesNotAnswer) {
    BrixTest::TempHost host;
    std::string closedPort;
    {
        Responder gone(AF_INET, false);
        closedPort = gone.Port();
    }
    ASSERT_EQ(Coredump(host, {"network", "set", "-v", "vnic0", "-j", "127.0.0.1", "-o", closedPort})
                  .status,
              0);
    ASSERT_EQ(Coredump(host, {"network", "set", "-e", "true"}).status, 0);
    ExpectFailure(
        Coredump(host, {"network", "check"}),
        "Netdump server at 127.0.0.1 port " + closedPort + " is not reachable: Connection refused");

    // A server that reads but never answers: the check gives up after its timeout.
    Responder silent(AF_INET, false);
    SetHostValues(host, {{"coredump.netdump.check_timeout_ms", "200"}});
    ASSERT_EQ(
        Coredump(host, {"network", "set", "-v", "vnic0", "-j", "127.0.0.1", "-o", silent.Port()})
            .status,
        0);
    ExpectFailure(
        Coredump(host, {"network", "check"}),
        "Netdump server at 127.0.0.1 port " + silent.Port() + " did not respond within 200 ms");

    ASSERT_EQ(
        Coredump(host, {"network", "set", "-v", "vnic0", "-j", "127.0.0.1", "-o", "70000"}).status,
        0);
    ExpectFailure(Coredump(host, {"network", "check"}), "Invalid netdump server port 70000");
}

TEST(Network, FaultsAreReported) {
    const struct {
        const char* op;
        std::vector<std::string> words;
    } cases[] = {
        {"HostCtl::Host::GetNetworkInfo", {"network", "get"}},
        {"HostCtl::Network::NetworkInfo::IsNetworkDumpEnabled", {"network", "check"}},
        {"HostCtl::Network::NetworkInfo::EnableNetworkDump", {"network", "set", "-e", "true"}},
        {"HostCtl::Network::NetworkInfo::SetNetworkDumpServerIpv4",
         {"network", "set", "-v", "vnic0", "-j", "10.0.0.2"}},
    };
    for (const auto& c : cases) {
        BrixTest::TempHost host;
        host.Fault(c.op, "network service down");
        SCOPED_TRACE(c.op);
        ExpectFailure(Coredump(host, c.words), "network service down");
    }
}

}  // namespace

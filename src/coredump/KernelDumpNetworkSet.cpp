#include "coredump/KernelDumpNetworkSet.h"

#include "hostctl/Host.h"
#include "hostctl/NetworkInfo.h"

namespace OstrelCli::System {

namespace {
// The port a dump server listens on unless told otherwise.
constexpr int64_t kDefaultServerPort = 6500;
}  // namespace

std::shared_ptr<KernelDumpNetworkSet> KernelDumpNetworkSet::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpNetworkSet>(new KernelDumpNetworkSet));
}

KernelDumpNetworkSet::KernelDumpNetworkSet() {
    Describe(*this, "Set the parameters used for network core dump", nullptr, "operation");
}

KernelDumpNetworkSet::~KernelDumpNetworkSet() = default;

std::shared_ptr<CallSpec::InputSpec> KernelDumpNetworkSet::GetInputSpecInternal() {
    return Params()
        .Add("enable", CallSpec::PARAM_BOOL, "e",
             "Enable network dump. This option cannot be specified when setting the dump "
             "parameters below.",
             false)
        .Add("interface-name", CallSpec::PARAM_STRING, "v",
             "An active interface to be used for the network core dump. Required option when "
             "setting dump parameters.",
             false)
        .Add("server-ipv4", CallSpec::PARAM_STRING, "i",
             "IPv4 address of the core dump server.(deprecated, use -j|--server-ip instead)", false)
        .Add("server-ip", CallSpec::PARAM_STRING, "j",
             "IP address of the core dump server (IPv4 or IPv6). Required when setting dump "
             "parameters.",
             false)
        .Add("server-port", CallSpec::PARAM_INT, "o",
             "Port on which the core dump server is listening. (Optional)", false);
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpNetworkSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void KernelDumpNetworkSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    using HostCtl::Network::Ipv4Address;
    using HostCtl::Network::Ipv6Address;
    const auto read = [&](const char* name) {
        return input->HasParameter(name) ? input->GetParameter(name) : std::string();
    };
    const std::string interfaceName = read("interface-name");
    const std::string serverIpv4 = read("server-ipv4");
    const std::string serverIp = read("server-ip");
    const bool hasPort = input->HasParameter("server-port");
    int64_t port = 0;
    if (hasPort) {
        port = input->GetParameterInt("server-port");
        if (port <= 0) return Fail(*output, "Invalid server port number.");
    }
    Guard(*output, [&] {
        auto host = HostCtl::HostFactory::GetHost();
        const auto network = host->GetNetworkInfo();
        host.reset();
        if (input->HasParameter("enable")) {
            if (!interfaceName.empty() || !serverIpv4.empty() || !serverIp.empty() || hasPort) {
                return Fail(*output,
                            "--enable cannot be combined with --interface-name, --server-ipv4, "
                            "--server-ip or --server-port.");
            }
            if (input->GetParameterBool("enable")) {
                network->EnableNetworkDump();
            } else {
                network->DisableNetworkDump();
            }
            return Succeed(*output);
        }
        if (serverIp.empty() && serverIpv4.empty()) {
            return Fail(*output, "Missing parameter: network server IP address.");
        }
        if (interfaceName.empty()) return Fail(*output, "Missing parameter: interface name.");
        // Any positive port goes to the host whole; the host refuses one it cannot keep.
        const int64_t serverPort = hasPort ? port : kDefaultServerPort;
        if (!serverIpv4.empty() && !serverIp.empty()) {
            return Fail(*output, "Cannot set 2 server ip parameters.");
        }
        if (!serverIpv4.empty()) {
            network->SetNetworkDumpServerIpv4(interfaceName, Ipv4Address(serverIpv4), serverPort);
        } else if (Ipv4Address::IsValidAddress(serverIp)) {
            network->SetNetworkDumpServerIpv4(interfaceName, Ipv4Address(serverIp), serverPort);
        } else if (Ipv6Address::IsValidAddress(serverIp)) {
            network->SetNetworkDumpServerIpv6(interfaceName, Ipv6Address(serverIp), serverPort);
        } else {
            return Fail(*output, "Invalid ip address provided.");
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

#include "coredump/KernelDumpNetworkCheck.h"

#include "hostctl/Host.h"
#include "hostctl/NetworkInfo.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpNetworkCheck> KernelDumpNetworkCheck::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpNetworkCheck>(new KernelDumpNetworkCheck));
}

KernelDumpNetworkCheck::KernelDumpNetworkCheck() {
    Describe(*this, "Check the status of the configured network dump server", "simple", "fetcher");
}

KernelDumpNetworkCheck::~KernelDumpNetworkCheck() = default;

std::shared_ptr<CallSpec::InputSpec> KernelDumpNetworkCheck::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpNetworkCheck::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaString::New());
}

void KernelDumpNetworkCheck::ExecuteInternal(InputPtr, OutputPtr output) {
    using HostCtl::Network::Ipv4Address;
    using HostCtl::Network::Ipv6Address;
    Guard(*output, [&] {
        auto host = HostCtl::HostFactory::GetHost();
        const auto network = host->GetNetworkInfo();
        host.reset();
        if (!network->IsNetworkDumpEnabled()) return Fail(*output, "Network coredump not enabled");
        std::string interfaceName;
        std::string server;
        uint32_t port = 0;
        bool ipv6 = false;
        network->GetNetworkDumpConfig(interfaceName, server, port, ipv6);
        const bool valid =
            ipv6 ? Ipv6Address::IsValidAddress(server) : Ipv4Address::IsValidAddress(server);
        if (!valid) return Fail(*output, "Invalid netdump server ip configured");
        std::string error;
        network->CheckNetworkDumpServer(interfaceName, server, port, error);
        if (!error.empty()) return Fail(*output, error);
        Answer(*output,
               MetaObj::MetaString::New("Verified the configured netdump server is running"));
    });
}

}  // namespace OstrelCli::System

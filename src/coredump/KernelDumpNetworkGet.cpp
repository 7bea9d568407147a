#include "coredump/KernelDumpNetworkGet.h"

#include "hostctl/Host.h"
#include "hostctl/NetworkInfo.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpNetworkGet> KernelDumpNetworkGet::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpNetworkGet>(new KernelDumpNetworkGet));
}

KernelDumpNetworkGet::KernelDumpNetworkGet() {
    Describe(*this, "Get the currently configured parameters for network coredump, if enabled.",
             "simple", "fetcher");
}

KernelDumpNetworkGet::~KernelDumpNetworkGet() = default;

std::shared_ptr<MetaObj::MetaStruct> KernelDumpNetworkGet::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("NetworkCoredump");
    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    result->SetField("Enabled", false, doc);
    result->SetField("Host VNic", "", doc);
    result->SetField("Network Server IP", "", doc);
    result->SetField("Network Server Port", MetaObj::MetaInt::New(), doc);
    result->SetField("Is Using IPv6", false, doc);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> KernelDumpNetworkGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpNetworkGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void KernelDumpNetworkGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        auto host = HostCtl::HostFactory::GetHost();
        const auto network = host->GetNetworkInfo();
        host.reset();
        const bool enabled = network->IsNetworkDumpEnabled();
        auto result = GetOutputStructure();
        const auto& doc = MetaObj::MetaStruct::_docEmpty;
        result->SetField("Enabled", enabled, doc);
        if (enabled) {
            std::string interfaceName;
            std::string server;
            uint32_t port = 0;
            bool ipv6 = false;
            network->GetNetworkDumpConfig(interfaceName, server, port, ipv6);
            result->SetField("Host VNic", interfaceName, doc);
            result->SetField("Network Server IP", server, doc);
            result->SetField("Network Server Port", static_cast<long>(port), doc);
            result->SetField("Is Using IPv6", ipv6, doc);
        }
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

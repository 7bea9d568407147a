#include "identity/HostnameGet.h"

#include "kernctl/DnsConfig.h"

namespace OstrelCli::System {

std::shared_ptr<HostnameGet> HostnameGet::New() {
    return AdoptSelf(std::shared_ptr<HostnameGet>(new HostnameGet));
}

HostnameGet::HostnameGet() {
    Describe(*this, "Get the host, domain or fully qualified name of the Brix host.", "simple",
             "fetcher");
}

HostnameGet::~HostnameGet() = default;

std::shared_ptr<MetaObj::MetaStruct> HostnameGet::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("FullyQualifiedHostName");
    result->SetField("Host Name", "", MetaObj::MetaStruct::_docEmpty);
    result->SetField("Domain Name", "", MetaObj::MetaStruct::_docEmpty);
    result->SetField("Fully Qualified Domain Name", "", MetaObj::MetaStruct::_docEmpty);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> HostnameGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> HostnameGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void HostnameGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Network::DnsConfigImpl dns("defaultTcpipStack");
        auto result = GetOutputStructure();
        result->SetField("Host Name", dns.GetHostname(), MetaObj::MetaStruct::_docEmpty);
        result->SetField("Domain Name", dns.GetDomain(), MetaObj::MetaStruct::_docEmpty);
        result->SetField("Fully Qualified Domain Name", dns.GetFqdn(),
                         MetaObj::MetaStruct::_docEmpty);
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

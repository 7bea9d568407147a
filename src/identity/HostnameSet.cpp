#include "identity/HostnameSet.h"

#include "kernctl/DnsConfig.h"

namespace OstrelCli::System {

std::shared_ptr<HostnameSet> HostnameSet::New() {
    return AdoptSelf(std::shared_ptr<HostnameSet>(new HostnameSet));
}

HostnameSet::HostnameSet() {
    Describe(*this,
             "This command allows the user to set the hostname, domain name or fully qualified "
             "domain name of the Brix host.",
             nullptr, "operation");
}

HostnameSet::~HostnameSet() = default;

std::shared_ptr<CallSpec::InputSpec> HostnameSet::GetInputSpecInternal() {
    return Params()
        .Add("host", CallSpec::PARAM_STRING, "H",
             "The host name to set for the Brix host. This name should not contain the DNS "
             "domain name of the host and can only contain letters, numbers and '-'. NOTE this "
             "is not the fully qualified name, that can be set with the --fqdn option. This "
             "option is mutually exclusive with the --fqdn option.",
             false)
        .Add("domain", CallSpec::PARAM_STRING, "d",
             "The domain name to set for the Brix host. This option is mutually exclusive with "
             "the --fqdn option.",
             false)
        .Add("fqdn", CallSpec::PARAM_STRING, "f",
             "Set the fully qualified domain name of the Brix host.", false);
}

std::shared_ptr<CallSpec::OutputSpec> HostnameSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void HostnameSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Network::DnsConfigImpl dns("defaultTcpipStack");
        const bool host = input->HasParameter("host");
        const bool domain = input->HasParameter("domain");
        const bool fqdn = input->HasParameter("fqdn");
        if (!host && !domain && !fqdn) {
            Fail(*output, "You must specify at least one of: --host, --domain, --fqdn");
            return;
        }
        if (fqdn && (host || domain)) {
            Fail(*output, "You may not specify --host or --domain with --fqdn");
            return;
        }
        if (fqdn) {
            dns.SetFqdn(input->GetParameter("fqdn"), false, "");
        } else {
            if (host) dns.SetHostname(input->GetParameter("host"), false);
            if (domain) dns.SetDomain(input->GetParameter("domain"), false);
        }
        dns.SaveConfig();
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

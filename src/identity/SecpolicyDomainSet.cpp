#include "identity/SecpolicyDomainSet.h"

#include "kernctl/KernAccess.h"

namespace OstrelCli::System {

std::shared_ptr<SecpolicyDomainSet> SecpolicyDomainSet::New() {
    return AdoptSelf(std::shared_ptr<SecpolicyDomainSet>(new SecpolicyDomainSet));
}

SecpolicyDomainSet::SecpolicyDomainSet() {
    Describe(*this,
             "Set the enforcement level for a domain in the system. Any option specified here is "
             "not persistent and will not survive a reboot of the system.",
             nullptr, "operation");
}

SecpolicyDomainSet::~SecpolicyDomainSet() = default;

std::shared_ptr<CallSpec::InputSpec> SecpolicyDomainSet::GetInputSpecInternal() {
    return Params()
        .Add("all-domains", CallSpec::PARAM_FLAG, "a", "All domains.", false)
        .Add("name", CallSpec::PARAM_STRING, "n", "The domain name.", false)
        .Add("level", CallSpec::PARAM_STRING, "l", "The enforcement level.", true);
}

std::shared_ptr<CallSpec::OutputSpec> SecpolicyDomainSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void SecpolicyDomainSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    const bool allDomains = input->IsFlagSet("all-domains");
    const bool named = input->HasParameter("name");
    if (allDomains && named) {
        Fail(*output, "Can't specify domain name with all-domains option");
        return;
    }
    if (!allDomains && !named) {
        Fail(*output, "Must specify one of all-domains or name");
        return;
    }
    Guard(*output, [&] {
        KernCtl::Security::KernAccessInterfaceImpl access;
        const std::string level = input->GetParameter("level");
        if (allDomains) {
            access.Enable(level);
        } else {
            access.EnableDomain(input->GetParameter("name"), level);
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

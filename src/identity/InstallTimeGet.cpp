#include "identity/InstallTimeGet.h"

#include "hostctl/Host.h"
#include "hostctl/SystemInfo.h"

namespace OstrelCli::System {

std::shared_ptr<InstallTimeGet> InstallTimeGet::New() {
    return AdoptSelf(std::shared_ptr<InstallTimeGet>(new InstallTimeGet));
}

InstallTimeGet::InstallTimeGet() {
    Describe(*this,
             "Display the date and time when this system was first installed. Value will not "
             "change on subsequent updates.",
             "simple", "fetcher");
}

InstallTimeGet::~InstallTimeGet() = default;

std::shared_ptr<CallSpec::InputSpec> InstallTimeGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> InstallTimeGet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaString::New());
}

void InstallTimeGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(
        *output,
        [&] {
            auto host = HostCtl::HostFactory::GetHost();
            auto systemInfo = host->GetSystemInfo();
            Answer(*output, MetaObj::MetaString::New(systemInfo->GetInceptionTime()));
        },
        "system inception timestamp missing: ");
}

}  // namespace OstrelCli::System

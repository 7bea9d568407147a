#include "identity/WelcomeMessageGet.h"

#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<WelcomeMessageGet> WelcomeMessageGet::New() {
    return AdoptSelf(std::shared_ptr<WelcomeMessageGet>(new WelcomeMessageGet));
}

WelcomeMessageGet::WelcomeMessageGet() {
    Describe(*this, "Get the Welcome Message for KCON.", "simple", "fetcher");
}

WelcomeMessageGet::~WelcomeMessageGet() = default;

std::shared_ptr<CallSpec::InputSpec> WelcomeMessageGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> WelcomeMessageGet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaString::New());
}

void WelcomeMessageGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::System::SystemInfoImpl systemInfo;
        Answer(*output, MetaObj::MetaString::New(systemInfo.GetWelcomeMessage()));
    });
}

}  // namespace OstrelCli::System

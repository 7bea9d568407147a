#include "identity/WelcomeMessageSet.h"

#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<WelcomeMessageSet> WelcomeMessageSet::New() {
    return AdoptSelf(std::shared_ptr<WelcomeMessageSet>(new WelcomeMessageSet));
}

WelcomeMessageSet::WelcomeMessageSet() {
    Describe(*this, "Set the Welcome Message for KCON.", nullptr, "operation");
}

WelcomeMessageSet::~WelcomeMessageSet() = default;

std::shared_ptr<CallSpec::InputSpec> WelcomeMessageSet::GetInputSpecInternal() {
    return Params().Add("message", CallSpec::PARAM_STRING, "m", "Welcome Message String.", true);
}

std::shared_ptr<CallSpec::OutputSpec> WelcomeMessageSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void WelcomeMessageSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    const std::string message = input->GetParameter("message");
    Guard(*output, [&] {
        KernCtl::System::SystemInfoImpl systemInfo;
        systemInfo.SetWelcomeMessage(message);
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

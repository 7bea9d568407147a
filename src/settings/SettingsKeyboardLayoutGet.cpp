#include "settings/SettingsKeyboardLayoutGet.h"

#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<SettingsKeyboardLayoutGet> SettingsKeyboardLayoutGet::New() {
    return AdoptSelf(std::shared_ptr<SettingsKeyboardLayoutGet>(new SettingsKeyboardLayoutGet));
}

SettingsKeyboardLayoutGet::SettingsKeyboardLayoutGet() {
    Describe(*this, "Get the keyboard layout", "simple", "fetcher");
}

SettingsKeyboardLayoutGet::~SettingsKeyboardLayoutGet() = default;

std::shared_ptr<CallSpec::InputSpec> SettingsKeyboardLayoutGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> SettingsKeyboardLayoutGet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaString::New());
}

void SettingsKeyboardLayoutGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::System::SystemInfoImpl systemInfo;
        Answer(*output, MetaObj::MetaString::New(systemInfo.GetKeyboardLayout()));
    });
}

}  // namespace OstrelCli::System

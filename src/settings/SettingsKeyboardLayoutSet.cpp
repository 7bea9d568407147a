#include "settings/SettingsKeyboardLayoutSet.h"

#include <string>

#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<SettingsKeyboardLayoutSet> SettingsKeyboardLayoutSet::New() {
    return AdoptSelf(std::shared_ptr<SettingsKeyboardLayoutSet>(new SettingsKeyboardLayoutSet));
}

SettingsKeyboardLayoutSet::SettingsKeyboardLayoutSet() {
    Describe(*this, "Set the keyboard layout", nullptr, "operation");
}

SettingsKeyboardLayoutSet::~SettingsKeyboardLayoutSet() = default;

std::shared_ptr<CallSpec::InputSpec> SettingsKeyboardLayoutSet::GetInputSpecInternal() {
    return Params()
        .Add("layout", CallSpec::PARAM_STRING, "l", "The name of the layout to set", false)
        .Add("no-persist", CallSpec::PARAM_FLAG, "", "Only apply this layout for the current boot",
             false)
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> SettingsKeyboardLayoutSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void SettingsKeyboardLayoutSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        const std::string layout =
            input->HasParameter("layout") ? input->GetParameter("layout") : std::string();
        KernCtl::System::SystemInfoImpl systemInfo;
        if (!layout.empty()) {
            // A persistent change is stored before it is applied.
            if (!input->IsFlagSet("no-persist")) systemInfo.SetKeyboardLayout(layout);
        }
        systemInfo.LoadKeyboardMappings(layout);
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

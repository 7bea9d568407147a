#include "settings/SettingsKernelSet.h"

#include "kernctl/KernelOpts.h"

namespace OstrelCli::System {

std::shared_ptr<SettingsKernelSet> SettingsKernelSet::New() {
    return AdoptSelf(std::shared_ptr<SettingsKernelSet>(new SettingsKernelSet));
}

SettingsKernelSet::SettingsKernelSet() {
    Describe(*this, "Set a BrixKernel setting.", nullptr, "operation");
}

SettingsKernelSet::~SettingsKernelSet() = default;

std::shared_ptr<CallSpec::InputSpec> SettingsKernelSet::GetInputSpecInternal() {
    return Params()
        .Add("setting", CallSpec::PARAM_STRING, "s", "The name of the BrixKernel setting to set.",
             true)
        .Add("value", CallSpec::PARAM_STRING, "v", "The value to set the setting to.", true)
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> SettingsKernelSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void SettingsKernelSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::System::KernelOpts options;
        options.SetOption(input->GetParameter("setting"), input->GetParameter("value"));
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

#include "modules/ModuleSet.h"

#include <string>

#include "kernctl/Module.h"

namespace OstrelCli::System {

std::shared_ptr<ModuleSet> ModuleSet::New() {
    return AdoptSelf(std::shared_ptr<ModuleSet>(new ModuleSet));
}

ModuleSet::ModuleSet() {
    Describe(*this, "Allow enabling and disabling of a Brixkernel module.", nullptr, "operation");
}

ModuleSet::~ModuleSet() = default;

std::shared_ptr<CallSpec::InputSpec> ModuleSet::GetInputSpecInternal() {
    return Params()
        .Add("module", CallSpec::PARAM_STRING, "m",
             "The name of the Brixkernel module to set options for.", true)
        .Add("enabled", CallSpec::PARAM_BOOL, "e",
             "Set to true to enable the module, set to false to disable the module.", true)
        .Add("force", CallSpec::PARAM_FLAG, "f",
             "Skip Brixkernel module validity checks and set options for a module (or alias) "
             "with the given name.",
             false)
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> ModuleSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void ModuleSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        const std::string name = input->GetParameter("module");
        const bool enabled = input->GetParameterBool("enabled");
        const bool force = input->IsFlagSet("force");
        if (name.empty()) {
            Fail(*output, "Module name cannot be empty.");
            return;
        }
        KernCtl::System::ModuleImpl module(name);
        if (!force && !KernCtl::System::ModuleImpl::IsValidName(name)) {
            Fail(*output, "unknown module '" + MessageExcerpt(name) + "'");
            return;
        }
        module.SetEnabled(enabled);
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

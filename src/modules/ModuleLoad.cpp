#include "modules/ModuleLoad.h"

#include <string>

#include "kernctl/Module.h"

namespace OstrelCli::System {

std::shared_ptr<ModuleLoad> ModuleLoad::New() {
    return AdoptSelf(std::shared_ptr<ModuleLoad>(new ModuleLoad));
}

ModuleLoad::ModuleLoad() {
    Describe(*this,
             "Load a Brixkernel module with the given name if it is enabled. If the module is "
             "disabled then the use of --force is required to load the module.",
             nullptr, "operation");
}

ModuleLoad::~ModuleLoad() = default;

std::shared_ptr<CallSpec::InputSpec> ModuleLoad::GetInputSpecInternal() {
    return Params()
        .Add("module", CallSpec::PARAM_STRING, "m", "The name of the Brixkernel module to load.",
             true)
        .Add("force", CallSpec::PARAM_FLAG, "f",
             "Ignore the enabled/disabled state of this module and force it to load.", false)
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> ModuleLoad::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void ModuleLoad::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        const std::string name = input->GetParameter("module");
        const bool force = input->IsFlagSet("force");
        KernCtl::System::ModuleImpl module(name);
        if (name.empty()) {
            Fail(*output, "Module name cannot be empty.");
            return;
        }
        if (!force && !KernCtl::System::ModuleImpl::IsValidName(name)) {
            Fail(*output, "unknown module '" + MessageExcerpt(name) + "'");
            return;
        }
        const bool enabled = module.GetEnabled();
        if (force) {
            module.Load("", true);
        } else if (enabled) {
            module.Load("", false);
        } else {
            Fail(*output, "module '" + name + "' is disabled, use --force to load.");
            return;
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

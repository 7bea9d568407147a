#include "modules/ModuleParametersSet.h"

#include <string>

#include "hostctl/Host.h"
#include "hostctl/Module.h"
#include "hostctl/SystemInfo.h"

namespace OstrelCli::System {

std::shared_ptr<ModuleParametersSet> ModuleParametersSet::New() {
    return AdoptSelf(std::shared_ptr<ModuleParametersSet>(new ModuleParametersSet));
}

ModuleParametersSet::ModuleParametersSet() {
    Describe(*this, "Set the load time parameters for the given Brixkernel module.", nullptr,
             "operation");
}

ModuleParametersSet::~ModuleParametersSet() = default;

std::shared_ptr<CallSpec::InputSpec> ModuleParametersSet::GetInputSpecInternal() {
    return Params()
        .Add("module", CallSpec::PARAM_STRING, "m",
             "The name of the Brixkernel module to set parameters for.", true)
        .Add("parameter-string", CallSpec::PARAM_STRING, "p",
             "The string containing the parameters for this module.", true)
        .Add("append", CallSpec::PARAM_FLAG, "a",
             "Append the specified parameter string to the currently configured parameter "
             "string for the Brixkernel module. If --append is not specified, the parameter "
             "string currently configured for the Brixkernel module will be replaced by the "
             "specified parameter string.",
             false)
        .Add("force", CallSpec::PARAM_FLAG, "f",
             "Skip Brixkernel module validity checks and set parameters for a module (or alias) "
             "with the given name.",
             false)
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> ModuleParametersSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void ModuleParametersSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        const std::string name = input->GetParameter("module");
        const std::string parameters = input->GetParameter("parameter-string");
        const bool force = input->IsFlagSet("force");
        const bool append = input->IsFlagSet("append");
        if (name.empty()) {
            Fail(*output, "Module name cannot be empty.");
            return;
        }
        auto host = HostCtl::HostFactory::GetHost();
        auto systemInfo = host->GetSystemInfo();
        auto module = systemInfo->GetModule(name);
        if (append) {
            module->AppendParameterString(parameters, force);
        } else {
            module->SetParameterString(parameters, force);
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

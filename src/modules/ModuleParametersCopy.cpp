#include "modules/ModuleParametersCopy.h"

#include <string>
#include <vector>

#include "hostctl/Host.h"
#include "hostctl/Module.h"
#include "hostctl/SystemInfo.h"

namespace OstrelCli::System {

std::shared_ptr<ModuleParametersCopy> ModuleParametersCopy::New() {
    return AdoptSelf(std::shared_ptr<ModuleParametersCopy>(new ModuleParametersCopy));
}

ModuleParametersCopy::ModuleParametersCopy() {
    Describe(*this, "Copy the load time parameters from one Brixkernel module to another.", nullptr,
             "operation");
}

ModuleParametersCopy::~ModuleParametersCopy() = default;

std::shared_ptr<CallSpec::InputSpec> ModuleParametersCopy::GetInputSpecInternal() {
    return Params()
        .Add("source", CallSpec::PARAM_STRING, "s", "The name of the source Brixkernel module.",
             true)
        .Add("target", CallSpec::PARAM_STRING, "t", "The name of the target Brixkernel module.",
             true)
        .Add("parameter-keys", CallSpec::PARAM_STRING_LIST, "p",
             "Parameter key that should get copied.", true)
        .Add("force", CallSpec::PARAM_FLAG, "f",
             "Skip Brixkernel module validity checks for the source Brixkernel module.", false)
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> ModuleParametersCopy::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void ModuleParametersCopy::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        const std::string source = input->GetParameter("source");
        const std::string target = input->GetParameter("target");
        const bool force = input->IsFlagSet("force");
        std::vector<std::string> keys;
        if (input->HasParameter("parameter-keys")) input->GetParameterList("parameter-keys", keys);
        if (source.empty() || target.empty()) {
            Fail(*output, "Module names cannot be empty.");
            return;
        }
        if (source == target) {
            Fail(*output, "Module names have to be different.");
            return;
        }
        if (keys.empty()) {
            Fail(*output, "Selection of paramter keys to copy cannot be empty.");
            return;
        }
        auto host = HostCtl::HostFactory::GetHost();
        auto systemInfo = host->GetSystemInfo();
        auto module = systemInfo->GetModule(target);
        module->CopyParameters(source, keys, force);
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

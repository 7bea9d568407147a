#include "modules/KernelLogSetLevel.h"

#include <cstdint>
#include <string>

#include "kernctl/Module.h"
#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<KernelLogSetLevel> KernelLogSetLevel::New() {
    return AdoptSelf(std::shared_ptr<KernelLogSetLevel>(new KernelLogSetLevel));
}

KernelLogSetLevel::KernelLogSetLevel() {
    Describe(*this,
             "Set a specific Brixkernel loglevel to the given value. Optionally with the --module "
             "option set the value of a module's loglevel. This setting will not persist across "
             "reboots.",
             nullptr, "operation");
}

KernelLogSetLevel::~KernelLogSetLevel() = default;

std::shared_ptr<CallSpec::InputSpec> KernelLogSetLevel::GetInputSpecInternal() {
    return Params()
        .Add("level-name", CallSpec::PARAM_STRING, "l",
             "The name of the BrixKernel or module loglevel to set a level for.", true)
        .Add("module", CallSpec::PARAM_STRING, "m",
             "The name of the BrixKernel module to set a loglevel for.", false)
        .Add("default", CallSpec::PARAM_BOOL, "d", "Reset the loglevel to its default value.",
             false)
        .Add("level", CallSpec::PARAM_INT, "L", "The value of the loglevel to set.", false,
             IntRange(0, 2147483647))
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> KernelLogSetLevel::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void KernelLogSetLevel::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        // Only the presence of --default counts, not its value.
        const bool reset = input->HasParameter("default");
        const std::string levelName = input->GetParameter("level-name");
        const bool hasLevel = input->HasParameter("level");
        if (reset && hasLevel) {
            Fail(*output, "cant specify default with level");
            return;
        }
        if (!reset && !hasLevel) {
            Fail(*output, "must specify default or level");
            return;
        }
        const uint32_t level =
            hasLevel ? static_cast<uint32_t>(input->GetParameterInt("level")) : 0U;
        if (input->HasParameter("module")) {
            KernCtl::System::ModuleImpl module(input->GetParameter("module"));
            if (reset) {
                module.SetDefaultLogLevel(levelName);
            } else {
                module.SetLogLevel(levelName, level);
            }
        } else {
            KernCtl::System::SystemInfoImpl systemInfo;
            if (reset) {
                systemInfo.SetDefaultLogLevel(levelName);
            } else {
                systemInfo.SetLogLevel(levelName, level);
            }
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

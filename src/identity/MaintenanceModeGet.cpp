#include "identity/MaintenanceModeGet.h"

#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<MaintenanceModeGet> MaintenanceModeGet::New() {
    return AdoptSelf(std::shared_ptr<MaintenanceModeGet>(new MaintenanceModeGet));
}

MaintenanceModeGet::MaintenanceModeGet() {
    Describe(*this, "Get the maintenance mode state of the system.", "simple", "fetcher");
}

MaintenanceModeGet::~MaintenanceModeGet() = default;

std::shared_ptr<CallSpec::InputSpec> MaintenanceModeGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> MaintenanceModeGet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaString::New());
}

void MaintenanceModeGet::ExecuteInternal(InputPtr, OutputPtr output) {
    GuardDetailed(*output, [&] {
        KernCtl::System::SystemInfoImpl systemInfo;
        const int state = systemInfo.GetMaintenanceModeState();
        const char* text = state == 1 ? "Enabled" : state == 2 ? "Disabled" : "Unknown";
        Answer(*output, MetaObj::MetaString::New(text));
    });
}

}  // namespace OstrelCli::System

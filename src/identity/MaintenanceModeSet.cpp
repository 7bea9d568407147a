#include "identity/MaintenanceModeSet.h"

#include <boost/algorithm/string/trim.hpp>

#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<MaintenanceModeSet> MaintenanceModeSet::New() {
    return AdoptSelf(std::shared_ptr<MaintenanceModeSet>(new MaintenanceModeSet));
}

MaintenanceModeSet::MaintenanceModeSet() {
    Describe(*this, "Enable or disable the maintenance mode of the system.", nullptr, "operation");
}

MaintenanceModeSet::~MaintenanceModeSet() = default;

std::shared_ptr<CallSpec::InputSpec> MaintenanceModeSet::GetInputSpecInternal() {
    return Params()
        .Add("enable", CallSpec::PARAM_BOOL, "e", "enable maintenance mode", true)
        .Add("timeout", CallSpec::PARAM_INT, "t",
             "Time to perform operation in seconds (default 0 seconds)", false)
        .Add("dornamode", CallSpec::PARAM_STRING, "m",
             "Action the DORNA service must take before the host can enter maintenance mode "
             "(default ensureObjectAccessibility). Allowed values are: %FULLENUM%",
             false,
             StringEnum({
                 {"noAction",
                  "Do not move Dorna data out of the disk before entering maintenance mode."},
                 {"ensureObjectAccessibility",
                  "Evacuate data from the disk to ensure object accessibility in the Dorna "
                  "cluster, before entering maintenance mode."},
                 {"evacuateAllData",
                  "Evacuate all data from the disk before entering maintenance mode."},
             }))
        .Context("user");
}

std::shared_ptr<CallSpec::OutputSpec> MaintenanceModeSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void MaintenanceModeSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    GuardDetailed(*output, [&] {
        KernCtl::System::SystemInfoImpl systemInfo;
        const int state = systemInfo.GetMaintenanceModeState();
        const bool enable = input->GetParameterBool("enable");
        if (!enable && state == 2) {
            Fail(*output, "Maintenance mode is already disabled.");
            return;
        }
        if (enable && state == 1) {
            Fail(*output, "Maintenance mode is already enabled.");
            return;
        }
        // The timeout and the mode are passed when leaving too; only entering uses them.
        std::string commandLine = "/bin/mgmt-cmd hostsvc/maintenance_mode_";
        commandLine += enable ? "enter" : "exit";
        commandLine += " ";
        commandLine += input->HasParameter("timeout")
                           ? std::to_string(input->GetParameterInt("timeout"))
                           : std::string("0");
        commandLine += " ";
        commandLine += input->HasParameter("dornamode") ? input->GetParameter("dornamode")
                                                        : std::string("ensureObjectAccessibility");

        std::string printed;
        if (CmdKit::AutoCli::AutoCli_ShellCmdWithKvUsername(commandLine, input->GetContext("user"),
                                                            printed, "") != 0) {
            // What the service printed, without the line break after its last line.
            Fail(*output, boost::algorithm::trim_right_copy(printed));
            return;
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

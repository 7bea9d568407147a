#include "agents/WbemAgentSet.h"

#include "agents/WbemAgentAccess.h"

namespace OstrelCli::System {

std::shared_ptr<WbemAgentSet> WbemAgentSet::New() {
    return AdoptSelf(std::shared_ptr<WbemAgentSet>(new WbemAgentSet));
}

WbemAgentSet::WbemAgentSet() {
    Describe(*this, "This command allows the user to set up Brix CIMOM agent.", nullptr,
             "operation");
}

WbemAgentSet::~WbemAgentSet() = default;

std::shared_ptr<CallSpec::InputSpec> WbemAgentSet::GetInputSpecInternal() {
    return Params()
        .Add("enable", CallSpec::PARAM_BOOL, "e",
             "Start or stop the WBEM services (sfcbd, openwsmand). Values: [yes|no, true|false, "
             "0|1]",
             false)
        .Add("ws-man", CallSpec::PARAM_BOOL, "W",
             "Enable or disable the WS-Management service (openwsmand). Enabled by default. "
             "Changes take effect when --enable is specified.",
             false)
        .Add("auth", CallSpec::PARAM_STRING, "a",
             "Specify how to authorize incoming requests. Values are password, certificate, "
             "password is by default. Changes take effect when --enable is specified.",
             false)
        .Add("port", CallSpec::PARAM_INT, "p",
             "Set the TCP port on which the CIMOM listens for requests. The default is 5989", false,
             IntRange(0, 65525))
        .Add("loglevel", CallSpec::PARAM_STRING, "l",
             "Syslog logging level: debug|info|warning|error", false,
             StringEnum({{"debug", "Most detailed logging level."},
                         {"info", "Reports normal actions in addition to warnings, events."},
                         {"warning", "Reports only warnings or errors."},
                         {"error", "Least detailed logging, Reports only errors."}}))
        .Add("reset", CallSpec::PARAM_FLAG, "r",
             "Restore the WBEM configuration to factory defaults", false);
}

std::shared_ptr<CallSpec::OutputSpec> WbemAgentSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void WbemAgentSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        auto config = OpenWbemAgentConfig();
        bool changed = false;
        if (input->IsFlagSet("reset")) {
            // Later options of the same call apply on top of the defaults.
            config->ResetToDefaults();
            changed = true;
        }
        if (input->HasParameter("enable")) {
            config->SetEnabled(input->GetParameterBool("enable"));
            changed = true;
        }
        if (input->HasParameter("ws-man")) {
            config->SetWsManEnabled(input->GetParameterBool("ws-man"));
            changed = true;
        }
        if (input->HasParameter("auth")) {
            const std::string auth = input->GetParameter("auth");
            if (auth == "password") {
                config->SetAuthModel(HostCtl::System::WBEM_AUTH_PASSWORD);
            } else if (auth == "certificate") {
                config->SetAuthModel(HostCtl::System::WBEM_AUTH_CERTIFICATE);
            } else {
                throw HostCtl::Lib::HostCtlException("Invalid --auth value provided");
            }
            changed = true;
        }
        if (input->HasParameter("port")) {
            config->SetPort(static_cast<int>(input->GetParameterInt("port")));
            changed = true;
        }
        if (input->HasParameter("loglevel")) {
            config->SetLogLevel(input->GetParameter("loglevel"));
        } else if (!changed) {
            throw HostCtl::Lib::HostCtlException("Specify what to set or --help");
        }
        config->Commit();
    });
    // Answers true even after an error message, as the SNMP set command does.
    Succeed(*output);
}

}  // namespace OstrelCli::System

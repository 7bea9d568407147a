#include "agents/WbemAgentProviderSet.h"

#include "agents/WbemAgentAccess.h"

namespace OstrelCli::System {

std::shared_ptr<WbemAgentProviderSet> WbemAgentProviderSet::New() {
    return AdoptSelf(std::shared_ptr<WbemAgentProviderSet>(new WbemAgentProviderSet));
}

WbemAgentProviderSet::WbemAgentProviderSet() {
    Describe(*this, "This command is used to manage Brix CIMOM providers.", nullptr, "operation");
}

WbemAgentProviderSet::~WbemAgentProviderSet() = default;

std::shared_ptr<CallSpec::InputSpec> WbemAgentProviderSet::GetInputSpecInternal() {
    return Params()
        .Add("name", CallSpec::PARAM_STRING, "n", "Specify provider identifier.", true)
        .Add("enable", CallSpec::PARAM_BOOL, "e",
             "Enable or disable the provider immediately. Values: [yes|no, true|false, 0|1]",
             false);
}

std::shared_ptr<CallSpec::OutputSpec> WbemAgentProviderSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void WbemAgentProviderSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        auto config = OpenWbemAgentConfig();
        const std::string name = input->GetParameter("name");
        if (!input->HasParameter("enable")) {
            // Reported, not raised: nothing is committed and the command ends here.
            Fail(*output, "Specify what to set or --help");
            return;
        }
        config->SetProviderEnabled(name, input->GetParameterBool("enable"));
        config->Commit();
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

#include "agents/SlpAgentSearch.h"

#include <vector>

#include "agents/SlpAgentGuard.h"
#include "hostctl/SlpAgent.h"

namespace OstrelCli::System {

std::shared_ptr<SlpAgentSearch> SlpAgentSearch::New() {
    return AdoptSelf(std::shared_ptr<SlpAgentSearch>(new SlpAgentSearch));
}

SlpAgentSearch::SlpAgentSearch() {
    SetDescription("Perform SLP search for neighboring services");
    SetDefaultOutputFormatter("table");
    // The key names the first column, not the structure; kept as the tool has always had it.
    SetDefaultOutputParameter("fields:TimeToLive", "TimeToLive,System");
}

SlpAgentSearch::~SlpAgentSearch() = default;

std::shared_ptr<MetaObj::MetaStruct> SlpAgentSearch::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("SlpSearchResults");
    result->SetField("TimeToLive", 0, MetaObj::MetaStruct::_docEmpty);
    result->SetField("System", "", MetaObj::MetaStruct::_docEmpty);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> SlpAgentSearch::GetInputSpecInternal() {
    return Params()
        .Add("protocol", CallSpec::PARAM_STRING, "P",
             "Optional, override unicast protocol: %ENUM%, default tcp, requires -n.", false,
             StringEnum({{"tcp", ""}, {"udp", ""}}))
        .Add("port", CallSpec::PARAM_INT, "p", "Optional, override the default port value 427.",
             false, IntRange(0, 65535))
        .Add("node", CallSpec::PARAM_STRING, "n",
             "Optional, host FQDN or IP address to connect to. Use -P to control protocol used.",
             false)
        .Add("service", CallSpec::PARAM_STRING, "s",
             "Optional, the service name to search for. Defaults to 'service-agent'.", false);
}

std::shared_ptr<CallSpec::OutputSpec> SlpAgentSearch::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void SlpAgentSearch::ExecuteInternal(InputPtr input, OutputPtr output) {
    GuardSlp(*output, [&] {
        auto result = StructList(GetOutputStructure());
        auto agent = HostCtl::System::SlpAgentFactory();
        agent->ResetSearch();
        // Only what the user gave; everything else stays at the agent's defaults.
        if (input->HasParameter("service")) {
            agent->SetSearchService(input->GetParameter("service"));
        }
        if (input->HasParameter("port")) {
            agent->SetSearchPort(static_cast<uint16_t>(input->GetParameterInt("port")));
        }
        if (input->HasParameter("protocol")) {
            agent->SetSearchTcp(input->GetParameter("protocol") == "tcp");
        }
        std::vector<HostCtl::System::SLPSvc> services;
        if (input->HasParameter("node")) {
            agent->SearchNode(input->GetParameter("node"), services);
        } else {
            agent->Search(services);
        }
        for (const auto& service : services) {
            auto row = GetOutputStructure();
            row->SetField("TimeToLive", static_cast<int>(service.lifetime),
                          MetaObj::MetaStruct::_docEmpty);
            row->SetField("System", service.entry, MetaObj::MetaStruct::_docEmpty);
            result->Add(row);
        }
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

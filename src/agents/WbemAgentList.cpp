#include "agents/WbemAgentList.h"

#include "agents/WbemAgentAccess.h"

namespace OstrelCli::System {

std::shared_ptr<WbemAgentList> WbemAgentList::New() {
    return AdoptSelf(std::shared_ptr<WbemAgentList>(new WbemAgentList));
}

WbemAgentList::WbemAgentList() {
    Describe(*this, "Display WBEM provider configuration.", "table", "fetcher");
    SetDefaultOutputParameter("fields:WbemAgentProviderList", "Name,Enabled,Loaded");
}

WbemAgentList::~WbemAgentList() = default;

std::shared_ptr<MetaObj::MetaStruct> WbemAgentList::GetOutputStructure() {
    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    auto result = MetaObj::MetaStruct::New("WbemAgentProviderList");
    result->SetField("Name", "", doc);
    result->SetField("Enabled", false, doc);
    result->SetField("Loaded", false, doc);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> WbemAgentList::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> WbemAgentList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void WbemAgentList::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        const auto& doc = MetaObj::MetaStruct::_docEmpty;
        auto config = OpenWbemAgentConfig();
        auto result = StructList(GetOutputStructure());
        const auto providers = config->GetProviders();
        result->Reserve(providers.size());
        for (const auto& provider : providers) {
            auto row = MetaObj::MetaStruct::New("WbemAgentProviderList");
            row->SetField("Name", provider.name, doc);
            row->SetField("Enabled", provider.enabled, doc);
            row->SetField("Loaded", provider.loaded, doc);
            result->Add(row);
        }
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

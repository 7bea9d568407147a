#include "agents/WbemAgentGet.h"

#include "agents/WbemAgentAccess.h"

namespace OstrelCli::System {

namespace {

// The command line's word for an authorization model code; empty for a code it has no word for.
std::string AuthModelText(int model) {
    switch (model) {
        case HostCtl::System::WBEM_AUTH_NOT_SUPPORTED:
            return "not supported";
        case HostCtl::System::WBEM_AUTH_PASSWORD:
            return "password";
        case HostCtl::System::WBEM_AUTH_CERTIFICATE:
            return "certificate";
        default:
            return "";
    }
}

}  // namespace

std::shared_ptr<WbemAgentGet> WbemAgentGet::New() {
    return AdoptSelf(std::shared_ptr<WbemAgentGet>(new WbemAgentGet));
}

WbemAgentGet::WbemAgentGet() {
    Describe(*this, "Display WBEM Agent configuration.", "simple", "fetcher");
}

WbemAgentGet::~WbemAgentGet() = default;

std::shared_ptr<MetaObj::MetaStruct> WbemAgentGet::GetOutputStructure() {
    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    auto result = MetaObj::MetaStruct::New("WbemAgentConfig");
    result->SetField("Enabled", false, doc);
    result->SetField("WS-Management Service", false, doc);
    result->SetField("Authorization Model", "", doc);
    result->SetField("Port", 0, doc);
    result->SetField("Log level", "", doc);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> WbemAgentGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> WbemAgentGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void WbemAgentGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        const auto& doc = MetaObj::MetaStruct::_docEmpty;
        auto result = GetOutputStructure();
        auto config = OpenWbemAgentConfig();
        result->SetField("Enabled", config->IsEnabled(), doc);
        result->SetField("WS-Management Service", config->IsWsManEnabled(), doc);
        result->SetField("Authorization Model", AuthModelText(config->GetAuthModel()), doc);
        result->SetField("Port", config->GetPort(), doc);
        result->SetField("Log level", config->GetLogLevel(), doc);
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

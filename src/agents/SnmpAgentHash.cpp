#include "agents/SnmpAgentHash.h"

#include "agents/SnmpLoadSecret.h"
#include "hostctl/SnmpAgent.h"

namespace OstrelCli::System {

std::shared_ptr<SnmpAgentHash> SnmpAgentHash::New() {
    return AdoptSelf(std::shared_ptr<SnmpAgentHash>(new SnmpAgentHash));
}

SnmpAgentHash::SnmpAgentHash() {
    Describe(*this, "Generate localized hash values based on this agents snmp engine id.", "simple",
             "operation");
}

SnmpAgentHash::~SnmpAgentHash() = default;

std::shared_ptr<MetaObj::MetaStruct> SnmpAgentHash::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("SNMPv3Hash");
    result->SetField("auth-hash", "", MetaObj::MetaStruct::_docEmpty);
    result->SetField("priv-hash", "", MetaObj::MetaStruct::_docEmpty);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> SnmpAgentHash::GetInputSpecInternal() {
    return Params()
        .AddSecret("auth-hash", CallSpec::PARAM_STRING, "A",
                   "Secret to use when generating authentication hash. This should be a filename "
                   "unless --raw-secret is specified. The authentication hash is used in the "
                   "--users option of 'brixcli system snmp set'",
                   true)
        .AddSecret("priv-hash", CallSpec::PARAM_STRING, "X",
                   "Secret to use when generating privacy hash. This should be a filename unless "
                   "--raw-secret is specified. The privacy hash is used in the --users option of "
                   "'brixcli system snmp set'.",
                   false)
        .Add("raw-secret", CallSpec::PARAM_FLAG, "r",
             "Make --auth-hash and --priv-hash options read raw secret from command line instead "
             "of file.",
             false);
}

std::shared_ptr<CallSpec::OutputSpec> SnmpAgentHash::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void SnmpAgentHash::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        auto result = GetOutputStructure();
        auto config = HostCtl::System::SnmpAgentConfigFactory();
        std::string authSecret = input->GetParameter("auth-hash");
        std::string privSecret =
            input->HasParameter("priv-hash") ? input->GetParameter("priv-hash") : std::string();
        const bool raw = input->HasParameter("raw-secret");

        if (authSecret.empty() && !privSecret.empty()) {
            return Fail(*output, "Must specify --auth-hash when using --priv-hash");
        }
        if (!raw) {
            authSecret = LoadSecret(authSecret);
            privSecret = LoadSecret(privSecret);
        }
        // A blank first line in the secret file ends the command without a word.
        if (authSecret.empty()) return;
        if (authSecret.size() < 8) {
            return Fail(*output,
                        "Authentication secret must be at least eight(8) characters in length");
        }
        if (!privSecret.empty() && privSecret.size() < 8) {
            return Fail(*output, "Privacy secret must be at least eight(8) characters in length");
        }

        std::string authProtocol;
        std::string privProtocol;
        for (const auto& [key, value] : config->GetOptions()) {
            if (key == "authentication") authProtocol = value;
            if (key == "privacy") privProtocol = value;
        }
        if (authProtocol.empty()) {
            return Fail(*output,
                        "Must specify set authentication protocol via set --authentication");
        }
        if (!privSecret.empty() && privProtocol.empty()) {
            return Fail(*output, "Must first set privacy protocol via set --privacy");
        }

        std::string authHash;
        std::string privHash;
        std::string error;
        if (!config->GenerateLocalizedHashes(authSecret, privSecret, authProtocol, privProtocol,
                                             authHash, privHash, error)) {
            return Fail(*output, error);
        }
        result->SetField("auth-hash", authHash, MetaObj::MetaStruct::_docEmpty);
        result->SetField("priv-hash", privHash, MetaObj::MetaStruct::_docEmpty);
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

#include "agents/SnmpAgentTest.h"

#include "agents/SnmpLoadSecret.h"
#include "hostctl/SnmpAgent.h"

namespace OstrelCli::System {

std::shared_ptr<SnmpAgentTest> SnmpAgentTest::New() {
    return AdoptSelf(std::shared_ptr<SnmpAgentTest>(new SnmpAgentTest));
}

SnmpAgentTest::SnmpAgentTest() {
    Describe(*this, "Verify Brix SNMP notifications can be delivered to target destinations.",
             "simple", "operation");
}

SnmpAgentTest::~SnmpAgentTest() = default;

std::shared_ptr<MetaObj::MetaStruct> SnmpAgentTest::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("AgentTest");
    result->SetField("comments", MetaObj::MetaList::New(MetaObj::META_STRING),
                     MetaObj::MetaStruct::_docEmpty);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> SnmpAgentTest::GetInputSpecInternal() {
    return Params()
        .Add("user", CallSpec::PARAM_STRING, "u", "Validate a given SNMPv3 user name exists", false)
        .Add("auth-hash", CallSpec::PARAM_STRING, "A",
             "Optionally test authentication secret generates matching hash for user", false)
        .Add("priv-hash", CallSpec::PARAM_STRING, "X",
             "Optionally test privacy secret generates matching hash for user", false)
        .Add("raw-secret", CallSpec::PARAM_FLAG, "r",
             "Make -A and -X flags read raw secret from command line instead of file.", false);
}

std::shared_ptr<CallSpec::OutputSpec> SnmpAgentTest::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void SnmpAgentTest::ExecuteInternal(InputPtr input, OutputPtr output) {
    auto result = GetOutputStructure();
    auto comments = MetaObj::MetaList::New(MetaObj::META_STRING);
    auto read = [&](const char* name) {
        return input->HasParameter(name) ? input->GetParameter(name) : std::string();
    };
    const std::string user = read("user");
    std::string authSecret = read("auth-hash");
    std::string privSecret = read("priv-hash");
    const bool raw = input->HasParameter("raw-secret");

    // The report is still answered when a step fails; its lines are kept only on success.
    Guard(*output, [&] {
        auto config = HostCtl::System::SnmpAgentConfigFactory();
        if (user.empty()) {
            if (!authSecret.empty() || !privSecret.empty()) {
                throw HostCtl::Lib::HostCtlException(
                    "auth/priv secret requires a user name to be specified.");
            }
            const size_t targets = config->GetTargets().size() + config->GetV3Targets().size();
            comments->Add("There" + std::string(targets == 1 ? " is " : " are ") +
                          std::to_string(targets) + " target" + (targets > 1 ? "s" : "") +
                          " configured");
            config->SendWarmStart(std::string());
            comments->Add("send warmStart requested");
            comments->Add("test completed normally.");
        } else {
            comments->Add("Testing SNMPv3 user '" + user + "'");
            if (!raw) {
                authSecret = LoadSecret(authSecret);
                privSecret = LoadSecret(privSecret);
            }
            std::string verdict;
            config->TestUser(user, authSecret, privSecret, verdict);
            comments->Add(verdict);
        }
        result->SetField("comments", comments, MetaObj::MetaStruct::_docEmpty);
    });
    Answer(*output, result);
}

}  // namespace OstrelCli::System

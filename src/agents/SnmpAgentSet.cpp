#include "agents/SnmpAgentSet.h"

#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/split.hpp>
#include <boost/algorithm/string/trim.hpp>
#include <cstdint>
#include <map>

#include "hostctl/SnmpAgent.h"
#include "os/HostOs.h"

namespace OstrelCli::System {

namespace {

using HostCtl::Lib::HostCtlException;

std::vector<std::string> SplitList(const std::string& value) {
    std::vector<std::string> entries;
    boost::split(entries, boost::trim_copy(value), boost::is_any_of(","), boost::token_compress_on);
    return entries;
}

// Strips a leading 0x/0X and the colons of a grouped engine id ("0x1:23:4" gives "012304"),
// then checks its length.
std::string NormalizeEngineId(std::string value) {
    boost::trim(value);
    if (value.size() > 2 && value[0] == '0' && (value[1] == 'x' || value[1] == 'X')) {
        value.erase(0, 2);
    }
    if (value.find(':') != std::string::npos) {
        std::vector<std::string> groups;
        boost::split(groups, value, boost::is_any_of(":"));
        std::string joined;
        for (const auto& group : groups) {
            if (group.size() == 1) joined += '0';
            joined += group;
        }
        value = joined;
    }
    if (value.size() < 10) {
        throw HostCtlException("Option engineid minimum length is 10 characters.");
    }
    if (value.size() > 32) {
        throw HostCtlException("Option engineid maximum length is 32 characters.");
    }
    return value;
}

}  // namespace

std::shared_ptr<SnmpAgentSet> SnmpAgentSet::New() {
    return AdoptSelf(std::shared_ptr<SnmpAgentSet>(new SnmpAgentSet));
}

SnmpAgentSet::SnmpAgentSet() {
    Describe(*this, "This command allows the user to set up Brix SNMP agent.", nullptr,
             "operation");
}

SnmpAgentSet::~SnmpAgentSet() = default;

std::shared_ptr<CallSpec::InputSpec> SnmpAgentSet::GetInputSpecInternal() {
    using CallSpec::PARAM_BOOL;
    using CallSpec::PARAM_FLAG;
    using CallSpec::PARAM_INT;
    using CallSpec::PARAM_STRING;
    Params params;
    params
        .Add("enable", PARAM_BOOL, "e",
             "Start or stop SNMP service. Values: [yes|no, true|false, 0|1]", false)
        .Add("port", PARAM_INT, "p", "Set UDP port to poll snmp agent on. The default is udp/161",
             false)
        .Add("communities", PARAM_STRING, "c",
             "Set up to ten communities each no more than 64 characters. Format is: "
             "community1[,community2,...] (this overwrites previous settings)",
             false)
        .Add("targets", PARAM_STRING, "t",
             "Set up to three targets to send SNMPv1 traps to. Format is: "
             "ip-or-hostname[@port]/community[,...] The default port is udp/162. (this "
             "overwrites previous settings)",
             false)
        .Add("hwsrc", PARAM_STRING, "y",
             "Where to source hardware events from IPMI sensors or CIM Indications. One of: "
             "indications|sensors",
             false)
        .Add("syslocation", PARAM_STRING, "L",
             "System location string as presented in sysLocation.0. Up to 255 characters.", false)
        .Add("syscontact", PARAM_STRING, "C",
             "System contact string as presented in sysContact.0. Up to 255 characters", false)
        .Add("loglevel", PARAM_STRING, "l",
             "System Agent syslog logging level: debug|info|warning|error", false)
        .Add("notraps", PARAM_STRING, "n",
             "Comma separated list of trap oids for traps not to be sent by agent. Use value "
             "'reset' to clear setting",
             false)
        .Add("reset", PARAM_FLAG, "r", "Return agent configuration to factory defaults", false);
    auto engineIdPattern = Regex("(0x|0X|)[0-9a-fA-F:]+");
    params
        .Add("engineid", PARAM_STRING, "E",
             "Set SNMPv3 engine id. Must be at least 10 to 32 hexadecimal characters. 0x or 0X "
             "is stripped if found as well as colons (:)",
             false, engineIdPattern)
        .Add("authentication", PARAM_STRING, "a",
             "Set default authentication protocol. Values: none, MD5, SHA1", false)
        .Add("privacy", PARAM_STRING, "x", "Set default privacy protocol. Values: none, AES128",
             false)
        .Add("users", PARAM_STRING, "u",
             "Set up to five local users. Format is: user/-|auth-hash/-|priv-hash/model[,...] "
             "Where user is 32 chars max. '-' indicates no hash. Model is one of "
             "(none|auth|priv).",
             false)
        .Add("remote-users", PARAM_STRING, "R",
             "Set up to five inform user ids. Format is: "
             "user/auth-proto/-|auth-hash/priv-proto/-|priv-hash/engine-id[,...] Where user is "
             "32 chars max. auth-proto is none|MD5|SHA1, priv-proto is none|AES. '-' indicates "
             "no hash. engine-id is hex string '0x0-9a-f' up to 32 chars max.",
             false)
        .Add("v3targets", PARAM_STRING, "i",
             "Set up to three SNMPv3 notification targets. Format is: "
             "ip-or-hostname[@port]/remote-user/security-level/trap|inform[,...].",
             false)
        .Add("largestorage", PARAM_BOOL, "s",
             "Support large storage for hrStorageAllocationUnits * hrStorageSize. Values: "
             "[yes|no, true|false, 0|1]. Control how the agent reports hrStorageAllocationUnits, "
             "hrStorageSize and hrStorageUsed in hrStorageTable. Setting this directive to 1 to "
             "support large storage with small allocation units, the agent re-calculates these "
             "values so they all fit Integer32 and hrStorageAllocationUnits * hrStorageSize "
             "gives real size of the storage ( Note: hrStorageAllocationUnits will not be real "
             "allocation units if real hrStorageSize won't fit into Integer32 ). Setting this "
             "directive to 0 turns off this calculation and the agent reports real "
             "hrStorageAllocationUnits, but it might report wrong hrStorageSize for large "
             "storage because the value won't fit into Integer32.",
             false);
    return params;
}

std::shared_ptr<CallSpec::OutputSpec> SnmpAgentSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void SnmpAgentSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    // A failure is reported beside the answer: set still answers true.
    Guard(*output, [&] {
        auto config = HostCtl::System::SnmpAgentConfigFactory();
        bool changed = false;
        bool engineIdChanged = false;
        std::map<std::string, std::string> options;

        if (input->HasParameter("reset")) {
            config->ResetToDefaults();
            changed = true;
        }
        if (input->HasParameter("enable")) {
            config->SetEnabled(input->GetParameterBool("enable"));
            changed = true;
        }
        if (input->HasParameter("port")) {
            const long port = input->GetParameterInt("port");
            if (static_cast<uint64_t>(port) > 65535) {
                throw HostCtlException(
                    "Port must be in range 0 - 65535 and not be already in use by another "
                    "application.");
            }
            config->SetPort(static_cast<uint16_t>(port));
            changed = true;
        }
        if (input->HasParameter("communities")) {
            config->SetCommunities(SplitList(input->GetParameter("communities")));
            changed = true;
        }
        if (input->HasParameter("targets")) {
            config->SetTargets(SplitList(input->GetParameter("targets")));
            changed = true;
        }
        if (input->HasParameter("hwsrc")) {
            options["EnvEventSource"] = input->GetParameter("hwsrc");
            changed = true;
        }
        if (input->HasParameter("notraps")) {
            options["EventFilter"] = input->GetParameter("notraps");
            changed = true;
        }
        if (input->HasParameter("authentication")) {
            options["authentication"] = input->GetParameter("authentication");
            changed = true;
        }
        if (input->HasParameter("engineid")) {
            options["engineid"] = NormalizeEngineId(input->GetParameter("engineid"));
            changed = true;
            engineIdChanged = true;
        }
        for (const char* name : {"syslocation", "syscontact", "loglevel", "privacy"}) {
            if (input->HasParameter(name)) {
                options[name] = input->GetParameter(name);
                changed = true;
            }
        }
        if (input->HasParameter("users")) {
            config->SetUsers(SplitList(input->GetParameter("users")));
            changed = true;
        }
        if (input->HasParameter("remote-users")) {
            config->SetRemoteUsers(SplitList(input->GetParameter("remote-users")));
            changed = true;
        }
        if (input->HasParameter("v3targets")) {
            config->SetV3Targets(SplitList(input->GetParameter("v3targets")));
            changed = true;
        }
        const bool largeStorage = input->HasParameter("largestorage");
        if (largeStorage) config->SetLargeStorage(input->GetParameterBool("largestorage"));
        if (!largeStorage && !changed) throw HostCtlException("Specify what to set or --help");

        if (!options.empty()) config->SetOptions(options);
        // The agent's boot state belongs to its engine id: a new id starts it over.
        if (engineIdChanged) HostOs::unlink("/var/tmp/snmp_boot.txt");
        config->Commit();
    });
    Succeed(*output);
}

}  // namespace OstrelCli::System

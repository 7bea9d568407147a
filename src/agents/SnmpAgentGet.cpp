#include "agents/SnmpAgentGet.h"

#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/split.hpp>

#include "hostctl/SnmpAgent.h"

namespace OstrelCli::System {

namespace {

const char* const kStringFields[] = {"hwsrc",    "engineid",       "syslocation", "syscontact",
                                     "loglevel", "authentication", "privacy"};

std::shared_ptr<MetaObj::MetaList> StringList(const std::vector<std::string>& values) {
    auto list = MetaObj::MetaList::New(MetaObj::META_STRING);
    list->Reserve(values.size());
    for (const auto& value : values) list->Add(value);
    return list;
}

}  // namespace

std::shared_ptr<SnmpAgentGet> SnmpAgentGet::New() {
    return AdoptSelf(std::shared_ptr<SnmpAgentGet>(new SnmpAgentGet));
}

SnmpAgentGet::SnmpAgentGet() {
    Describe(*this, "Get SNMP Agent configuration", "simple", "fetcher");
}

SnmpAgentGet::~SnmpAgentGet() = default;

std::shared_ptr<MetaObj::MetaStruct> SnmpAgentGet::GetOutputStructure() {
    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    auto result = MetaObj::MetaStruct::New("AgentConfig");
    result->SetField("enable", MetaObj::MetaBool::New(), doc);
    result->SetField("port", MetaObj::MetaInt::New(), doc);
    for (const char* name : {"communities", "targets", "notraps"}) {
        result->SetField(name, MetaObj::MetaList::New(MetaObj::META_STRING), doc);
    }
    for (const char* name : kStringFields) result->SetField(name, MetaObj::MetaString::New(), doc);
    for (const char* name : {"users", "remote-users", "v3targets"}) {
        result->SetField(name, MetaObj::MetaList::New(MetaObj::META_STRING), doc);
    }
    result->SetField("largestorage", MetaObj::MetaBool::New(), doc);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> SnmpAgentGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> SnmpAgentGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void SnmpAgentGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        const auto& doc = MetaObj::MetaStruct::_docEmpty;
        auto result = GetOutputStructure();
        auto config = HostCtl::System::SnmpAgentConfigFactory();
        if (!config->Load()) {
            throw HostCtl::Lib::HostCtlException(
                "Configuration file, /etc/ostrel/snmp.xml, is not valid xml. Repair or replace "
                "it.");
        }
        result->SetField("enable", config->IsEnabled(), doc);
        result->SetField("port", MetaObj::MetaInt::New(config->GetPort()), doc);
        result->SetField("communities", StringList(config->GetCommunities()), doc);
        result->SetField("targets", StringList(config->GetTargets()), doc);

        for (const auto& [key, value] : config->GetOptions()) {
            if (key == "EventFilter") {
                std::vector<std::string> oids;
                boost::split(oids, value, boost::is_any_of(";"), boost::token_compress_on);
                result->SetField("notraps", StringList(oids), doc);
            } else if (key == "EnvEventSource") {
                result->SetField("hwsrc", value, doc);
            } else if (key == "engineid" || key == "syscontact" || key == "syslocation" ||
                       key == "loglevel" || key == "authentication" || key == "privacy") {
                result->SetField(key, value, doc);
            } else {
                output->AddErrorMessage("Unknown option " + MessageExcerpt(key) + " value '" +
                                        MessageExcerpt(value) + "'");
            }
        }

        result->SetField("users", StringList(config->GetUsers()), doc);
        result->SetField("remote-users", StringList(config->GetRemoteUsers()), doc);
        result->SetField("v3targets", StringList(config->GetV3Targets()), doc);
        result->SetField("largestorage", config->GetLargeStorage(), doc);
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

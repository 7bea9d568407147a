// The SNMP agent's configuration file ("/etc/ostrel/snmp.xml") as the agent reads it, and the
// checks its settings then go through.
#include <string>

#include "FuzzSupport.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/agents/snmp/SnmpSettings.h"

namespace {

// Runs a check that may refuse its input (HostCtlException); anything else escapes and crashes.
// The settings as lines of text, for a report.
std::string Describe(const BrixSim::Snmp::Settings& settings) {
    std::string text = "enabled=" + std::to_string(settings.enabled) +
                       " port=" + std::to_string(settings.port) +
                       " largestorage=" + std::to_string(settings.largeStorage) + "\n";
    auto list = [&](const char* name, const std::vector<std::string>& values) {
        for (const auto& value : values) text += std::string(name) + " [" + value + "]\n";
    };
    list("community", settings.communities);
    list("target", settings.targets);
    list("user", settings.users);
    list("remote user", settings.remoteUsers);
    list("v3 target", settings.v3Targets);
    for (const auto& [key, value] : settings.options)
        text += "option [" + key + "]=[" + value + "]\n";
    return text;
}

template <class Check>
void Refusable(Check check) {
    try {
        check();
    } catch (const HostCtl::Lib::HostCtlException&) {
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    using namespace BrixSim::Snmp;
    const auto settings = ParseSettings(BrixFuzz::Text(data, size));
    if (!settings) return 0;
    BRIX_FUZZ_CHECK(settings->port > 0 && settings->port <= 65535, std::to_string(settings->port));
    // A commit writes the file from what was read: whatever the file said must survive that.
    const std::string written = FormatSettings(*settings);
    const auto reread = ParseSettings(written);
    BRIX_FUZZ_CHECK(reread.has_value(), written);
    BRIX_FUZZ_CHECK(*reread == *settings,
                    "read:\n" + Describe(*settings) + "read again:\n" + Describe(*reread));

    Refusable([&] { CheckCommunities(settings->communities); });
    Refusable([&] { CheckTargets(settings->targets); });
    Refusable([&] { CheckUsers(settings->users); });
    Refusable([&] { CheckRemoteUsers(settings->remoteUsers); });
    Refusable([&] { CheckV3Targets(settings->v3Targets); });
    for (const auto& [key, value] : settings->options) {
        Refusable([&, &key = key, &value = value] { CheckOption(key, value); });
    }
    Refusable([&] { CheckConsistency(*settings); });
    return 0;
}

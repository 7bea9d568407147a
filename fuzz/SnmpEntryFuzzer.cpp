// One SNMP list entry or option as the agent's setters receive them: every entry parser gets the
// same text, and "key=value" also goes to the option check.
#include <string>

#include "FuzzSupport.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/agents/snmp/SnmpSettings.h"

namespace {

bool IsHex(const std::string& text) {
    for (unsigned char c : text) {
        if (!std::isxdigit(c)) return false;
    }
    return true;
}

bool ValidHash(const std::string& hash) {
    return hash.empty() || ((hash.size() == 32 || hash.size() == 40) && IsHex(hash));
}

template <class Parse>
void Refusable(Parse parse) {
    try {
        parse();
    } catch (const HostCtl::Lib::HostCtlException&) {
    }
}

// A parsed entry passes the setter's check as a list of one.
template <class Check>
void Accepted(const std::string& entry, Check check) {
    try {
        check(std::vector<std::string>{entry});
    } catch (const HostCtl::Lib::HostCtlException& refused) {
        BrixFuzz::Fail("the setter refuses a parsed entry", entry + ": " + refused.what());
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    using namespace BrixSim::Snmp;
    const std::string entry(BrixFuzz::Text(data, size));
    Refusable([&] {
        const LocalUser user = ParseLocalUser(entry);
        BRIX_FUZZ_CHECK(!user.name.empty() && user.name.size() <= 32, entry);
        BRIX_FUZZ_CHECK(ValidHash(user.authHash) && ValidHash(user.privHash), entry);
        BRIX_FUZZ_CHECK(user.model == "none" || !user.authHash.empty(), entry);
        BRIX_FUZZ_CHECK(user.model != "priv" || !user.privHash.empty(), entry);
        Accepted(entry, CheckUsers);
    });
    Refusable([&] {
        const RemoteUser user = ParseRemoteUser(entry);
        BRIX_FUZZ_CHECK(!user.name.empty() && user.name.size() <= 32, entry);
        BRIX_FUZZ_CHECK(ValidHash(user.authHash) && ValidHash(user.privHash), entry);
        BRIX_FUZZ_CHECK(user.engineId.size() >= 10 && user.engineId.size() <= 32 &&
                            user.engineId.size() % 2 == 0 && IsHex(user.engineId),
                        entry);
        BRIX_FUZZ_CHECK(user.authProtocol != "none" || user.privProtocol == "none", entry);
        Accepted(entry, CheckRemoteUsers);
    });
    Refusable([&] {
        const V1Target target = ParseV1Target(entry);
        BRIX_FUZZ_CHECK(!target.to.host.empty() && target.to.port != 0, entry);
        BRIX_FUZZ_CHECK(!target.community.empty(), entry);
    });
    Refusable([&] {
        const V3Target target = ParseV3Target(entry);
        BRIX_FUZZ_CHECK(!target.to.host.empty() && target.to.port != 0 && !target.user.empty(),
                        entry);
    });
    if (const auto equals = entry.find('='); equals != std::string::npos) {
        Refusable([&] { CheckOption(entry.substr(0, equals), entry.substr(equals + 1)); });
    }
    return 0;
}

// A module's load-time parameter string ("key=value key2=\"a b\" flag").
#include <string>

#include "FuzzSupport.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/modules/ModuleStore.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    using namespace BrixSim::Modules;
    const std::string text(BrixFuzz::Text(data, size));
    std::vector<ParameterPair> pairs;
    try {
        pairs = ParseParameters(text);
    } catch (const HostCtl::Lib::HostCtlException& refused) {
        BRIX_FUZZ_CHECK(std::string(refused.what()).rfind("Invalid parameter string '", 0) == 0,
                        refused.what());
        return 0;
    }
    for (const auto& pair : pairs) {
        BRIX_FUZZ_CHECK(!pair.key.empty(), text);
        BRIX_FUZZ_CHECK(pair.hasValue || pair.raw.empty(), text);
        const std::string value = Unquote(pair.raw);
        BRIX_FUZZ_CHECK(value.size() <= pair.raw.size(), text);
    }
    // The stored form (what set and copy write) reads back as the same pairs.
    const std::string joined = JoinParameters(pairs);
    std::vector<ParameterPair> again;
    try {
        again = ParseParameters(joined);
    } catch (const HostCtl::Lib::HostCtlException& refused) {
        BrixFuzz::Fail("the joined parameters do not parse", joined + ": " + refused.what());
    }
    BRIX_FUZZ_CHECK(again.size() == pairs.size(), joined);
    for (size_t i = 0; i < pairs.size(); ++i) {
        BRIX_FUZZ_CHECK(again[i].key == pairs[i].key && again[i].raw == pairs[i].raw &&
                            again[i].hasValue == pairs[i].hasValue,
                        joined);
    }
    return 0;
}

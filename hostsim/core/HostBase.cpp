// Host base library: the feature switches, loaded from the host's features table.
#include "hostbase/HostBase.h"

#include <exception>

#include "hostsim/core/Store.h"

namespace {

const BrixSim::Operation kPreferenceInit{"Preference_Init"};

unsigned char featureStates[kFeatureCount];

// Points every FeatureList entry at its state byte; done at load so the table is usable
// (all off) even before FeatureState_Init.
const bool wired = [] {
    for (int entry = 0; entry < kFeatureCount; ++entry) FeatureList[entry] = &featureStates[entry];
    return true;
}();

}  // namespace

extern "C" {

unsigned char* FeatureList[kFeatureCount];

// Read without opening the store, so that help and the command list make no host.
int FeatureState_Init(void) {
    for (int entry = 0; entry < kFeatureCount; ++entry) FeatureList[entry] = &featureStates[entry];
    try {
        return BrixSim::Store::PeekFeatures(featureStates, kFeatureCount) ? 0 : -1;
    } catch (const std::exception&) {
        return -1;
    }
}

int Preference_Init(void) {
    try {
        auto& store = BrixSim::Store::Get();
        store.Check(kPreferenceInit);
        store.Write([&] { store.JournalCall(kPreferenceInit, {}); });
    } catch (const std::exception&) {
        return -1;
    }
    return 0;
}

}  // extern "C"

// Host base library: the feature switches, loaded from the host's features table.
#include "hostbase/HostBase.h"

#include <cstring>
#include <exception>

#include "core/Store.h"

namespace {

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

int FeatureState_Init(void) {
    for (int entry = 0; entry < kFeatureCount; ++entry) FeatureList[entry] = &featureStates[entry];
    std::memset(featureStates, 0, sizeof featureStates);
    try {
        auto rows = BrixSim::Store::Get().Prepare("SELECT entry, state FROM features");
        while (rows.Step()) {
            const int64_t entry = rows.Int(0);
            if (entry >= 0 && entry < kFeatureCount) featureStates[entry] = rows.Int(1) != 0;
        }
    } catch (const std::exception&) {
        return -1;
    }
    return 0;
}

int Preference_Init(void) {
    try {
        auto& store = BrixSim::Store::Get();
        store.Write([&] { store.JournalCall("Preference_Init", {}); });
    } catch (const std::exception&) {
        return -1;
    }
    return 0;
}

}  // extern "C"

// Host base library: feature switches and preferences.
#pragma once

extern "C" {
// Loads the host's feature switches into FeatureList. Zero on success.
int FeatureState_Init(void);
// One pointer per feature entry, each to a one-byte on (non-zero) / off (zero) state.
extern unsigned char* FeatureList[];
// Loads the host's preferences. Zero on success.
int Preference_Init(void);
}

// Number of entries in FeatureList.
constexpr int kFeatureCount = 256;

// Sending the agent's warmStart notification: SNMPv1 traps with the target's community, SNMPv3
// traps from the agent's own engine and SNMPv3 informs to the receiver's engine, over UDP.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "hostsim/agents/snmp/SnmpSettings.h"

namespace BrixSim::Snmp {

// The sending agent as the notifications describe it.
struct AgentState {
    std::string engineId;  // bytes
    uint32_t engineBoots = 1;
    uint32_t engineTime = 0;  // seconds since the agent's boot
    uint32_t upTime = 0;      // sysUpTime, hundredths of a second
};

// The enterprise of the agent's SNMPv1 traps (its sysObjectID).
inline constexpr const char* kAgentObjectId = "1.3.6.1.4.1.47077.1.1";

struct Delivery {
    std::string what;   // e.g. "v1 trap to 192.0.2.1@162"
    std::string error;  // empty when it was delivered
};

// One notification per configured target, v1 targets first, each in its own try.
std::vector<Delivery> SendWarmStarts(const Settings& settings, const AgentState& agent);

}  // namespace BrixSim::Snmp

// SNMP notification messages: the SNMPv1 Trap-PDU message and SNMPv3 messages with user-based
// security (authentication and privacy), built and parsed on top of the BER codec.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "hostsim/agents/snmp/UsmKeys.h"

namespace BrixSim::Snmp {

inline constexpr const char* kSysUpTimeOid = "1.3.6.1.2.1.1.3.0";
inline constexpr const char* kSnmpTrapOid = "1.3.6.1.6.3.1.1.4.1.0";
inline constexpr const char* kWarmStartOid = "1.3.6.1.6.3.1.1.5.2";
inline constexpr int kGenericWarmStart = 1;

// An SNMPv1 message holding a Trap-PDU without variable bindings.
std::string BuildV1Trap(std::string_view community, std::string_view enterpriseOid,
                        std::string_view agentAddress, int genericTrap, int specificTrap,
                        uint32_t timeTicks);

// A variable binding: object identifier and the encoded value.
using VarBind = std::pair<std::string, std::string>;
// An SNMPv2 PDU (trap, inform, get, ...): request-id, zero error status and index, bindings.
std::string BuildPdu(uint8_t tag, int32_t requestId, const std::vector<VarBind>& bindings);

// The user-based security of one message.
struct UsmParameters {
    std::string engineId;  // the authoritative engine's id
    uint32_t engineBoots = 0;
    uint32_t engineTime = 0;
    std::string userName;
    AuthProtocol auth = AuthProtocol::None;
    std::string authKey;  // localized authentication key
    bool privacy = false;
    std::string privKey;  // localized privacy key; its first 16 bytes are the AES key
};

// An SNMPv3 message carrying `pdu` in a scoped PDU for `contextEngineId`, authenticated and
// encrypted as `usm` says.
std::string BuildV3Message(int32_t messageId, bool reportable, const UsmParameters& usm,
                           std::string_view contextEngineId, std::string_view pdu);

// A decoded SNMPv3 message.
struct V3Message {
    int64_t messageId = 0;
    uint8_t flags = 0;
    std::string engineId;
    uint32_t engineBoots = 0;
    uint32_t engineTime = 0;
    std::string userName;
    std::string authParameters;
    size_t authOffset = 0;  // where the authentication parameters lie in `whole`
    std::string privParameters;
    std::string scopedPdu;  // the plaintext scoped PDU, or the encrypted bytes when flags has 2
    std::string whole;      // the message as received
};
inline constexpr uint8_t kFlagAuth = 0x01;
inline constexpr uint8_t kFlagPriv = 0x02;
inline constexpr uint8_t kFlagReportable = 0x04;

// Throws Ber::DecodeError for anything but a well-formed SNMPv3 USM message.
V3Message ParseV3Message(std::string_view bytes);
// True when the message's authentication parameters are the HMAC of the message under `key`.
bool VerifyV3Message(const V3Message& message, AuthProtocol auth, std::string_view key);
// The plaintext scoped PDU of an encrypted message.
std::string DecryptScopedPdu(const V3Message& message, std::string_view privKey);

// A decoded PDU.
struct Pdu {
    uint8_t tag = 0;
    int64_t requestId = 0;
    int64_t errorStatus = 0;
    std::vector<std::pair<std::string, std::string>> bindings;  // object identifier, encoding
};
// The context engine id and PDU of a plaintext scoped PDU.
std::pair<std::string, Pdu> ParseScopedPdu(std::string_view scoped);

}  // namespace BrixSim::Snmp

#include "hostsim/agents/snmp/SnmpMessages.h"

#include "hostsim/agents/snmp/Ber.h"

namespace BrixSim::Snmp {

namespace {

constexpr int kMaxMessageSize = 65507;
constexpr int kUsmSecurityModel = 3;
constexpr size_t kAuthParameterSize = 12;

std::string Be32(uint32_t value) {
    std::string bytes;
    for (int shift = 24; shift >= 0; shift -= 8)
        bytes += static_cast<char>((value >> shift) & 0xff);
    return bytes;
}

// The AES IV: engine boots, engine time, then the 64-bit salt (RFC 3826).
std::string AesIv(uint32_t boots, uint32_t time, std::string_view salt) {
    return Be32(boots) + Be32(time) + std::string(salt);
}

}  // namespace

std::string BuildV1Trap(std::string_view community, std::string_view enterpriseOid,
                        std::string_view agentAddress, int genericTrap, int specificTrap,
                        uint32_t timeTicks) {
    const std::string pdu =
        Ber::Sequence({Ber::Oid(enterpriseOid), Ber::Tlv(Ber::kIpAddress, agentAddress),
                       Ber::Integer(genericTrap), Ber::Integer(specificTrap),
                       Ber::Unsigned(Ber::kTimeTicks, timeTicks), Ber::Sequence({})},
                      Ber::kTrapV1);
    return Ber::Sequence({Ber::Integer(0), Ber::OctetString(community), pdu});
}

std::string BuildPdu(uint8_t tag, int32_t requestId, const std::vector<VarBind>& bindings) {
    std::string list;
    for (const auto& [oid, value] : bindings) list += Ber::Sequence({Ber::Oid(oid), value});
    return Ber::Sequence(
        {Ber::Integer(requestId), Ber::Integer(0), Ber::Integer(0), Ber::Tlv(Ber::kSequence, list)},
        tag);
}

std::string BuildV3Message(int32_t messageId, bool reportable, const UsmParameters& usm,
                           std::string_view contextEngineId, std::string_view pdu) {
    const bool auth = usm.auth != AuthProtocol::None;
    const bool priv = auth && usm.privacy;
    const uint8_t flags =
        (auth ? kFlagAuth : 0) | (priv ? kFlagPriv : 0) | (reportable ? kFlagReportable : 0);

    const std::string scoped =
        Ber::Sequence({Ber::OctetString(contextEngineId), Ber::OctetString(""), pdu});
    std::string data = scoped;
    std::string salt;
    if (priv) {
        salt = RandomBytes(8);
        data = Ber::OctetString(AesCfb128(true, std::string_view(usm.privKey).substr(0, 16),
                                          AesIv(usm.engineBoots, usm.engineTime, salt), scoped));
    }

    // The security parameters, with the authentication parameters zeroed for the HMAC.
    const std::string head = Ber::OctetString(usm.engineId) + Ber::Integer(usm.engineBoots) +
                             Ber::Integer(usm.engineTime) + Ber::OctetString(usm.userName);
    const std::string authField =
        Ber::OctetString(std::string(auth ? kAuthParameterSize : 0, '\0'));
    const std::string fields = head + authField + Ber::OctetString(salt);
    const std::string security = Ber::Tlv(Ber::kSequence, fields);
    const std::string securityField = Ber::OctetString(security);

    const std::string version = Ber::Integer(3);
    const std::string header =
        Ber::Sequence({Ber::Integer(messageId), Ber::Integer(kMaxMessageSize),
                       Ber::OctetString(std::string(1, static_cast<char>(flags))),
                       Ber::Integer(kUsmSecurityModel)});
    const std::string body = version + header + securityField + data;
    std::string message = Ber::Tlv(Ber::kSequence, body);
    if (auth) {
        // Where the authentication parameters' content lies: past every enclosing header.
        const size_t offset = (message.size() - body.size()) + version.size() + header.size() +
                              (securityField.size() - security.size()) +
                              (security.size() - fields.size()) + head.size() +
                              (authField.size() - kAuthParameterSize);
        message.replace(offset, kAuthParameterSize, Hmac96(usm.auth, usm.authKey, message));
    }
    return message;
}

V3Message ParseV3Message(std::string_view bytes) {
    V3Message message;
    message.whole = std::string(bytes);
    Ber::Reader outer(message.whole);
    const Ber::Element sequence = outer.Expect(Ber::kSequence);
    Ber::Reader body(sequence.content);
    if (body.ReadInteger() != 3) throw Ber::DecodeError("not an SNMPv3 message");
    Ber::Reader header(body.Expect(Ber::kSequence).content);
    message.messageId = header.ReadInteger();
    header.ReadInteger();  // maximum size
    const std::string flags = header.ReadOctetString();
    if (flags.size() != 1) throw Ber::DecodeError("bad message flags");
    message.flags = static_cast<uint8_t>(flags[0]);
    if (header.ReadInteger() != kUsmSecurityModel) throw Ber::DecodeError("not a USM message");

    const std::string_view security = body.Expect(Ber::kOctetString).content;
    Ber::Reader usm(Ber::Reader(security).Expect(Ber::kSequence).content);
    message.engineId = usm.ReadOctetString();
    message.engineBoots = static_cast<uint32_t>(usm.ReadInteger());
    message.engineTime = static_cast<uint32_t>(usm.ReadInteger());
    message.userName = usm.ReadOctetString();
    const std::string_view authParameters = usm.Expect(Ber::kOctetString).content;
    message.authParameters = std::string(authParameters);
    message.authOffset = static_cast<size_t>(authParameters.data() - message.whole.data());
    message.privParameters = usm.ReadOctetString();

    const Ber::Element data = body.Next();
    if (message.flags & kFlagPriv) {
        if (data.tag != Ber::kOctetString) throw Ber::DecodeError("encrypted PDU expected");
        message.scopedPdu = std::string(data.content);
    } else {
        if (data.tag != Ber::kSequence) throw Ber::DecodeError("scoped PDU expected");
        message.scopedPdu = std::string(data.encoding);
    }
    return message;
}

bool VerifyV3Message(const V3Message& message, AuthProtocol auth, std::string_view key) {
    if (message.authParameters.size() != kAuthParameterSize) return false;
    // The received message with its authentication parameters zeroed.
    std::string zeroed = message.whole;
    zeroed.replace(message.authOffset, kAuthParameterSize, std::string(kAuthParameterSize, '\0'));
    return Hmac96(auth, key, zeroed) == message.authParameters;
}

std::string DecryptScopedPdu(const V3Message& message, std::string_view privKey) {
    if (message.privParameters.size() != 8) throw Ber::DecodeError("bad privacy parameters");
    return AesCfb128(false, privKey.substr(0, 16),
                     AesIv(message.engineBoots, message.engineTime, message.privParameters),
                     message.scopedPdu);
}

std::pair<std::string, Pdu> ParseScopedPdu(std::string_view scoped) {
    Ber::Reader outer(scoped);
    Ber::Reader reader(outer.Expect(Ber::kSequence).content);
    std::string contextEngineId = reader.ReadOctetString();
    reader.ReadOctetString();  // context name
    const Ber::Element element = reader.Next();
    Pdu pdu;
    pdu.tag = element.tag;
    Ber::Reader fields(element.content);
    pdu.requestId = fields.ReadInteger();
    pdu.errorStatus = fields.ReadInteger();
    fields.ReadInteger();  // error index
    Ber::Reader list(fields.Expect(Ber::kSequence).content);
    while (!list.AtEnd()) {
        Ber::Reader binding(list.Expect(Ber::kSequence).content);
        std::string oid = Ber::DecodeOid(binding.Expect(Ber::kOid).content);
        pdu.bindings.emplace_back(std::move(oid), std::string(binding.Next().encoding));
    }
    return {std::move(contextEngineId), std::move(pdu)};
}

}  // namespace BrixSim::Snmp

// The SNMP agent's protocol pieces on their own: key localization against the RFC 3414 test
// vectors, the BER codec, and SNMPv3 messages built and read back.
#include <gtest/gtest.h>

#include "hostsim/agents/snmp/Ber.h"
#include "hostsim/agents/snmp/SnmpMessages.h"
#include "hostsim/agents/snmp/UsmKeys.h"

namespace {

using namespace BrixSim::Snmp;

std::string Bytes(const char* hex) {
    return FromHex(hex).value();
}

TEST(SnmpKeys, Rfc3414PasswordToKeyAndLocalization) {
    const std::string engineId = Bytes("000000000000000000000002");
    struct Case {
        AuthProtocol protocol;
        const char* ku;
        const char* kul;
    };
    const Case cases[] = {
        {AuthProtocol::Md5, "9faf3283884e92834ebc9847d8edd963", "526f5eed9fcce26f8964c2930787d82b"},
        {AuthProtocol::Sha1, "9fb5cc0381497b3793528939ff788d5d79145211",
         "6695febc9288e36282235fc7151f128497b38f3f"},
    };
    for (const auto& c : cases) {
        const std::string ku = PasswordToKey(c.protocol, "maplesyrup");
        EXPECT_EQ(ToHex(ku), c.ku);
        EXPECT_EQ(ToHex(LocalizeKey(c.protocol, ku, engineId)), c.kul);
        EXPECT_EQ(ToHex(LocalizedKey(c.protocol, "maplesyrup", engineId)), c.kul);
    }
}

TEST(SnmpKeys, HexAndProtocolNames) {
    EXPECT_EQ(FromHex("00aAfF"), std::string("\x00\xaa\xff", 3));
    EXPECT_FALSE(FromHex("abc"));
    EXPECT_FALSE(FromHex("zz"));
    EXPECT_EQ(ParseAuthProtocol("MD5"), AuthProtocol::Md5);
    EXPECT_EQ(ParseAuthProtocol("SHA1"), AuthProtocol::Sha1);
    EXPECT_FALSE(ParseAuthProtocol("md5"));
    EXPECT_FALSE(ParseAuthProtocol("none"));
}

TEST(SnmpBer, Encodings) {
    struct Case {
        std::string encoded;
        const char* hex;
    };
    const Case cases[] = {
        {Ber::Integer(0), "020100"},
        {Ber::Integer(127), "02017f"},
        {Ber::Integer(128), "02020080"},
        {Ber::Integer(256), "02020100"},
        {Ber::Integer(-1), "0201ff"},
        {Ber::Integer(-128), "020180"},
        {Ber::Integer(-129), "0202ff7f"},
        {Ber::Integer(2147483647), "02047fffffff"},
        {Ber::Unsigned(Ber::kTimeTicks, 0), "430100"},
        {Ber::Unsigned(Ber::kTimeTicks, 200), "430200c8"},
        {Ber::Unsigned(Ber::kTimeTicks, 0xffffffffu), "430500ffffffff"},
        {Ber::OctetString("ab"), "04026162"},
        {Ber::Null(), "0500"},
        {Ber::Oid("1.3.6.1.6.3.1.1.5.2"), "06092b0601060301010502"},
        {Ber::Oid("1.3.6.1.4.1.47077.1.1"), "060a2b0601040182ef650101"},
        {Ber::Oid("2.999"), "06028837"},
        {Ber::Sequence({Ber::Integer(1), Ber::Null()}), "30050201010500"},
        {Ber::OctetString(std::string(200, 'x')).substr(0, 3), "0481c8"},
        {Ber::OctetString(std::string(300, 'x')).substr(0, 4), "0482012c"},
    };
    for (const auto& c : cases) EXPECT_EQ(ToHex(c.encoded), c.hex);
    EXPECT_EQ(Ber::DecodeOid(Ber::Reader(Ber::Oid("2.999.3")).Next().content), "2.999.3");
}

TEST(SnmpBer, DecodeRoundTripsAndRefusals) {
    for (const int64_t value :
         {0LL, 1LL, -1LL, 127LL, 128LL, -129LL, 65535LL, -2147483648LL, 9007199254740993LL}) {
        const std::string encoded = Ber::Integer(value);
        Ber::Reader reader(encoded);
        EXPECT_EQ(reader.ReadInteger(), value);
        EXPECT_TRUE(reader.AtEnd());
    }
    for (const char* oid :
         {"1.3.6.1.2.1.1.3.0", "1.3.6.1.4.1.47077.1.1", "0.0", "1.39.4294967295"}) {
        EXPECT_EQ(Ber::DecodeOid(Ber::Reader(Ber::Oid(oid)).Expect(Ber::kOid).content), oid);
    }
    for (const char* bad : {"", "1", "3.1", "1.40", "1..2", "1.3.x", "1.3.4294967296"}) {
        EXPECT_THROW(Ber::Oid(bad), std::invalid_argument) << bad;
    }
    const std::string big = Ber::OctetString(std::string(70000, 'q'));
    EXPECT_EQ(Ber::Reader(big).ReadOctetString().size(), 70000u);

    struct Bad {
        const char* hex;
        const char* why;
    };
    const Bad malformed[] = {
        {"04", "truncated"},
        {"0405616263", "content shorter than its length"},
        {"0480", "indefinite length"},
        {"1f0100", "multi-byte tag"},
        {"0485ffffffffff", "length of five bytes"},
    };
    for (const auto& m : malformed) {
        EXPECT_THROW(Ber::Reader(Bytes(m.hex)).Next(), Ber::DecodeError) << m.why;
    }
    EXPECT_THROW(Ber::Reader(Ber::Null()).Expect(Ber::kInteger), Ber::DecodeError);
    EXPECT_THROW(Ber::DecodeOid(Bytes("2b86")), Ber::DecodeError);
}

UsmParameters Alice(bool privacy) {
    UsmParameters usm;
    usm.engineId = Bytes("8000b7e5040102030405");
    usm.engineBoots = 7;
    usm.engineTime = 1234;
    usm.userName = "alice";
    usm.auth = AuthProtocol::Sha1;
    usm.authKey = LocalizedKey(AuthProtocol::Sha1, "authpass123", usm.engineId);
    usm.privacy = privacy;
    usm.privKey = LocalizedKey(AuthProtocol::Sha1, "privpass123", usm.engineId);
    return usm;
}

TEST(SnmpMessagesTest, V3TrapRoundTripWithAuthenticationAndPrivacy) {
    for (const bool privacy : {false, true}) {
        const UsmParameters usm = Alice(privacy);
        const std::string pdu = BuildPdu(Ber::kTrapV2, 99,
                                         {{kSysUpTimeOid, Ber::Unsigned(Ber::kTimeTicks, 4200)},
                                          {kSnmpTrapOid, Ber::Oid(kWarmStartOid)}});
        const std::string wire = BuildV3Message(4711, false, usm, usm.engineId, pdu);
        const V3Message message = ParseV3Message(wire);
        EXPECT_EQ(message.messageId, 4711);
        EXPECT_EQ(message.flags, privacy ? (kFlagAuth | kFlagPriv) : kFlagAuth);
        EXPECT_EQ(message.engineId, usm.engineId);
        EXPECT_EQ(message.engineBoots, 7u);
        EXPECT_EQ(message.engineTime, 1234u);
        EXPECT_EQ(message.userName, "alice");
        EXPECT_EQ(message.privParameters.size(), privacy ? 8u : 0u);
        EXPECT_TRUE(VerifyV3Message(message, AuthProtocol::Sha1, usm.authKey));
        EXPECT_FALSE(VerifyV3Message(message, AuthProtocol::Sha1,
                                     LocalizedKey(AuthProtocol::Sha1, "otherpass1", usm.engineId)));

        const std::string scoped =
            privacy ? DecryptScopedPdu(message, usm.privKey) : message.scopedPdu;
        if (privacy) {
            EXPECT_EQ(wire.find(pdu), std::string::npos) << "the PDU travels encrypted";
        }
        const auto [contextEngineId, decoded] = ParseScopedPdu(scoped);
        EXPECT_EQ(contextEngineId, usm.engineId);
        EXPECT_EQ(decoded.tag, Ber::kTrapV2);
        EXPECT_EQ(decoded.requestId, 99);
        ASSERT_EQ(decoded.bindings.size(), 2u);
        EXPECT_EQ(decoded.bindings[0].first, kSysUpTimeOid);
        EXPECT_EQ(decoded.bindings[1].first, kSnmpTrapOid);
        EXPECT_EQ(decoded.bindings[1].second, Ber::Oid(kWarmStartOid));

        // One changed byte anywhere breaks the authentication.
        std::string tampered = wire;
        tampered[tampered.size() - 1] ^= 0x01;
        EXPECT_FALSE(VerifyV3Message(ParseV3Message(tampered), AuthProtocol::Sha1, usm.authKey));
    }
}

TEST(SnmpMessagesTest, V3DiscoveryProbeIsPlainAndReportable) {
    const V3Message probe = ParseV3Message(
        BuildV3Message(5, true, UsmParameters{}, "", BuildPdu(Ber::kGetRequest, 6, {})));
    EXPECT_EQ(probe.flags, kFlagReportable);
    EXPECT_TRUE(probe.engineId.empty());
    EXPECT_TRUE(probe.userName.empty());
    EXPECT_TRUE(probe.authParameters.empty());
    EXPECT_EQ(ParseScopedPdu(probe.scopedPdu).second.tag, Ber::kGetRequest);
}

TEST(SnmpMessagesTest, V1TrapLayout) {
    const std::string wire =
        BuildV1Trap("public", "1.3.6.1.4.1.47077.1.1", std::string("\x7f\x00\x00\x01", 4),
                    kGenericWarmStart, 0, 1200);
    Ber::Reader outer(wire);
    Ber::Reader message(outer.Expect(Ber::kSequence).content);
    EXPECT_EQ(message.ReadInteger(), 0);  // version-1
    EXPECT_EQ(message.ReadOctetString(), "public");
    Ber::Reader trap(message.Expect(Ber::kTrapV1).content);
    EXPECT_EQ(Ber::DecodeOid(trap.Expect(Ber::kOid).content), "1.3.6.1.4.1.47077.1.1");
    EXPECT_EQ(trap.Expect(Ber::kIpAddress).content, std::string("\x7f\x00\x00\x01", 4));
    EXPECT_EQ(trap.ReadInteger(), 1);  // warmStart
    EXPECT_EQ(trap.ReadInteger(), 0);
    EXPECT_EQ(Ber::DecodeUnsigned(trap.Expect(Ber::kTimeTicks).content), 1200u);
    EXPECT_TRUE(trap.Expect(Ber::kSequence).content.empty());
    EXPECT_TRUE(trap.AtEnd());
    EXPECT_TRUE(outer.AtEnd());
}

}  // namespace

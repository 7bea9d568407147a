// SLPv2 encoding of service requests and defensive parsing of replies.
#include <gtest/gtest.h>

#include <random>

#include "SlpResponder.h"
#include "hostsim/agents/slp/SlpWire.h"

namespace {

using namespace BrixSim::Slp;
using Bytes = std::vector<uint8_t>;

std::optional<Reply> Parse(const Bytes& bytes) {
    return ParseReply(bytes.data(), bytes.size());
}

const std::vector<SlpTest::Service> kServices = {
    {"service:wbem:https://192.0.2.10:5989", 10800},
    {"service:brix-mgmt://192.0.2.11", 65535},
};

TEST(SlpWire, ServiceRequestBytes) {
    ServiceRequest request;
    request.xid = 0x1234;
    request.multicast = true;
    request.previousResponders = "10.0.0.1";
    request.serviceType = "service:wbem";
    // clang-format off
    const Bytes expected = {
        2, 1, 0, 0, 53,  // version, SrvRqst, length
        0x20, 0,         // request-multicast
        0, 0, 0,         // no extension
        0x12, 0x34,      // XID
        0, 2, 'e', 'n',  // language
        0, 8, '1', '0', '.', '0', '.', '0', '.', '1',
        0, 12, 's', 'e', 'r', 'v', 'i', 'c', 'e', ':', 'w', 'b', 'e', 'm',
        0, 7, 'D', 'E', 'F', 'A', 'U', 'L', 'T',
        0, 0,  // predicate
        0, 0,  // SPI
    };
    // clang-format on
    EXPECT_EQ(BuildServiceRequest(request), expected);
    request.multicast = false;
    EXPECT_EQ(BuildServiceRequest(request)[5], 0);
}

TEST(SlpWire, ServiceReplyEntriesInOrder) {
    const auto reply = Parse(SlpTest::Responder::ServiceReply(77, kServices));
    ASSERT_TRUE(reply);
    EXPECT_EQ(reply->function, kSrvRply);
    EXPECT_EQ(reply->xid, 77);
    EXPECT_EQ(reply->language, "en");
    EXPECT_EQ(reply->errorCode, 0);
    ASSERT_EQ(reply->entries.size(), 2u);
    EXPECT_EQ(reply->entries[0].url, kServices[0].url);
    EXPECT_EQ(reply->entries[0].lifetime, 10800);
    EXPECT_EQ(reply->entries[1].lifetime, 65535);
}

TEST(SlpWire, AdvertsAndErrors) {
    auto advert = Parse(SlpTest::Responder::AgentAdvert(5, "service:service-agent://h"));
    ASSERT_TRUE(advert);
    EXPECT_EQ(advert->function, kSAAdvert);
    ASSERT_EQ(advert->entries.size(), 1u);
    EXPECT_EQ(advert->entries[0].url, "service:service-agent://h");
    EXPECT_EQ(advert->entries[0].lifetime, 0);

    // An error reply may end after its error code.
    Bytes error = SlpTest::Responder::ServiceReply(5, {}, 4);
    error.resize(error.size() - 2);
    error[4] = static_cast<uint8_t>(error.size());
    auto parsed = Parse(error);
    ASSERT_TRUE(parsed);
    EXPECT_EQ(parsed->errorCode, 4);
    EXPECT_TRUE(parsed->entries.empty());
    EXPECT_EQ(ErrorName(4), "SCOPE_NOT_SUPPORTED");

    // A DAAdvert: error, boot time, URL, scopes, attributes, SPI list, no auth blocks.
    Bytes da = {2, 8, 0, 0, 0, 0, 0,   0,   0,   0,   0,   9, 0, 2, 'e', 'n', 0, 0,
                0, 0, 0, 1, 0, 5, 'd', 'a', ':', '/', '/', 0, 0, 0, 0,   0,   0, 0};
    da[4] = static_cast<uint8_t>(da.size());
    auto directory = Parse(da);
    ASSERT_TRUE(directory);
    ASSERT_EQ(directory->entries.size(), 1u);
    EXPECT_EQ(directory->entries[0].url, "da://");
}

TEST(SlpWire, AuthenticationBlocksAndExtensionsAreSkipped) {
    Bytes reply = SlpTest::Responder::ServiceReply(9, {{"service:x://a", 60}});
    // Replace "no auth blocks" with one 12-byte block: BSD, length, timestamp, SPI "ab".
    reply.pop_back();
    reply.insert(reply.end(), {1, 0x00, 0x02, 0, 12, 0, 0, 0, 0, 0, 2, 'a', 'b'});
    // An extension after the body.
    const size_t bodyEnd = reply.size();
    reply.insert(reply.end(), {0x80, 0x01, 0, 0, 0, 1, 2, 3});
    reply[4] = static_cast<uint8_t>(reply.size());
    reply[9] = static_cast<uint8_t>(bodyEnd);
    auto parsed = Parse(reply);
    ASSERT_TRUE(parsed);
    ASSERT_EQ(parsed->entries.size(), 1u);
    EXPECT_EQ(parsed->entries[0].url, "service:x://a");
}

TEST(SlpWire, EveryTruncationIsMalformed) {
    const Bytes whole = SlpTest::Responder::ServiceReply(1, kServices);
    for (size_t size = 0; size < whole.size(); ++size) {
        const Bytes prefix(whole.begin(), whole.begin() + static_cast<long>(size));
        EXPECT_FALSE(Parse(prefix)) << size;
        // The same bytes with the length field made to agree.
        if (size >= 5) {
            Bytes agreeing = prefix;
            agreeing[4] = static_cast<uint8_t>(size);
            agreeing[3] = static_cast<uint8_t>(size >> 8);
            EXPECT_FALSE(Parse(agreeing)) << size;
        }
    }
    EXPECT_FALSE(ParseReply(nullptr, 0));
    // Trailing bytes past the message's own length are not part of it.
    Bytes longer = whole;
    longer.push_back(0xff);
    EXPECT_TRUE(Parse(longer));
}

struct MalformedCase {
    const char* what;
    size_t offset;
    uint8_t value;
};

TEST(SlpWire, InconsistentRepliesAreMalformed) {
    const Bytes good = SlpTest::Responder::ServiceReply(1, {{"service:x://a", 60}});
    // Offsets: header 0-13, language 14-15, error 16-17, count 18-19, entry from 20
    // (reserved, lifetime 21-22, URL length 23-24, URL 25-37, auth count 38).
    const MalformedCase cases[] = {
        {"version 1", 0, 1},
        {"a request, not a reply", 1, kSrvRqst},
        {"an acknowledgement", 1, kSrvAck},
        {"length past the buffer", 4, 200},
        {"length shorter than the header", 4, 10},
        {"language length past the end", 13, 250},
        {"count larger than entries", 19, 2},
        {"count smaller than entries", 19, 0},
        {"URL length past the end", 24, 40},
        {"URL with a control character", 30, 0x07},
        {"URL with a bad UTF-8 byte", 30, 0xff},
        {"auth block count without blocks", 38, 1},
        {"extension offset inside the header", 9, 3},
        {"extension offset past the end", 9, 250},
    };
    ASSERT_TRUE(Parse(good));
    for (const auto& c : cases) {
        Bytes bytes = good;
        ASSERT_LT(c.offset, bytes.size());
        bytes[c.offset] = c.value;
        EXPECT_FALSE(Parse(bytes)) << c.what;
    }
    Bytes empty = SlpTest::Responder::ServiceReply(1, {{"", 60}});
    EXPECT_FALSE(Parse(empty)) << "empty URL";
    Bytes utf8 = SlpTest::Responder::ServiceReply(1, {{"service:x://h\xc3\xa9te", 60}});
    EXPECT_TRUE(Parse(utf8)) << "UTF-8 URL";
}

TEST(SlpWire, RandomDamageNeverCrashes) {
    const Bytes good = SlpTest::Responder::ServiceReply(3, kServices);
    std::mt19937 random(20240611);
    for (int round = 0; round < 20000; ++round) {
        Bytes bytes = good;
        const int flips = 1 + static_cast<int>(random() % 4);
        for (int i = 0; i < flips; ++i) {
            bytes[random() % bytes.size()] = static_cast<uint8_t>(random());
        }
        bytes.resize(random() % (bytes.size() + 1));
        const auto parsed = Parse(bytes);
        if (parsed) {
            for (const auto& entry : parsed->entries) EXPECT_FALSE(entry.url.empty());
        }
    }
}

TEST(SlpWire, PeekLength) {
    const Bytes header = {2, 2, 0x01, 0x02, 0x03};
    EXPECT_EQ(PeekLength(header.data(), header.size()), 0x010203u);
    EXPECT_FALSE(PeekLength(header.data(), 4));
    const Bytes v1 = {1, 2, 0, 0, 20};
    EXPECT_FALSE(PeekLength(v1.data(), v1.size()));
}

}  // namespace

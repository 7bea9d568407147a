// SLPv2 messages on the wire: building service requests and parsing the replies that answer them.
// The parser takes untrusted bytes from the network; it never reads outside the buffer and
// reports anything it cannot fully account for as malformed.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace BrixSim::Slp {

constexpr uint8_t kVersion = 2;
constexpr uint16_t kDefaultPort = 427;
constexpr const char* kMulticastGroup = "239.255.255.253";

enum Function : uint8_t {
    kSrvRqst = 1,
    kSrvRply = 2,
    kSrvReg = 3,
    kSrvDeReg = 4,
    kSrvAck = 5,
    kAttrRqst = 6,
    kAttrRply = 7,
    kDAAdvert = 8,
    kSrvTypeRqst = 9,
    kSrvTypeRply = 10,
    kSAAdvert = 11,
};

enum Flags : uint16_t {
    kFlagOverflow = 0x8000,
    kFlagFresh = 0x4000,
    kFlagRequestMulticast = 0x2000,
};

// Size of the header before the language tag.
constexpr size_t kHeaderFixedSize = 14;

struct ServiceRequest {
    uint16_t xid = 0;
    bool multicast = false;
    std::string language = "en";
    std::string previousResponders;  // comma-separated addresses that already answered
    std::string serviceType;         // e.g. "service:service-agent"
    std::string scopes = "DEFAULT";
    std::string predicate;
};

// Encodes a SrvRqst. Throws std::length_error when a text does not fit its 16-bit length.
std::vector<uint8_t> BuildServiceRequest(const ServiceRequest& request);

struct ReplyEntry {
    std::string url;
    uint16_t lifetime = 0;  // SAAdvert and DAAdvert carry none: 0
};

// A well-formed SrvRply, SAAdvert or DAAdvert.
struct Reply {
    uint8_t function = 0;
    uint16_t flags = 0;
    uint16_t xid = 0;
    std::string language;
    uint16_t errorCode = 0;
    std::vector<ReplyEntry> entries;
};

// Parses one reply message. Returns nullopt ("malformed") for anything that is not a complete,
// consistent SLPv2 SrvRply, SAAdvert or DAAdvert: wrong version or function, a length that
// disagrees with the buffer, a field running past the end, text with control characters, or
// bytes left over inside the message body. Bytes after the message's own length are ignored.
std::optional<Reply> ParseReply(const uint8_t* data, size_t size);

// Reads the total message length from the first five bytes of a header, or nullopt when fewer
// than five bytes are given or the version is not 2.
std::optional<uint32_t> PeekLength(const uint8_t* data, size_t size);

// The name of an SLP error code, e.g. "LANGUAGE_NOT_SUPPORTED".
std::string ErrorName(uint16_t code);

}  // namespace BrixSim::Slp

// The subset of ASN.1 BER that SNMP messages use: definite lengths, INTEGER, OCTET STRING, NULL,
// OBJECT IDENTIFIER, SEQUENCE and the SNMP application and context tags. Encoded values are byte
// strings held in std::string.
#pragma once

#include <cstdint>
#include <initializer_list>
#include <stdexcept>
#include <string>
#include <string_view>

namespace BrixSim::Snmp::Ber {

enum Tag : uint8_t {
    kInteger = 0x02,
    kOctetString = 0x04,
    kNull = 0x05,
    kOid = 0x06,
    kSequence = 0x30,
    kIpAddress = 0x40,
    kCounter32 = 0x41,
    kGauge32 = 0x42,
    kTimeTicks = 0x43,
    kGetRequest = 0xa0,
    kResponse = 0xa2,
    kTrapV1 = 0xa4,
    kInformRequest = 0xa6,
    kTrapV2 = 0xa7,
    kReport = 0xa8,
};

// Raised for input that is not well-formed BER.
class DecodeError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

// Tag, length and content.
std::string Tlv(uint8_t tag, std::string_view content);
std::string Integer(int64_t value);
// An unsigned 32-bit value under an application tag (TimeTicks, Counter32, Gauge32).
std::string Unsigned(uint8_t tag, uint32_t value);
std::string OctetString(std::string_view bytes);
std::string Null();
// A dotted object identifier such as "1.3.6.1.2.1.1.3.0"; throws std::invalid_argument.
std::string Oid(std::string_view dotted);
// The concatenated elements under `tag` (a SEQUENCE unless told otherwise).
std::string Sequence(std::initializer_list<std::string_view> elements, uint8_t tag = kSequence);

// One decoded element; `content` points into the decoded buffer.
struct Element {
    uint8_t tag = 0;
    std::string_view content;
    // The whole encoding, tag and length included.
    std::string_view encoding;
};

// Reads consecutive elements of a buffer.
class Reader {
  public:
    explicit Reader(std::string_view data) : data_(data) {}
    bool AtEnd() const { return position_ >= data_.size(); }
    Element Next();
    // The next element, which must carry `tag`.
    Element Expect(uint8_t tag);
    int64_t ReadInteger();
    std::string ReadOctetString();
    // Where the next element starts in the buffer.
    size_t Position() const { return position_; }

  private:
    std::string_view data_;
    size_t position_ = 0;
};

int64_t DecodeInteger(std::string_view content);
uint32_t DecodeUnsigned(std::string_view content);
std::string DecodeOid(std::string_view content);

}  // namespace BrixSim::Snmp::Ber

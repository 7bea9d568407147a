#include "hostsim/agents/snmp/Ber.h"

#include <charconv>
#include <vector>

namespace BrixSim::Snmp::Ber {

namespace {

std::string Length(size_t length) {
    if (length < 0x80) return std::string(1, static_cast<char>(length));
    std::string bytes;
    for (size_t rest = length; rest != 0; rest >>= 8) {
        bytes.insert(bytes.begin(), static_cast<char>(rest & 0xff));
    }
    return static_cast<char>(0x80 | bytes.size()) + bytes;
}

void Base128(std::string& out, uint64_t value) {
    std::string digits(1, static_cast<char>(value & 0x7f));
    for (value >>= 7; value != 0; value >>= 7) {
        digits.insert(digits.begin(), static_cast<char>(0x80 | (value & 0x7f)));
    }
    out += digits;
}

}  // namespace

std::string Tlv(uint8_t tag, std::string_view content) {
    std::string out(1, static_cast<char>(tag));
    out += Length(content.size());
    out += content;
    return out;
}

std::string Integer(int64_t value) {
    // Big-endian two's complement, without redundant leading bytes.
    std::string bytes;
    for (int shift = 56; shift >= 0; shift -= 8) {
        bytes += static_cast<char>((static_cast<uint64_t>(value) >> shift) & 0xff);
    }
    size_t start = 0;
    while (start + 1 < bytes.size()) {
        const auto first = static_cast<uint8_t>(bytes[start]);
        const auto next = static_cast<uint8_t>(bytes[start + 1]);
        if ((first == 0x00 && !(next & 0x80)) || (first == 0xff && (next & 0x80))) {
            ++start;
        } else {
            break;
        }
    }
    return Tlv(kInteger, std::string_view(bytes).substr(start));
}

std::string Unsigned(uint8_t tag, uint32_t value) {
    std::string bytes;
    for (int shift = 24; shift >= 0; shift -= 8) {
        bytes += static_cast<char>((value >> shift) & 0xff);
    }
    size_t start = 0;
    while (start + 1 < bytes.size() && bytes[start] == 0 &&
           !(static_cast<uint8_t>(bytes[start + 1]) & 0x80)) {
        ++start;
    }
    // A value with its top bit set needs a leading zero to stay positive.
    std::string content = bytes.substr(start);
    if (static_cast<uint8_t>(content[0]) & 0x80) content.insert(content.begin(), '\0');
    return Tlv(tag, content);
}

std::string OctetString(std::string_view bytes) {
    return Tlv(kOctetString, bytes);
}

std::string Null() {
    return Tlv(kNull, {});
}

std::string Oid(std::string_view dotted) {
    std::vector<uint64_t> arcs;
    size_t start = 0;
    while (start <= dotted.size()) {
        size_t end = dotted.find('.', start);
        if (end == std::string_view::npos) end = dotted.size();
        const std::string_view part = dotted.substr(start, end - start);
        uint64_t arc = 0;
        const auto [rest, error] = std::from_chars(part.data(), part.data() + part.size(), arc);
        if (part.empty() || error != std::errc() || rest != part.data() + part.size() ||
            arc > 0xffffffffu) {
            throw std::invalid_argument("not an object identifier: " + std::string(dotted));
        }
        arcs.push_back(arc);
        start = end + 1;
    }
    if (arcs.size() < 2 || arcs[0] > 2 || (arcs[0] < 2 && arcs[1] > 39)) {
        throw std::invalid_argument("not an object identifier: " + std::string(dotted));
    }
    std::string content;
    Base128(content, arcs[0] * 40 + arcs[1]);
    for (size_t i = 2; i < arcs.size(); ++i) Base128(content, arcs[i]);
    return Tlv(kOid, content);
}

std::string Sequence(std::initializer_list<std::string_view> elements, uint8_t tag) {
    std::string content;
    for (const auto element : elements) content += element;
    return Tlv(tag, content);
}

Element Reader::Next() {
    if (position_ + 2 > data_.size()) throw DecodeError("truncated element");
    const size_t start = position_;
    const auto tag = static_cast<uint8_t>(data_[position_++]);
    if ((tag & 0x1f) == 0x1f) throw DecodeError("multi-byte tags are not used by SNMP");
    size_t length = static_cast<uint8_t>(data_[position_++]);
    if (length & 0x80) {
        const size_t count = length & 0x7f;
        if (count == 0) throw DecodeError("indefinite length");
        if (count > 4 || position_ + count > data_.size()) throw DecodeError("bad length");
        length = 0;
        for (size_t i = 0; i < count; ++i) {
            length = (length << 8) | static_cast<uint8_t>(data_[position_++]);
        }
    }
    if (length > data_.size() - position_) throw DecodeError("element longer than its container");
    Element element;
    element.tag = tag;
    element.content = data_.substr(position_, length);
    position_ += length;
    element.encoding = data_.substr(start, position_ - start);
    return element;
}

Element Reader::Expect(uint8_t tag) {
    const Element element = Next();
    if (element.tag != tag) {
        throw DecodeError("unexpected tag " + std::to_string(element.tag) + ", expected " +
                          std::to_string(tag));
    }
    return element;
}

int64_t Reader::ReadInteger() {
    return DecodeInteger(Expect(kInteger).content);
}

std::string Reader::ReadOctetString() {
    return std::string(Expect(kOctetString).content);
}

int64_t DecodeInteger(std::string_view content) {
    if (content.empty() || content.size() > 8) throw DecodeError("bad integer");
    uint64_t value = static_cast<uint8_t>(content[0]) & 0x80 ? ~uint64_t{0} : 0;
    for (const char byte : content) value = (value << 8) | static_cast<uint8_t>(byte);
    return static_cast<int64_t>(value);
}

uint32_t DecodeUnsigned(std::string_view content) {
    if (content.empty() || content.size() > 5 || (content.size() == 5 && content[0] != 0)) {
        throw DecodeError("bad unsigned value");
    }
    uint32_t value = 0;
    for (const char byte : content) value = (value << 8) | static_cast<uint8_t>(byte);
    return value;
}

std::string DecodeOid(std::string_view content) {
    if (content.empty()) throw DecodeError("empty object identifier");
    std::vector<uint64_t> arcs;
    uint64_t value = 0;
    for (size_t i = 0; i < content.size(); ++i) {
        const auto byte = static_cast<uint8_t>(content[i]);
        if (value > (uint64_t{1} << 56)) throw DecodeError("object identifier arc too large");
        value = (value << 7) | (byte & 0x7f);
        if (!(byte & 0x80)) {
            arcs.push_back(value);
            value = 0;
        } else if (i + 1 == content.size()) {
            throw DecodeError("truncated object identifier");
        }
    }
    const uint64_t first = arcs[0] < 80 ? arcs[0] / 40 : 2;
    std::string dotted = std::to_string(first) + "." + std::to_string(arcs[0] - first * 40);
    for (size_t i = 1; i < arcs.size(); ++i) dotted += "." + std::to_string(arcs[i]);
    return dotted;
}

}  // namespace BrixSim::Snmp::Ber

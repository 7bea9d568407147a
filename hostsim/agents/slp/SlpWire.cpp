#include "hostsim/agents/slp/SlpWire.h"

#include <stdexcept>

namespace BrixSim::Slp {

namespace {

void Put16(std::vector<uint8_t>& out, uint32_t value) {
    out.push_back(static_cast<uint8_t>(value >> 8));
    out.push_back(static_cast<uint8_t>(value));
}

void Put24(std::vector<uint8_t>& out, uint32_t value) {
    out.push_back(static_cast<uint8_t>(value >> 16));
    Put16(out, value & 0xffff);
}

void PutText(std::vector<uint8_t>& out, const std::string& text) {
    if (text.size() > 0xffff) throw std::length_error("SLP text field longer than 65535 bytes");
    Put16(out, static_cast<uint32_t>(text.size()));
    out.insert(out.end(), text.begin(), text.end());
}

// Well-formed UTF-8 without control characters: text that is safe to show and to encode.
bool IsDisplayable(const uint8_t* text, size_t size) {
    size_t i = 0;
    while (i < size) {
        const uint8_t lead = text[i];
        if (lead < 0x20 || lead == 0x7f) return false;
        if (lead < 0x80) {
            ++i;
            continue;
        }
        size_t extra = 0;
        uint32_t code = 0;
        if ((lead & 0xe0) == 0xc0) {
            extra = 1;
            code = lead & 0x1f;
        } else if ((lead & 0xf0) == 0xe0) {
            extra = 2;
            code = lead & 0x0f;
        } else if ((lead & 0xf8) == 0xf0) {
            extra = 3;
            code = lead & 0x07;
        } else {
            return false;
        }
        if (size - i <= extra) return false;
        for (size_t k = 1; k <= extra; ++k) {
            if ((text[i + k] & 0xc0) != 0x80) return false;
            code = (code << 6) | (text[i + k] & 0x3f);
        }
        static constexpr uint32_t kMinimum[] = {0, 0x80, 0x800, 0x10000};
        if (code < kMinimum[extra] || code > 0x10ffff || (code >= 0xd800 && code <= 0xdfff)) {
            return false;
        }
        if (code >= 0x80 && code < 0xa0) return false;  // C1 controls
        i += extra + 1;
    }
    return true;
}

// Bounds-checked reading of one message; every read fails once the end is passed.
class Reader {
  public:
    Reader(const uint8_t* data, size_t size) : data_(data), size_(size) {}

    bool U8(uint8_t& value) {
        if (size_ - pos_ < 1) return false;
        value = data_[pos_++];
        return true;
    }
    bool U16(uint16_t& value) {
        if (size_ - pos_ < 2) return false;
        value = static_cast<uint16_t>(data_[pos_] << 8 | data_[pos_ + 1]);
        pos_ += 2;
        return true;
    }
    bool U24(uint32_t& value) {
        if (size_ - pos_ < 3) return false;
        value = static_cast<uint32_t>(data_[pos_]) << 16 |
                static_cast<uint32_t>(data_[pos_ + 1]) << 8 | data_[pos_ + 2];
        pos_ += 3;
        return true;
    }
    bool Skip(size_t count) {
        if (size_ - pos_ < count) return false;
        pos_ += count;
        return true;
    }
    // A length-prefixed text; `displayable` also requires text fit for a user's screen.
    bool Text(std::string& text, bool displayable) {
        uint16_t length = 0;
        if (!U16(length) || size_ - pos_ < length) return false;
        if (displayable && !IsDisplayable(data_ + pos_, length)) return false;
        text.assign(reinterpret_cast<const char*>(data_ + pos_), length);
        pos_ += length;
        return true;
    }
    bool SkipText() {
        uint16_t length = 0;
        return U16(length) && Skip(length);
    }
    // The authentication blocks that close a URL entry or an advertisement.
    bool SkipAuthBlocks() {
        uint8_t count = 0;
        if (!U8(count)) return false;
        for (unsigned i = 0; i < count; ++i) {
            const size_t start = pos_;
            uint16_t descriptor = 0;
            uint16_t length = 0;
            uint16_t spiLength = 0;
            // BSD, block length (whole block), timestamp (4), SPI length, SPI, authenticator.
            if (!U16(descriptor) || !U16(length) || !Skip(4) || !U16(spiLength)) return false;
            if (length < 10u + spiLength) return false;
            pos_ = start;
            if (!Skip(length)) return false;
        }
        return true;
    }
    bool AtEnd() const { return pos_ == size_; }
    size_t Position() const { return pos_; }

  private:
    const uint8_t* data_;
    size_t size_;
    size_t pos_ = 0;
};

bool ParseUrlEntry(Reader& body, ReplyEntry& entry) {
    uint8_t reserved = 0;
    return body.U8(reserved) && body.U16(entry.lifetime) && body.Text(entry.url, true) &&
           !entry.url.empty() && body.SkipAuthBlocks();
}

bool ParseServiceReply(Reader& body, Reply& reply) {
    if (!body.U16(reply.errorCode)) return false;
    // An error reply may stop after its error code; whatever follows is not looked at.
    if (reply.errorCode != 0) return true;
    uint16_t count = 0;
    if (!body.U16(count)) return false;
    for (unsigned i = 0; i < count; ++i) {
        ReplyEntry entry;
        if (!ParseUrlEntry(body, entry)) return false;
        reply.entries.push_back(std::move(entry));
    }
    return body.AtEnd();
}

bool ParseServiceAgentAdvert(Reader& body, Reply& reply) {
    ReplyEntry entry;
    if (!body.Text(entry.url, true) || entry.url.empty()) return false;
    if (!body.SkipText() || !body.SkipText() || !body.SkipAuthBlocks()) return false;
    reply.entries.push_back(std::move(entry));
    return body.AtEnd();
}

bool ParseDirectoryAgentAdvert(Reader& body, Reply& reply) {
    // Error code, then the agent's boot time stamp (4 bytes).
    if (!body.U16(reply.errorCode) || !body.Skip(4)) return false;
    if (reply.errorCode != 0) return true;
    ReplyEntry entry;
    if (!body.Text(entry.url, true) || entry.url.empty()) return false;
    // Scope list, attribute list, SPI list, then the authentication blocks.
    if (!body.SkipText() || !body.SkipText() || !body.SkipText() || !body.SkipAuthBlocks()) {
        return false;
    }
    reply.entries.push_back(std::move(entry));
    return body.AtEnd();
}

}  // namespace

std::vector<uint8_t> BuildServiceRequest(const ServiceRequest& request) {
    std::vector<uint8_t> body;
    PutText(body, request.previousResponders);
    PutText(body, request.serviceType);
    PutText(body, request.scopes);
    PutText(body, request.predicate);
    PutText(body, "");  // no security parameter index: no authentication wanted

    std::vector<uint8_t> message;
    message.push_back(kVersion);
    message.push_back(kSrvRqst);
    const size_t length = kHeaderFixedSize + request.language.size() + body.size();
    if (length > 0xffffff) throw std::length_error("SLP message longer than 16 MiB");
    Put24(message, static_cast<uint32_t>(length));
    Put16(message, request.multicast ? kFlagRequestMulticast : 0);
    Put24(message, 0);  // no extensions
    Put16(message, request.xid);
    PutText(message, request.language);
    message.insert(message.end(), body.begin(), body.end());
    return message;
}

std::optional<uint32_t> PeekLength(const uint8_t* data, size_t size) {
    if (data == nullptr || size < 5 || data[0] != kVersion) return std::nullopt;
    return static_cast<uint32_t>(data[2]) << 16 | static_cast<uint32_t>(data[3]) << 8 | data[4];
}

std::optional<Reply> ParseReply(const uint8_t* data, size_t size) {
    const auto length = PeekLength(data, size);
    if (!length || *length < kHeaderFixedSize || *length > size) return std::nullopt;

    Reader header(data, *length);
    Reply reply;
    uint8_t version = 0;
    uint32_t ignoredLength = 0;
    uint32_t nextExtension = 0;
    if (!header.U8(version) || !header.U8(reply.function) || !header.U24(ignoredLength) ||
        !header.U16(reply.flags) || !header.U24(nextExtension) || !header.U16(reply.xid) ||
        !header.Text(reply.language, true)) {
        return std::nullopt;
    }
    // The body runs to the first extension, if there is one, else to the end of the message.
    const size_t bodyStart = header.Position();
    size_t bodyEnd = *length;
    if (nextExtension != 0) {
        if (nextExtension < bodyStart || nextExtension >= *length) return std::nullopt;
        bodyEnd = nextExtension;
    }
    Reader body(data + bodyStart, bodyEnd - bodyStart);
    bool ok = false;
    switch (reply.function) {
        case kSrvRply:
            ok = ParseServiceReply(body, reply);
            break;
        case kSAAdvert:
            ok = ParseServiceAgentAdvert(body, reply);
            break;
        case kDAAdvert:
            ok = ParseDirectoryAgentAdvert(body, reply);
            break;
        default:
            break;
    }
    if (!ok) return std::nullopt;
    return reply;
}

std::string ErrorName(uint16_t code) {
    switch (code) {
        case 0:
            return "OK";
        case 1:
            return "LANGUAGE_NOT_SUPPORTED";
        case 2:
            return "PARSE_ERROR";
        case 3:
            return "INVALID_REGISTRATION";
        case 4:
            return "SCOPE_NOT_SUPPORTED";
        case 5:
            return "AUTHENTICATION_UNKNOWN";
        case 6:
            return "AUTHENTICATION_ABSENT";
        case 7:
            return "AUTHENTICATION_FAILED";
        case 9:
            return "VER_NOT_SUPPORTED";
        case 10:
            return "INTERNAL_ERROR";
        case 11:
            return "DA_BUSY_NOW";
        case 12:
            return "OPTION_NOT_UNDERSTOOD";
        case 13:
            return "INVALID_UPDATE";
        case 14:
            return "MSG_NOT_SUPPORTED";
        case 15:
            return "REFRESH_REJECTED";
        default:
            return "error " + std::to_string(code);
    }
}

}  // namespace BrixSim::Slp

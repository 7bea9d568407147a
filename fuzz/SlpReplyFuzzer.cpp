// The SLP reply parser: bytes from the network in, a reply or "malformed" out.
#include <cstring>
#include <memory>

#include "FuzzSupport.h"
#include "hostsim/agents/slp/SlpWire.h"

namespace {

bool Displayable(const std::string& text) {
    for (unsigned char c : text) {
        if (c < 0x20 || c == 0x7f) return false;
    }
    return true;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    using namespace BrixSim::Slp;
    // An exact-size copy, so a read past the end is caught even for inputs the fuzzer keeps in
    // a larger buffer.
    auto bytes = std::make_unique<uint8_t[]>(size);
    if (size) std::memcpy(bytes.get(), data, size);
    const auto length = PeekLength(bytes.get(), size);
    const auto reply = ParseReply(bytes.get(), size);
    if (!reply) return 0;
    BRIX_FUZZ_CHECK(length && *length <= size && *length >= kHeaderFixedSize, "");
    BRIX_FUZZ_CHECK(
        reply->function == kSrvRply || reply->function == kSAAdvert || reply->function == kDAAdvert,
        std::to_string(reply->function));
    BRIX_FUZZ_CHECK(Displayable(reply->language), reply->language);
    if (reply->errorCode != 0) {
        BRIX_FUZZ_CHECK(reply->entries.empty(), "an error reply with entries");
        ErrorName(reply->errorCode);
    }
    for (const auto& entry : reply->entries) {
        BRIX_FUZZ_CHECK(!entry.url.empty() && Displayable(entry.url), entry.url);
        if (reply->function != kSrvRply) BRIX_FUZZ_CHECK(entry.lifetime == 0, entry.url);
    }
    // Bytes after the message's own length do not change the answer.
    const auto alone = ParseReply(bytes.get(), *length);
    BRIX_FUZZ_CHECK(
        alone && alone->entries.size() == reply->entries.size() && alone->xid == reply->xid,
        "trailing bytes changed the reply");
    return 0;
}

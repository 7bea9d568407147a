// The event-observation library: host events posted by management tools, journaled as
// {"kind":"event","format":...,"text":...} with the event identifier marker removed from the text.
#include <cstdarg>
#include <cstdio>
#include <exception>
#include <string>
#include <string_view>

#include "evt/EvtUser.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"

namespace {

const BrixSim::Operation kInit{"EvtUserLib_Init"};
const BrixSim::Operation kAddEvt{"EvtUserLib_AddEvt"};

// Marks the event identifier at the front of a format: "@&!*@*@(" identifier ")".
constexpr std::string_view kIdOpen = "@&!*@*@(";

// Whether this process holds an open connection to the event service.
bool connected = false;

// The event's message: the formatted text after its identifier marker.
std::string_view Message(std::string_view text) {
    if (text.substr(0, kIdOpen.size()) != kIdOpen) return text;
    const size_t close = text.find(')', kIdOpen.size());
    return close == std::string_view::npos ? text : text.substr(close + 1);
}

}  // namespace

extern "C" int EvtUserLib_Init(void) {
    try {
        BrixSim::Store::Get().Check(kInit);
    } catch (const std::exception&) {
        return -1;
    }
    connected = true;
    return 0;
}

extern "C" int EvtUserLib_AddEvt(const char* format, ...) {
    if (!connected || format == nullptr) return -1;
    va_list args;
    va_start(args, format);
    va_list again;
    va_copy(again, args);
    const int length = std::vsnprintf(nullptr, 0, format, args);
    va_end(args);
    std::string text;
    if (length > 0) {
        text.resize(static_cast<size_t>(length) + 1);
        std::vsnprintf(text.data(), text.size(), format, again);
        text.resize(static_cast<size_t>(length));
    }
    va_end(again);
    if (length < 0) return -1;
    try {
        auto& store = BrixSim::Store::Get();
        store.Check(kAddEvt);
        store.Write([&] {
            store.Journal("event",
                          {{"format", std::string(format)}, {"text", std::string(Message(text))}});
        });
    } catch (const std::exception&) {
        return -1;
    }
    return 0;
}

extern "C" void EvtUserLib_Close(void) {
    connected = false;
}

#include "settings/IsDelta.h"

#include <strings.h>

#include <cstdint>
#include <cstdlib>

namespace OstrelCli::System {

namespace {

using Option = HostCtl::System::KernelOption;

// A text counts as true when it starts with "TRUE" in any case.
bool AsBool(const std::string& text) {
    return strncasecmp(text.c_str(), "TRUE", 4) == 0;
}

// The number strtoul reads from the text with base 0 (hexadecimal, octal or decimal).
unsigned long AsNumber(const std::string& text) {
    return std::strtoul(text.c_str(), nullptr, 0);
}

template <class Convert>
bool Differs(const std::string& defaultValue, const std::string& configured,
             const std::string& runtime, Convert convert) {
    const auto reference = convert(defaultValue);
    return convert(configured) != reference || convert(runtime) != reference;
}

}  // namespace

bool IsDelta(Option::OptionType type, const std::string& defaultValue,
             const std::string& configured, const std::string& runtime) {
    switch (type) {
        case Option::OPTION_STRING:
            return configured != defaultValue || runtime != defaultValue;
        case Option::OPTION_BOOL:
            return Differs(defaultValue, configured, runtime, AsBool);
        case Option::OPTION_UINT32:
            return Differs(defaultValue, configured, runtime, [](const std::string& text) {
                return static_cast<uint32_t>(AsNumber(text));
            });
        case Option::OPTION_UINT8:
            return Differs(defaultValue, configured, runtime, [](const std::string& text) {
                return static_cast<uint8_t>(AsNumber(text));
            });
        case Option::OPTION_INT32:
            return Differs(defaultValue, configured, runtime, [](const std::string& text) {
                return static_cast<int32_t>(AsNumber(text));
            });
        case Option::OPTION_UINT64:
            return Differs(defaultValue, configured, runtime, [](const std::string& text) {
                return static_cast<uint64_t>(AsNumber(text));
            });
    }
    return false;
}

}  // namespace OstrelCli::System

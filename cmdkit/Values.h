// Conversions of option values shared by the parser and the Input getters.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace CmdKit::Detail {

enum class IntError { None, NotANumber, OutOfRange };

// A signed 64-bit decimal integer with an optional sign; the whole text must be the number.
IntError ParseInt64(const std::string& text, int64_t& value);

// yes|no, true|false, 1|0 in any case.
std::optional<bool> ParseBool(const std::string& text);

}  // namespace CmdKit::Detail

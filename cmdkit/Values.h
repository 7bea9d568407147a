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

// Why `pattern` cannot be a regex constraint, or empty when it can. A constraint is written in
// ECMAScript syntax and matched by a matcher whose time is linear in the value and whose stack
// does not grow with it, so it may not use what such a matcher cannot do (back-references,
// look-ahead).
std::string RegexProblem(const std::string& pattern);

// Whether the regex constraint `pattern` matches the WHOLE of `value`, byte by byte. Throws
// CmdKitException when the pattern cannot be a constraint.
bool MatchesWhole(const std::string& pattern, const std::string& value);

}  // namespace CmdKit::Detail

// Small text helpers of the host interfaces.
#pragma once

#include <string>
#include <vector>

namespace HostCtl::Misc {

// Splits `text` at every character of `delimiters`; empty pieces are dropped.
std::vector<std::string> StringTokenize(const std::string& text, const std::string& delimiters);

}  // namespace HostCtl::Misc

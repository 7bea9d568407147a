#pragma once

#include <stdexcept>
#include <string>

namespace CmdKit {

// The framework's own failures (bad use of its API, a parameter read that was not given).
class CmdKitException : public std::runtime_error {
  public:
    explicit CmdKitException(const std::string& message) : std::runtime_error(message) {}
};

// An invocation the framework refuses before the command runs (exit status 2).
class UsageError : public CmdKitException {
  public:
    explicit UsageError(const std::string& message) : CmdKitException(message) {}
};

}  // namespace CmdKit

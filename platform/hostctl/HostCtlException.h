// The host interfaces' exception: what() is the message, GetDetailedMessage() adds the detail.
#pragma once

#include <exception>
#include <memory>
#include <string>

namespace HostCtl::Lib {

class HostCtlException : public std::exception {
  public:
    explicit HostCtlException(const char* message) : message_(message ? message : "") {}
    explicit HostCtlException(const std::string& message) : message_(message) {}
    HostCtlException(const std::string& message, const std::string& detail)
        : message_(message), detail_(std::make_shared<std::string>(detail)) {}

    const char* what() const noexcept override { return message_.c_str(); }
    // The message, followed by its detail when there is one.
    std::string GetDetailedMessage() const {
        if (!detail_ || detail_->empty()) return message_;
        return message_ + " (" + *detail_ + ")";
    }

  private:
    std::string message_;
    std::shared_ptr<std::string> detail_;
};

}  // namespace HostCtl::Lib

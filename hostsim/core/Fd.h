// An owned file descriptor (a file or a socket): closed once, when its owner goes.
#pragma once

#include <utility>

namespace BrixSim {

class Fd {
  public:
    Fd() = default;
    explicit Fd(int fd) : fd_(fd) {}
    ~Fd() { Reset(); }
    Fd(Fd&& other) noexcept : fd_(std::exchange(other.fd_, -1)) {}
    Fd& operator=(Fd&& other) noexcept {
        if (this != &other) {
            Reset();
            fd_ = std::exchange(other.fd_, -1);
        }
        return *this;
    }
    Fd(const Fd&) = delete;
    Fd& operator=(const Fd&) = delete;

    int Get() const { return fd_; }
    bool Valid() const { return fd_ >= 0; }
    explicit operator bool() const { return Valid(); }
    // Closes the descriptor now (errors of close are not actionable here).
    void Reset();
    // Hands the descriptor over; the caller closes it.
    int Release() { return std::exchange(fd_, -1); }

  private:
    int fd_ = -1;
};

}  // namespace BrixSim

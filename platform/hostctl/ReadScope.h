// One moment of the host for a reader that reads in several steps.
#pragma once

#include <memory>

namespace HostCtl::Lib {

// While a ReadScope lives, reads of the host see it as of the moment the scope began: what a
// listing read while it is printed needs, so that every walk over its rows sees the same rows.
class ReadScope {
  public:
    ReadScope();
    ~ReadScope();
    ReadScope(const ReadScope&) = delete;
    ReadScope& operator=(const ReadScope&) = delete;

  private:
    struct State;
    std::unique_ptr<State> state_;
};

}  // namespace HostCtl::Lib

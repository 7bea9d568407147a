// Kernel boot settings: the types a setting's value can have.
#pragma once

namespace HostCtl::System {

class KernelOption {
  public:
    enum OptionType : int {
        OPTION_STRING = 0,
        OPTION_BOOL = 1,
        OPTION_UINT32 = 2,
        OPTION_UINT8 = 3,
        OPTION_INT32 = 4,
        OPTION_UINT64 = 5,
    };
};

}  // namespace HostCtl::System

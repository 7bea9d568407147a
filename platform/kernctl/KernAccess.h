// Kernel access control: security domains, their enforcement levels and labels.
#pragma once

#include <cstdint>
#include <map>
#include <string>

enum KernAccess_KeywordType : int {
    KERNACCESS_KEYWORD_LEVEL = 0,
};

namespace KernCtl::Security {

class KernAccessInterfaceImpl {
public:
    KernAccessInterfaceImpl();
    ~KernAccessInterfaceImpl();

    // --- security domains ---

    // --- labels ---
    // The label of a domain number; label type 0 is the domain's name.
    std::string GetLabel(uint32_t domain, int labelType);
};

}  // namespace KernCtl::Security

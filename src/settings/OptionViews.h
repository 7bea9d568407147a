// Finding the typed view of an advanced option: through the host interface, or else through
// either kernel-control implementation class (the "User" classes implement only the latter).
#pragma once

#include "kernctl/Adv.h"

namespace OstrelCli::System {

// Calls `use(view)` with the option's integer view; false when the option has none.
template <class Use>
bool WithIntegerView(HostCtl::Adv::AdvancedOption& option, Use&& use) {
    if (auto* view = dynamic_cast<HostCtl::Adv::AdvancedIntegerOption*>(&option)) {
        use(*view);
    } else if (auto* plain = dynamic_cast<KernCtl::Adv::AdvancedIntegerOptionImpl*>(&option)) {
        use(*plain);
    } else if (auto* user = dynamic_cast<KernCtl::Adv::AdvancedUserIntegerOptionImpl*>(&option)) {
        use(*user);
    } else {
        return false;
    }
    return true;
}

// Calls `use(view)` with the option's string view; false when the option has none.
template <class Use>
bool WithStringView(HostCtl::Adv::AdvancedOption& option, Use&& use) {
    if (auto* view = dynamic_cast<HostCtl::Adv::AdvancedStringOption*>(&option)) {
        use(*view);
    } else if (auto* plain = dynamic_cast<KernCtl::Adv::AdvancedStringOptionImpl*>(&option)) {
        use(*plain);
    } else if (auto* user = dynamic_cast<KernCtl::Adv::AdvancedUserStringOptionImpl*>(&option)) {
        use(*user);
    } else {
        return false;
    }
    return true;
}

}  // namespace OstrelCli::System

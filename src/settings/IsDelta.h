#pragma once

#include <string>

#include "hostctl/KernelOption.h"

namespace OstrelCli::System {

// Whether a kernel setting differs from its default: its configured or its runtime value
// compares unequal to the default, by the type's comparison. False for an unknown type.
bool IsDelta(HostCtl::System::KernelOption::OptionType type, const std::string& defaultValue,
             const std::string& configured, const std::string& runtime);

}  // namespace OstrelCli::System

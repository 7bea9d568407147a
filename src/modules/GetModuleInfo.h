#pragma once

#include "frame/CommandKit.h"

namespace KernCtl::System {
class ModuleImpl;
}

namespace OstrelCli::System {

// Writes the fields of a ModuleDetails structure for `module` into `details`.
void GetModuleInfo(KernCtl::System::ModuleImpl& module, MetaObj::MetaStruct& details);

}  // namespace OstrelCli::System

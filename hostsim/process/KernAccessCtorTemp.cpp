// Construction of the access-control interface; stands in until the domain commands' adapter,
// which owns it, is merged.
#include "kernctl/KernAccess.h"

namespace KernCtl::Security {

KernAccessInterfaceImpl::KernAccessInterfaceImpl() = default;
KernAccessInterfaceImpl::~KernAccessInterfaceImpl() = default;

}  // namespace KernCtl::Security

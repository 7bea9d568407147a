// Labels of access-control security domains, from the host's domain table.
#include <string>

#include "hostctl/HostCtlException.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"
#include "kernctl/KernAccess.h"

namespace {

const BrixSim::Operation kGetLabel{"KernCtl::Security::KernAccessInterfaceImpl::GetLabel"};

}  // namespace

namespace KernCtl::Security {

// Label type 0 is the domain's name. A domain number with no domain in its slot (a world left
// over from a removed domain, say) has no name; its label is then the number in decimal, so a
// listing still tells the domains apart.
std::string KernAccessInterfaceImpl::GetLabel(uint32_t domain, int labelType) {
    auto& store = BrixSim::Store::Get();
    store.Check(kGetLabel);
    if (labelType != 0) {
        throw HostCtl::Lib::HostCtlException("Unsupported label type " + std::to_string(labelType));
    }
    auto row = store.Prepare("SELECT name FROM secpolicy_domains WHERE id = ?");
    row.Bind(1, static_cast<int64_t>(domain));
    if (row.Step()) return row.Text(0);
    return std::to_string(domain);
}

}  // namespace KernCtl::Security

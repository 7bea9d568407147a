// The host object and its system interface; each area defines its own SystemInfo methods.
#include "hostctl/Host.h"

#include "hostctl/SystemInfo.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"

namespace {

const BrixSim::Operation kGetSystemInfo{"HostCtl::Host::GetSystemInfo"};
const BrixSim::Operation kGetHost{"HostCtl::HostFactory::GetHost"};

}  // namespace

namespace HostCtl {

Host::Host() = default;
Host::~Host() = default;

std::unique_ptr<System::SystemInfo> Host::GetSystemInfo() {
    BrixSim::Store::Get().Check(kGetSystemInfo);
    return std::make_unique<System::SystemInfo>();
}

namespace HostFactory {

std::unique_ptr<Host> GetHost() {
    BrixSim::Store::Get().Check(kGetHost);
    return std::make_unique<Host>();
}

}  // namespace HostFactory

namespace System {

SystemInfo::SystemInfo() = default;
SystemInfo::~SystemInfo() = default;

}  // namespace System

}  // namespace HostCtl

// The host object and its system interface; each area defines its own SystemInfo methods.
#include "hostctl/Host.h"

#include "core/Store.h"
#include "hostctl/SystemInfo.h"

namespace {

const bool registered =
    BrixSim::RegisterOperations({"HostCtl::HostFactory::GetHost", "HostCtl::Host::GetSystemInfo"});

}  // namespace

namespace HostCtl {

Host::Host() = default;
Host::~Host() = default;

std::unique_ptr<System::SystemInfo> Host::GetSystemInfo() {
    BrixSim::Store::Get().Check("HostCtl::Host::GetSystemInfo");
    return std::make_unique<System::SystemInfo>();
}

namespace HostFactory {

std::unique_ptr<Host> GetHost() {
    BrixSim::Store::Get().Check("HostCtl::HostFactory::GetHost");
    return std::make_unique<Host>();
}

}  // namespace HostFactory

namespace System {

SystemInfo::SystemInfo() = default;
SystemInfo::~SystemInfo() = default;

}  // namespace System

}  // namespace HostCtl

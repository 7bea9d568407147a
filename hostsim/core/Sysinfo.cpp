// Kernel system-information records, answered by the node handlers the areas register.
#include "kernctl/Sysinfo.h"

#include "hostctl/HostCtlException.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Registry.h"

namespace {

const BrixSim::Operation kGet{"KernCtl::Util::Sysinfo::Get"};
const BrixSim::Operation kList{"KernCtl::Util::Sysinfo::List"};

const BrixSim::SysinfoNode& Node(uint32_t node) {
    const auto& nodes = BrixSim::RegisteredSysinfoNodes();
    auto found = nodes.find(node);
    if (found == nodes.end()) {
        throw HostCtl::Lib::HostCtlException("Unknown KSI node " + std::to_string(node));
    }
    return found->second;
}

}  // namespace

namespace KernCtl::Util {

Sysinfo::Sysinfo(uint32_t node) : node_(node) {}

void Sysinfo::Get(void* buffer, size_t size) {
    BrixSim::Store::Get().Check(kGet);
    const auto& node = Node(node_);
    if (!node.get) {
        throw HostCtl::Lib::HostCtlException("KSI node " + std::to_string(node_) +
                                             " has no records");
    }
    node.get(instancePath_, buffer, size);
}

void Sysinfo::List(std::vector<std::string>& names) {
    std::vector<std::string> listed;
    Each([&](const std::string& name) { listed.push_back(name); });
    names = std::move(listed);
}

void Sysinfo::Each(const std::function<void(const std::string& name)>& name) {
    BrixSim::Store::Get().Check(kList);
    const auto& node = Node(node_);
    if (!node.each) {
        throw HostCtl::Lib::HostCtlException("KSI node " + std::to_string(node_) +
                                             " has no instances");
    }
    node.each(instancePath_, name);
}

void Sysinfo::ResetInstance() {
    instancePath_.clear();
}

void Sysinfo::AddInstancePath(const std::string& name) {
    instancePath_.push_back(name);
}

}  // namespace KernCtl::Util

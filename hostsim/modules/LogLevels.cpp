// Log levels of the kernel core and of modules. A level set by hand holds until the host
// restarts; after that the default holds again.
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/core/Boot.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"
#include "hostsim/modules/ModuleStore.h"
#include "kernctl/Module.h"
#include "kernctl/SystemInfoImpl.h"

using BrixSim::Store;
using HostCtl::Lib::HostCtlException;

namespace {

const BrixSim::Operation kGetLogLevels{"KernCtl::System::ModuleImpl::GetLogLevels"};
const BrixSim::Operation kSetDefaultLogLevel{"KernCtl::System::ModuleImpl::SetDefaultLogLevel"};
const BrixSim::Operation kSetLogLevel{"KernCtl::System::ModuleImpl::SetLogLevel"};
const BrixSim::Operation kGetAllLogLevels{"KernCtl::System::SystemInfoImpl::GetAllLogLevels"};
const BrixSim::Operation kSystemInfoImplSetDefaultLogLevel{
    "KernCtl::System::SystemInfoImpl::SetDefaultLogLevel"};
const BrixSim::Operation kSystemInfoImplSetLogLevel{"KernCtl::System::SystemInfoImpl::SetLogLevel"};

constexpr char kCore[] = "";

std::vector<HostCtl::System::LogLevel> ReadLevels(Store& store, const std::string& owner) {
    const int64_t boot = BrixSim::Kernel::CurrentBoot(store);
    auto row = store.Prepare(
        "SELECT name, default_level, current_level, boot FROM log_levels WHERE owner = ?"
        " ORDER BY seq");
    row.Bind(1, owner);
    std::vector<HostCtl::System::LogLevel> levels;
    while (row.Step()) {
        const auto defaultLevel = static_cast<int32_t>(row.Int(1));
        const bool current = row.Int(3) == boot;
        levels.emplace_back(row.Text(0), current ? static_cast<int32_t>(row.Int(2)) : defaultLevel,
                            defaultLevel);
    }
    return levels;
}

// Sets a level to `level`, or to its default when `level` is null. `who` names the owner in
// messages and the journal.
void WriteLevel(Store& store, const BrixSim::Operation& operation, const std::string& owner,
                const std::string& who, const std::string& name,
                const std::optional<uint32_t>& level) {
    store.Write([&] {
        auto row =
            store.Prepare("SELECT default_level FROM log_levels WHERE owner = ? AND name = ?");
        row.Bind(1, owner).Bind(2, name);
        if (!row.Step()) {
            throw HostCtlException(owner.empty()
                                       ? "Unknown log level '" + CmdKit::MessageExcerpt(name) + "'"
                                       : "Unknown log level '" + CmdKit::MessageExcerpt(name) +
                                             "' of module '" + CmdKit::MessageExcerpt(owner) + "'");
        }
        const int64_t value = level ? static_cast<int64_t>(*level) : row.Int(0);
        store
            .Prepare(
                "UPDATE log_levels SET current_level = ?, boot = ? WHERE owner = ? AND name = ?")
            .Bind(1, value)
            .Bind(2, BrixSim::Kernel::CurrentBoot(store))
            .Bind(3, owner)
            .Bind(4, name)
            .Run();
        std::vector<BrixSim::Value> args;
        if (!who.empty()) args.emplace_back(who);
        args.emplace_back(name);
        if (level) args.emplace_back(static_cast<int64_t>(*level));
        store.JournalCall(operation, args);
    });
}

std::string ModuleOwner(Store& store, const std::string& name) {
    auto module = BrixSim::Modules::Resolve(store, name);
    if (!module) throw HostCtlException("Module '" + CmdKit::MessageExcerpt(name) + "' not found");
    return *module;
}

}  // namespace

namespace KernCtl::System {

std::vector<HostCtl::System::LogLevel> SystemInfoImpl::GetAllLogLevels() {
    auto& store = Store::Get();
    store.Check(kGetAllLogLevels);
    return ReadLevels(store, kCore);
}

void SystemInfoImpl::SetLogLevel(const std::string& name, uint32_t level) {
    auto& store = Store::Get();
    store.Check(kSystemInfoImplSetLogLevel);
    WriteLevel(store, kSystemInfoImplSetLogLevel, kCore, "", name, level);
}

void SystemInfoImpl::SetDefaultLogLevel(const std::string& name) {
    auto& store = Store::Get();
    store.Check(kSystemInfoImplSetDefaultLogLevel);
    WriteLevel(store, kSystemInfoImplSetDefaultLogLevel, kCore, "", name, std::nullopt);
}

std::vector<HostCtl::System::LogLevel> ModuleImpl::GetLogLevels() {
    auto& store = Store::Get();
    store.Check(kGetLogLevels);
    return ReadLevels(store, ModuleOwner(store, name_));
}

void ModuleImpl::SetLogLevel(const std::string& name, uint32_t level) {
    auto& store = Store::Get();
    store.Check(kSetLogLevel);
    WriteLevel(store, kSetLogLevel, ModuleOwner(store, name_), name_, name, level);
}

void ModuleImpl::SetDefaultLogLevel(const std::string& name) {
    auto& store = Store::Get();
    store.Check(kSetDefaultLogLevel);
    WriteLevel(store, kSetDefaultLogLevel, ModuleOwner(store, name_), name_, name, std::nullopt);
}

}  // namespace KernCtl::System

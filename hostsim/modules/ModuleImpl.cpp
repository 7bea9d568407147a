// Kernel modules: metadata, enable state, loading and load-time parameters.
#include <algorithm>
#include <string>
#include <vector>

#include "cmdkit/Text.h"
#include "core/Store.h"
#include "hostctl/HostCtlException.h"
#include "hostctl/SystemInfo.h"
#include "kernctl/Module.h"
#include "kernctl/SystemInfoImpl.h"
#include "modules/ModuleStore.h"

using BrixSim::Store;
using HostCtl::Lib::HostCtlException;
namespace Modules = BrixSim::Modules;

namespace {

const bool registered = BrixSim::RegisterOperations({
    "KernCtl::System::ModuleImpl::IsValidName",
    "KernCtl::System::ModuleImpl::GetName",
    "KernCtl::System::ModuleImpl::IsLoaded",
    "KernCtl::System::ModuleImpl::GetVersion",
    "KernCtl::System::ModuleImpl::IsEnabled",
    "KernCtl::System::ModuleImpl::GetProvidedNamespace",
    "KernCtl::System::ModuleImpl::GetFileVersion",
    "KernCtl::System::ModuleImpl::GetLicense",
    "KernCtl::System::ModuleImpl::GetRequiredNamespaces",
    "KernCtl::System::ModuleImpl::GetModuleFile",
    "KernCtl::System::ModuleImpl::GetBuildType",
    "KernCtl::System::ModuleImpl::GetContainingPackage",
    "KernCtl::System::ModuleImpl::GetAcceptanceLevel",
    "KernCtl::System::ModuleImpl::GetEnabled",
    "KernCtl::System::ModuleImpl::SetEnabled",
    "KernCtl::System::ModuleImpl::Load",
    "KernCtl::System::ModuleImpl::GetParameters",
    "KernCtl::System::ModuleImpl::GetOptions",
    "KernCtl::System::ModuleImpl::SetParameterString",
    "KernCtl::System::ModuleImpl::AppendParameterString",
    "KernCtl::System::ModuleImpl::CopyParameters",
    "KernCtl::System::SystemInfoImpl::GetModules",
    "KernCtl::System::SystemInfoImpl::GetModuleByName",
    "HostCtl::System::SystemInfo::GetModule",
});

HostCtlException NotFound(const std::string& name) {
    return HostCtlException("Module '" + CmdKit::MessageExcerpt(name) + "' not found");
}

std::unique_ptr<KernCtl::System::ModuleImpl::Record> FindRecord(Store& store,
                                                                const std::string& module) {
    auto row = store.Prepare(std::string("SELECT ") + Modules::kRecordColumns +
                             " FROM modules WHERE name = ?");
    row.Bind(1, module);
    if (!row.Step()) return nullptr;
    return Modules::ReadRecord(row);
}

// Where the configured parameters of `name` are kept: a module's own name; an alias's module
// or any other name only with force.
std::string OptionsOwner(Store& store, const std::string& name, bool force) {
    if (Modules::IsModule(store, name)) return name;
    if (force) {
        if (auto module = Modules::Resolve(store, name)) return *module;
        return name;
    }
    throw NotFound(name);
}

std::string ReadOptions(Store& store, const std::string& owner) {
    auto row = store.Prepare("SELECT options FROM module_options WHERE name = ?");
    row.Bind(1, owner);
    return row.Step() ? row.Text(0) : std::string();
}

void WriteOptions(Store& store, const std::string& owner, const std::string& options) {
    store
        .Prepare(
            "INSERT INTO module_options (name, options) VALUES (?, ?)"
            " ON CONFLICT (name) DO UPDATE SET options = excluded.options")
        .Bind(1, owner)
        .Bind(2, options)
        .Run();
}

// A required namespace is met when a loaded module provides it in one of the listed versions.
bool Provided(Store& store, const std::string& ns, const std::vector<std::string>& versions) {
    auto row =
        store.Prepare("SELECT provides_versions FROM modules WHERE loaded = 1 AND provides = ?");
    row.Bind(1, ns);
    while (row.Step()) {
        for (const auto& version : Modules::SplitVersions(row.Text(0))) {
            if (std::find(versions.begin(), versions.end(), version) != versions.end()) return true;
        }
    }
    return false;
}

}  // namespace

namespace KernCtl::System {

ModuleImpl::ModuleImpl(const std::string& name) : name_(name) {}

ModuleImpl::ModuleImpl(std::unique_ptr<Record> record)
    : name_(record->name), record_(std::move(record)) {}

ModuleImpl::~ModuleImpl() = default;

const ModuleImpl::Record& ModuleImpl::Data() {
    if (!record_) {
        auto& store = Store::Get();
        const auto module = Modules::Resolve(store, name_);
        if (module) record_ = FindRecord(store, *module);
        if (!record_) throw NotFound(name_);
    }
    return *record_;
}

bool ModuleImpl::IsValidName(const std::string& name) {
    auto& store = Store::Get();
    store.Check("KernCtl::System::ModuleImpl::IsValidName");
    return Modules::IsModule(store, name);
}

std::string ModuleImpl::GetName() {
    Store::Get().Check("KernCtl::System::ModuleImpl::GetName");
    return Data().name;
}

bool ModuleImpl::IsLoaded() {
    Store::Get().Check("KernCtl::System::ModuleImpl::IsLoaded");
    return Data().loaded;
}

std::string ModuleImpl::GetVersion() {
    Store::Get().Check("KernCtl::System::ModuleImpl::GetVersion");
    return Data().version;
}

bool ModuleImpl::IsEnabled() {
    Store::Get().Check("KernCtl::System::ModuleImpl::IsEnabled");
    return Data().enabled;
}

HostCtl::System::ModuleNamespace ModuleImpl::GetProvidedNamespace() {
    Store::Get().Check("KernCtl::System::ModuleImpl::GetProvidedNamespace");
    return {Data().provides, Modules::SplitVersions(Data().providesVersions)};
}

std::string ModuleImpl::GetFileVersion() {
    Store::Get().Check("KernCtl::System::ModuleImpl::GetFileVersion");
    return Data().fileVersion;
}

std::string ModuleImpl::GetLicense() {
    Store::Get().Check("KernCtl::System::ModuleImpl::GetLicense");
    return Data().license;
}

std::vector<HostCtl::System::ModuleNamespace> ModuleImpl::GetRequiredNamespaces() {
    auto& store = Store::Get();
    store.Check("KernCtl::System::ModuleImpl::GetRequiredNamespaces");
    auto row = store.Prepare(
        "SELECT namespace, versions FROM module_requires WHERE module = ? ORDER BY seq");
    row.Bind(1, Data().name);
    std::vector<HostCtl::System::ModuleNamespace> namespaces;
    while (row.Step()) namespaces.push_back({row.Text(0), Modules::SplitVersions(row.Text(1))});
    return namespaces;
}

std::string ModuleImpl::GetModuleFile() {
    Store::Get().Check("KernCtl::System::ModuleImpl::GetModuleFile");
    return Data().file;
}

std::string ModuleImpl::GetBuildType() {
    Store::Get().Check("KernCtl::System::ModuleImpl::GetBuildType");
    return Data().buildType;
}

std::string ModuleImpl::GetContainingPackage() {
    Store::Get().Check("KernCtl::System::ModuleImpl::GetContainingPackage");
    return Data().package;
}

std::string ModuleImpl::GetAcceptanceLevel() {
    Store::Get().Check("KernCtl::System::ModuleImpl::GetAcceptanceLevel");
    return Data().acceptance;
}

bool ModuleImpl::GetEnabled() {
    Store::Get().Check("KernCtl::System::ModuleImpl::GetEnabled");
    return Data().enabled;
}

void ModuleImpl::SetEnabled(bool enabled) {
    auto& store = Store::Get();
    store.Check("KernCtl::System::ModuleImpl::SetEnabled");
    store.Write([&] {
        const auto module = Modules::Resolve(store, name_);
        if (!module) throw NotFound(name_);
        store.Prepare("UPDATE modules SET enabled = ? WHERE name = ?")
            .Bind(1, enabled)
            .Bind(2, *module)
            .Run();
        store.JournalCall("KernCtl::System::ModuleImpl::SetEnabled", {name_, enabled});
    });
    if (record_) record_->enabled = enabled;
}

void ModuleImpl::Load(const std::string& parameters, bool force) {
    auto& store = Store::Get();
    store.Check("KernCtl::System::ModuleImpl::Load");
    store.Write([&] {
        const auto module = Modules::Resolve(store, name_);
        const auto record = module ? FindRecord(store, *module) : nullptr;
        if (!record) {
            throw HostCtlException("Unable to load module '" + CmdKit::MessageExcerpt(name_) +
                                   "': no module file found in /usr/lib/brix/kmod");
        }
        if (record->loaded)
            throw HostCtlException("Module '" + record->name + "' is already loaded");
        if (!record->enabled && !force) {
            throw HostCtlException("Module '" + record->name + "' is disabled");
        }
        auto required = store.Prepare(
            "SELECT namespace, versions FROM module_requires WHERE module = ? ORDER BY seq");
        required.Bind(1, record->name);
        while (required.Step()) {
            const auto ns = required.Text(0);
            if (!Provided(store, ns, Modules::SplitVersions(required.Text(1)))) {
                throw HostCtlException("Unable to load module '" + record->name +
                                       "': required namespace " + ns + "@" + required.Text(1) +
                                       " is not provided by any loaded module");
            }
        }
        // The module receives the given parameters, or else its configured ones.
        Modules::ParseParameters(parameters.empty() ? ReadOptions(store, record->name)
                                                    : parameters);
        store.Prepare("UPDATE modules SET loaded = 1 WHERE name = ?").Bind(1, record->name).Run();
        store.JournalCall("KernCtl::System::ModuleImpl::Load", {name_, parameters, force});
    });
    if (record_) record_->loaded = true;
}

std::vector<HostCtl::System::ModuleParam> ModuleImpl::GetParameters() {
    auto& store = Store::Get();
    store.Check("KernCtl::System::ModuleImpl::GetParameters");
    std::vector<HostCtl::System::ModuleParam> parameters;
    const auto module = Modules::Resolve(store, name_);
    if (!module) return parameters;
    auto row = store.Prepare(
        "SELECT name, type, description FROM module_params WHERE module = ? ORDER BY seq");
    row.Bind(1, *module);
    while (row.Step()) parameters.push_back({row.Text(0), row.Text(1), row.Text(2)});
    return parameters;
}

std::map<std::string, std::string> ModuleImpl::GetOptions() {
    auto& store = Store::Get();
    store.Check("KernCtl::System::ModuleImpl::GetOptions");
    const auto owner = Modules::Resolve(store, name_).value_or(name_);
    std::map<std::string, std::string> options;
    for (const auto& pair : Modules::ParseParameters(ReadOptions(store, owner))) {
        options[pair.key] = Modules::Unquote(pair.raw);
    }
    return options;
}

void ModuleImpl::SetParameterString(const std::string& parameters, bool force) {
    auto& store = Store::Get();
    store.Check("KernCtl::System::ModuleImpl::SetParameterString");
    const auto pairs = Modules::ParseParameters(parameters);
    store.Write([&] {
        WriteOptions(store, OptionsOwner(store, name_, force), Modules::JoinParameters(pairs));
        store.JournalCall("KernCtl::System::ModuleImpl::SetParameterString",
                          {name_, parameters, force});
    });
}

void ModuleImpl::AppendParameterString(const std::string& parameters, bool force) {
    auto& store = Store::Get();
    store.Check("KernCtl::System::ModuleImpl::AppendParameterString");
    const auto added = Modules::ParseParameters(parameters);
    store.Write([&] {
        const auto owner = OptionsOwner(store, name_, force);
        auto pairs = Modules::ParseParameters(ReadOptions(store, owner));
        pairs.insert(pairs.end(), added.begin(), added.end());
        WriteOptions(store, owner, Modules::JoinParameters(pairs));
        store.JournalCall("KernCtl::System::ModuleImpl::AppendParameterString",
                          {name_, parameters, force});
    });
}

void ModuleImpl::CopyParameters(const std::string& source, const std::vector<std::string>& keys,
                                bool force) {
    auto& store = Store::Get();
    store.Check("KernCtl::System::ModuleImpl::CopyParameters");
    store.Write([&] {
        const auto target = Modules::Resolve(store, name_);
        if (!target) throw NotFound(name_);
        const auto from =
            Modules::ParseParameters(ReadOptions(store, OptionsOwner(store, source, force)));
        auto pairs = Modules::ParseParameters(ReadOptions(store, *target));
        for (const auto& key : keys) {
            // The value the source module gets: the last one given for the key.
            const auto found = std::find_if(from.rbegin(), from.rend(),
                                            [&](const auto& pair) { return pair.key == key; });
            if (found == from.rend()) {
                throw HostCtlException("Parameter '" + CmdKit::MessageExcerpt(key) +
                                       "' is not configured for module '" +
                                       CmdKit::MessageExcerpt(source) + "'");
            }
            const auto place = std::find_if(pairs.begin(), pairs.end(),
                                            [&](const auto& pair) { return pair.key == key; });
            if (place == pairs.end()) {
                pairs.push_back(*found);
            } else {
                *place = *found;
                pairs.erase(std::remove_if(std::next(place), pairs.end(),
                                           [&](const auto& pair) { return pair.key == key; }),
                            pairs.end());
            }
        }
        WriteOptions(store, *target, Modules::JoinParameters(pairs));
        store.JournalCall("KernCtl::System::ModuleImpl::CopyParameters",
                          {source, name_, keys, force});
    });
}

std::vector<std::unique_ptr<HostCtl::System::Module>> SystemInfoImpl::GetModules() {
    auto& store = Store::Get();
    store.Check("KernCtl::System::SystemInfoImpl::GetModules");
    auto row = store.Prepare(std::string("SELECT ") + Modules::kRecordColumns +
                             " FROM modules ORDER BY seq");
    std::vector<std::unique_ptr<HostCtl::System::Module>> modules;
    while (row.Step()) modules.push_back(std::make_unique<ModuleImpl>(Modules::ReadRecord(row)));
    return modules;
}

std::unique_ptr<HostCtl::System::Module> SystemInfoImpl::GetModuleByName(const std::string& name) {
    auto& store = Store::Get();
    store.Check("KernCtl::System::SystemInfoImpl::GetModuleByName");
    auto record = FindRecord(store, name);
    if (!record) return nullptr;
    return std::make_unique<ModuleImpl>(std::move(record));
}

}  // namespace KernCtl::System

namespace HostCtl::System {

std::unique_ptr<Module> SystemInfo::GetModule(const std::string& name) {
    BrixSim::Store::Get().Check("HostCtl::System::SystemInfo::GetModule");
    return std::make_unique<KernCtl::System::ModuleImpl>(name);
}

}  // namespace HostCtl::System

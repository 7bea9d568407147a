// Kernel modules: metadata, enable state, loading and load-time parameters.
#include <algorithm>
#include <string>
#include <vector>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "hostctl/SystemInfo.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"
#include "hostsim/modules/ModuleStore.h"
#include "kernctl/Module.h"
#include "kernctl/SystemInfoImpl.h"

using BrixSim::Store;
using HostCtl::Lib::HostCtlException;
namespace Modules = BrixSim::Modules;

namespace {

const BrixSim::Operation kGetModule{"HostCtl::System::SystemInfo::GetModule"};
const BrixSim::Operation kAppendParameterString{
    "KernCtl::System::ModuleImpl::AppendParameterString"};
const BrixSim::Operation kCopyParameters{"KernCtl::System::ModuleImpl::CopyParameters"};
const BrixSim::Operation kGetAcceptanceLevel{"KernCtl::System::ModuleImpl::GetAcceptanceLevel"};
const BrixSim::Operation kGetBuildType{"KernCtl::System::ModuleImpl::GetBuildType"};
const BrixSim::Operation kGetContainingPackage{"KernCtl::System::ModuleImpl::GetContainingPackage"};
const BrixSim::Operation kGetEnabled{"KernCtl::System::ModuleImpl::GetEnabled"};
const BrixSim::Operation kGetFileVersion{"KernCtl::System::ModuleImpl::GetFileVersion"};
const BrixSim::Operation kGetLicense{"KernCtl::System::ModuleImpl::GetLicense"};
const BrixSim::Operation kGetModuleFile{"KernCtl::System::ModuleImpl::GetModuleFile"};
const BrixSim::Operation kGetName{"KernCtl::System::ModuleImpl::GetName"};
const BrixSim::Operation kGetOptions{"KernCtl::System::ModuleImpl::GetOptions"};
const BrixSim::Operation kGetParameters{"KernCtl::System::ModuleImpl::GetParameters"};
const BrixSim::Operation kGetProvidedNamespace{"KernCtl::System::ModuleImpl::GetProvidedNamespace"};
const BrixSim::Operation kGetRequiredNamespaces{
    "KernCtl::System::ModuleImpl::GetRequiredNamespaces"};
const BrixSim::Operation kGetVersion{"KernCtl::System::ModuleImpl::GetVersion"};
const BrixSim::Operation kIsEnabled{"KernCtl::System::ModuleImpl::IsEnabled"};
const BrixSim::Operation kIsLoaded{"KernCtl::System::ModuleImpl::IsLoaded"};
const BrixSim::Operation kIsValidName{"KernCtl::System::ModuleImpl::IsValidName"};
const BrixSim::Operation kLoad{"KernCtl::System::ModuleImpl::Load"};
const BrixSim::Operation kSetEnabled{"KernCtl::System::ModuleImpl::SetEnabled"};
const BrixSim::Operation kSetParameterString{"KernCtl::System::ModuleImpl::SetParameterString"};
const BrixSim::Operation kGetModuleByName{"KernCtl::System::SystemInfoImpl::GetModuleByName"};
const BrixSim::Operation kGetModules{"KernCtl::System::SystemInfoImpl::GetModules"};

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
    store.Check(kIsValidName);
    return Modules::IsModule(store, name);
}

std::string ModuleImpl::GetName() {
    Store::Get().Check(kGetName);
    return Data().name;
}

bool ModuleImpl::IsLoaded() {
    Store::Get().Check(kIsLoaded);
    return Data().loaded;
}

std::string ModuleImpl::GetVersion() {
    Store::Get().Check(kGetVersion);
    return Data().version;
}

bool ModuleImpl::IsEnabled() {
    Store::Get().Check(kIsEnabled);
    return Data().enabled;
}

HostCtl::System::ModuleNamespace ModuleImpl::GetProvidedNamespace() {
    Store::Get().Check(kGetProvidedNamespace);
    return {Data().provides, Modules::SplitVersions(Data().providesVersions)};
}

std::string ModuleImpl::GetFileVersion() {
    Store::Get().Check(kGetFileVersion);
    return Data().fileVersion;
}

std::string ModuleImpl::GetLicense() {
    Store::Get().Check(kGetLicense);
    return Data().license;
}

std::vector<HostCtl::System::ModuleNamespace> ModuleImpl::GetRequiredNamespaces() {
    auto& store = Store::Get();
    store.Check(kGetRequiredNamespaces);
    auto row = store.Prepare(
        "SELECT namespace, versions FROM module_requires WHERE module = ? ORDER BY seq");
    row.Bind(1, Data().name);
    std::vector<HostCtl::System::ModuleNamespace> namespaces;
    while (row.Step()) namespaces.push_back({row.Text(0), Modules::SplitVersions(row.Text(1))});
    return namespaces;
}

std::string ModuleImpl::GetModuleFile() {
    Store::Get().Check(kGetModuleFile);
    return Data().file;
}

std::string ModuleImpl::GetBuildType() {
    Store::Get().Check(kGetBuildType);
    return Data().buildType;
}

std::string ModuleImpl::GetContainingPackage() {
    Store::Get().Check(kGetContainingPackage);
    return Data().package;
}

std::string ModuleImpl::GetAcceptanceLevel() {
    Store::Get().Check(kGetAcceptanceLevel);
    return Data().acceptance;
}

bool ModuleImpl::GetEnabled() {
    Store::Get().Check(kGetEnabled);
    return Data().enabled;
}

void ModuleImpl::SetEnabled(bool enabled) {
    auto& store = Store::Get();
    store.Check(kSetEnabled);
    store.Write([&] {
        const auto module = Modules::Resolve(store, name_);
        if (!module) throw NotFound(name_);
        store.Prepare("UPDATE modules SET enabled = ? WHERE name = ?")
            .Bind(1, enabled)
            .Bind(2, *module)
            .Run();
        store.JournalCall(kSetEnabled, {name_, enabled});
    });
    if (record_) record_->enabled = enabled;
}

void ModuleImpl::Load(const std::string& parameters, bool force) {
    auto& store = Store::Get();
    store.Check(kLoad);
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
        store.JournalCall(kLoad, {name_, parameters, force});
    });
    if (record_) record_->loaded = true;
}

std::vector<HostCtl::System::ModuleParam> ModuleImpl::GetParameters() {
    auto& store = Store::Get();
    store.Check(kGetParameters);
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
    store.Check(kGetOptions);
    const auto owner = Modules::Resolve(store, name_).value_or(name_);
    std::map<std::string, std::string> options;
    for (const auto& pair : Modules::ParseParameters(ReadOptions(store, owner))) {
        options[pair.key] = Modules::Unquote(pair.raw);
    }
    return options;
}

void ModuleImpl::SetParameterString(const std::string& parameters, bool force) {
    auto& store = Store::Get();
    store.Check(kSetParameterString);
    const auto pairs = Modules::ParseParameters(parameters);
    store.Write([&] {
        WriteOptions(store, OptionsOwner(store, name_, force), Modules::JoinParameters(pairs));
        store.JournalCall(kSetParameterString, {name_, parameters, force});
    });
}

void ModuleImpl::AppendParameterString(const std::string& parameters, bool force) {
    auto& store = Store::Get();
    store.Check(kAppendParameterString);
    const auto added = Modules::ParseParameters(parameters);
    store.Write([&] {
        const auto owner = OptionsOwner(store, name_, force);
        auto pairs = Modules::ParseParameters(ReadOptions(store, owner));
        pairs.insert(pairs.end(), added.begin(), added.end());
        WriteOptions(store, owner, Modules::JoinParameters(pairs));
        store.JournalCall(kAppendParameterString, {name_, parameters, force});
    });
}

void ModuleImpl::CopyParameters(const std::string& source, const std::vector<std::string>& keys,
                                bool force) {
    auto& store = Store::Get();
    store.Check(kCopyParameters);
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
        store.JournalCall(kCopyParameters, {source, name_, keys, force});
    });
}

namespace {

// One module record at a time, all in the read transaction the list holds.
class ModuleListImpl final : public HostCtl::System::ModuleList {
  public:
    ModuleListImpl() : hold_(Store::Get()) {}

    void Each(const std::function<void(HostCtl::System::Module&)>& module) override {
        auto row = Store::Get().Prepare(std::string("SELECT ") + Modules::kRecordColumns +
                                        " FROM modules ORDER BY seq");
        while (row.Step()) {
            ModuleImpl current(Modules::ReadRecord(row));
            module(current);
        }
    }

  private:
    Store::ReadHold hold_;
};

}  // namespace

std::shared_ptr<HostCtl::System::ModuleList> SystemInfoImpl::GetModules() {
    Store::Get().Check(kGetModules);
    return std::make_shared<ModuleListImpl>();
}

std::unique_ptr<HostCtl::System::Module> SystemInfoImpl::GetModuleByName(const std::string& name) {
    auto& store = Store::Get();
    store.Check(kGetModuleByName);
    auto record = FindRecord(store, name);
    if (!record) return nullptr;
    return std::make_unique<ModuleImpl>(std::move(record));
}

}  // namespace KernCtl::System

namespace HostCtl::System {

std::unique_ptr<Module> SystemInfo::GetModule(const std::string& name) {
    BrixSim::Store::Get().Check(kGetModule);
    return std::make_unique<KernCtl::System::ModuleImpl>(name);
}

}  // namespace HostCtl::System

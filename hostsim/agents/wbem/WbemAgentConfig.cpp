// The WBEM services' configuration: the CIM object manager (sfcbd), the WS-Management service
// (openwsmand) and the installed CIM providers. A configuration object reads the stored state
// once, collects changes, and Commit applies only what was changed, in one transaction, then
// restarts (or stops) the services so that the new configuration takes effect.
#include "hostctl/WbemAgentConfig.h"

#include <map>
#include <set>
#include <string>
#include <vector>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "hostctl/SystemInfo.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"

namespace {

using BrixSim::Store;
using HostCtl::Lib::HostCtlException;
using HostCtl::System::ProviderInfo;

const BrixSim::Operation kGetConfig{"HostCtl::System::SystemInfo::GetWbemAgentConfig"};
const BrixSim::Operation kCommit{"HostCtl::System::WbemAgentConfig::Commit"};
const BrixSim::Operation kIsEnabled{"HostCtl::System::WbemAgentConfig::IsEnabled"};
const BrixSim::Operation kIsWsManEnabled{"HostCtl::System::WbemAgentConfig::IsWsManEnabled"};
const BrixSim::Operation kSetEnabled{"HostCtl::System::WbemAgentConfig::SetEnabled"};
const BrixSim::Operation kSetWsManEnabled{"HostCtl::System::WbemAgentConfig::SetWsManEnabled"};
const BrixSim::Operation kSetProviderEnabled{
    "HostCtl::System::WbemAgentConfig::SetProviderEnabled"};
const BrixSim::Operation kGetPort{"HostCtl::System::WbemAgentConfig::GetPort"};
const BrixSim::Operation kSetPort{"HostCtl::System::WbemAgentConfig::SetPort"};
const BrixSim::Operation kGetLogLevel{"HostCtl::System::WbemAgentConfig::GetLogLevel"};
const BrixSim::Operation kSetLogLevel{"HostCtl::System::WbemAgentConfig::SetLogLevel"};
const BrixSim::Operation kGetAuthModel{"HostCtl::System::WbemAgentConfig::GetAuthModel"};
const BrixSim::Operation kSetAuthModel{"HostCtl::System::WbemAgentConfig::SetAuthModel"};
const BrixSim::Operation kGetProviders{"HostCtl::System::WbemAgentConfig::GetProviders"};
const BrixSim::Operation kResetToDefaults{"HostCtl::System::WbemAgentConfig::ResetToDefaults"};

const std::set<std::string> kLogLevels = {"debug", "info", "warning", "error"};

struct Settings {
    bool enabled;
    bool wsman;
    int64_t port;
    std::string logLevel;
    int64_t authModel;
};

// The factory configuration: services stopped, WS-Management on, password authorization.
const Settings kDefaults = {false, true, 5989, "warning", HostCtl::System::WBEM_AUTH_PASSWORD};

struct Provider {
    std::string name;
    bool enabled;
    bool loaded;
    bool defaultEnabled;
};

// Columns of wbem_config, for the change list and the journal.
enum Column { kEnabled, kWsMan, kPort, kLogLevel, kAuthModel };
constexpr const char* kColumnNames[] = {"enabled", "wsman", "port", "log_level", "auth_model"};

void SeedWbem(Store& store) {
    // An administrator started the services; otherwise the factory configuration.
    store.Prepare("INSERT INTO wbem_config VALUES (1, 1, 1, 5989, 'warning', 1)").Run();
    struct SeedProvider {
        const char* name;
        bool enabled;
        bool defaultEnabled;
        bool preload;
    };
    // Hardware and base providers from the platform, two from hardware vendors.
    const SeedProvider providers[] = {
        {"brix_hwinventory", true, true, true},  {"brix_sensors", true, true, true},
        {"brix_software", true, true, false},    {"brix_storage", true, true, false},
        {"brix_network", true, true, false},     {"brix_powermgmt", false, false, false},
        {"kestrelnet_nicfw", true, true, false}, {"tamsin_raidmon", false, true, false},
    };
    auto insert = store.Prepare(
        "INSERT INTO wbem_providers (position, name, enabled, loaded, default_enabled, preload) "
        "VALUES (?, ?, ?, ?, ?, ?)");
    int position = 1;
    for (const auto& provider : providers) {
        // Right after the services started, only the preloaded providers are loaded.
        insert.Bind(1, position++)
            .Bind(2, provider.name)
            .Bind(3, provider.enabled)
            .Bind(4, provider.enabled && provider.preload)
            .Bind(5, provider.defaultEnabled)
            .Bind(6, provider.preload)
            .Run();
        insert.Reset();
    }
}

const bool registered = [] {
    return BrixSim::RegisterTables({
        "wbem",
        "CREATE TABLE IF NOT EXISTS wbem_config ("
        " id INTEGER PRIMARY KEY CHECK (id = 1),"
        " enabled INTEGER NOT NULL,"
        " wsman INTEGER NOT NULL,"
        " port INTEGER NOT NULL,"
        " log_level TEXT NOT NULL,"
        " auth_model INTEGER NOT NULL);"  // 0 not supported, 1 password, 2 certificate
        "CREATE TABLE IF NOT EXISTS wbem_providers ("
        " position INTEGER PRIMARY KEY,"  // the order in which the providers are listed
        " name TEXT NOT NULL UNIQUE,"
        " enabled INTEGER NOT NULL,"
        " loaded INTEGER NOT NULL,"
        " default_enabled INTEGER NOT NULL,"
        " preload INTEGER NOT NULL);",  // loaded when the services start, not on first use
        SeedWbem,
    });
}();

Settings ReadSettings(Store& store) {
    auto row = store.Prepare(
        "SELECT enabled, wsman, port, log_level, auth_model FROM wbem_config WHERE id = 1");
    if (!row.Step()) return kDefaults;
    return {row.Int(0) != 0, row.Int(1) != 0, row.Int(2), row.Text(3), row.Int(4)};
}

std::vector<Provider> ReadProviders(Store& store) {
    std::vector<Provider> providers;
    auto row = store.Prepare(
        "SELECT name, enabled, loaded, default_enabled FROM wbem_providers ORDER BY position");
    while (row.Step()) {
        providers.push_back({row.Text(0), row.Int(1) != 0, row.Int(2) != 0, row.Int(3) != 0});
    }
    return providers;
}

std::string BoolText(bool value) {
    return value ? "true" : "false";
}

void JournalService(Store& store, const char* service, const char* action) {
    store.Journal(
        "exec", {{"argv", std::vector<std::string>{std::string("/etc/init.d/") + service, action}},
                 {"user", std::string("root")},
                 {"status", int64_t{0}}});
}

class WbemAgentConfigImpl final : public HostCtl::System::WbemAgentConfig {
  public:
    WbemAgentConfigImpl(Settings settings, std::vector<Provider> providers)
        : settings_(std::move(settings)), providers_(std::move(providers)) {}

    void Commit() override {
        auto& store = Store::Get();
        store.Check(kCommit);
        store.Write([&] {
            std::vector<std::string> changes;
            if (reset_) changes.push_back("reset");
            store.Exec("INSERT OR IGNORE INTO wbem_config VALUES (1, 0, 1, 5989, 'warning', 1)");
            for (const Column column : changed_) {
                auto update = store.Prepare(std::string("UPDATE wbem_config SET ") +
                                            kColumnNames[column] + " = ? WHERE id = 1");
                const std::string text = Bind(update, column);
                update.Run();
                changes.push_back(std::string(kColumnNames[column]) + "=" + text);
            }
            for (const auto& [name, enabled] : providerChanges_) {
                store.Prepare("UPDATE wbem_providers SET enabled = ? WHERE name = ?")
                    .Bind(1, enabled)
                    .Bind(2, name)
                    .Run();
                changes.push_back("provider " + name + "=" + BoolText(enabled));
            }
            // Applying the configuration restarts the services: right afterwards only the
            // preloaded providers are loaded, and none while the services are stopped.
            const Settings stored = ReadSettings(store);
            store
                .Prepare("UPDATE wbem_providers SET loaded = (enabled != 0 AND preload != 0 AND ?)")
                .Bind(1, stored.enabled)
                .Run();
            store.JournalCall(kCommit, std::vector<BrixSim::Value>(changes.begin(), changes.end()));
            JournalService(store, "sfcbd", stored.enabled ? "restart" : "stop");
            JournalService(store, "openwsmand",
                           stored.enabled && stored.wsman ? "restart" : "stop");
            settings_ = stored;
            providers_ = ReadProviders(store);
        });
        changed_.clear();
        providerChanges_.clear();
        reset_ = false;
    }

    bool IsEnabled() override {
        Store::Get().Check(kIsEnabled);
        return settings_.enabled;
    }

    bool IsWsManEnabled() override {
        Store::Get().Check(kIsWsManEnabled);
        return settings_.wsman;
    }

    void SetEnabled(bool enabled) override {
        Store::Get().Check(kSetEnabled);
        settings_.enabled = enabled;
        changed_.insert(kEnabled);
    }

    void SetWsManEnabled(bool enabled) override {
        Store::Get().Check(kSetWsManEnabled);
        settings_.wsman = enabled;
        changed_.insert(kWsMan);
    }

    void SetProviderEnabled(const std::string& name, bool enabled) override {
        Store::Get().Check(kSetProviderEnabled);
        for (auto& provider : providers_) {
            if (provider.name != name) continue;
            provider.enabled = enabled;
            providerChanges_[name] = enabled;
            return;
        }
        throw HostCtlException("Provider '" + CmdKit::MessageExcerpt(name) + "' is not installed");
    }

    int GetPort() override {
        Store::Get().Check(kGetPort);
        return static_cast<int>(settings_.port);
    }

    void SetPort(int port) override {
        Store::Get().Check(kSetPort);
        if (port < 0 || port > 65535) {
            throw HostCtlException("Invalid port " + std::to_string(port));
        }
        settings_.port = port;
        changed_.insert(kPort);
    }

    std::string GetLogLevel() override {
        Store::Get().Check(kGetLogLevel);
        return settings_.logLevel;
    }

    void SetLogLevel(const std::string& level) override {
        Store::Get().Check(kSetLogLevel);
        if (kLogLevels.count(level) == 0)
            throw HostCtlException("Invalid log level '" + CmdKit::MessageExcerpt(level) + "'");
        settings_.logLevel = level;
        changed_.insert(kLogLevel);
    }

    int GetAuthModel() override {
        Store::Get().Check(kGetAuthModel);
        return static_cast<int>(settings_.authModel);
    }

    void SetAuthModel(int model) override {
        Store::Get().Check(kSetAuthModel);
        if (model != HostCtl::System::WBEM_AUTH_PASSWORD &&
            model != HostCtl::System::WBEM_AUTH_CERTIFICATE) {
            throw HostCtlException("Invalid authorization model " + std::to_string(model));
        }
        settings_.authModel = model;
        changed_.insert(kAuthModel);
    }

    std::vector<ProviderInfo> GetProviders() override {
        Store::Get().Check(kGetProviders);
        std::vector<ProviderInfo> list;
        list.reserve(providers_.size());
        for (const auto& provider : providers_) {
            list.push_back({provider.name, provider.enabled, provider.loaded});
        }
        return list;
    }

    void ResetToDefaults() override {
        Store::Get().Check(kResetToDefaults);
        settings_ = kDefaults;
        changed_ = {kEnabled, kWsMan, kPort, kLogLevel, kAuthModel};
        for (auto& provider : providers_) {
            provider.enabled = provider.defaultEnabled;
            providerChanges_[provider.name] = provider.defaultEnabled;
        }
        reset_ = true;
    }

  private:
    // Binds the pending value of `column` to parameter 1; returns it as text for the journal.
    std::string Bind(BrixSim::Stmt& update, Column column) const {
        switch (column) {
            case kEnabled:
                update.Bind(1, settings_.enabled);
                return BoolText(settings_.enabled);
            case kWsMan:
                update.Bind(1, settings_.wsman);
                return BoolText(settings_.wsman);
            case kPort:
                update.Bind(1, settings_.port);
                return std::to_string(settings_.port);
            case kLogLevel:
                update.Bind(1, settings_.logLevel);
                return settings_.logLevel;
            case kAuthModel:
                update.Bind(1, settings_.authModel);
                return std::to_string(settings_.authModel);
        }
        return {};
    }

    Settings settings_;
    std::vector<Provider> providers_;
    std::set<Column> changed_;
    std::map<std::string, bool> providerChanges_;
    bool reset_ = false;
};

}  // namespace

namespace HostCtl::System {

WbemAgentConfig::~WbemAgentConfig() = default;

std::unique_ptr<WbemAgentConfig> SystemInfo::GetWbemAgentConfig() {
    auto& store = Store::Get();
    store.Check(kGetConfig);
    return std::make_unique<WbemAgentConfigImpl>(ReadSettings(store), ReadProviders(store));
}

}  // namespace HostCtl::System

// The SNMP agent's configuration store: "/etc/ostrel/snmp.xml" under the host root, read with
// pugixml and replaced atomically under an exclusive lock, applying only the settings this object
// changed to what is stored at that moment. The agent's boot state ("/var/tmp/snmp_boot.txt")
// gives the engine boots of its SNMPv3 notifications.
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cctype>
#include <cerrno>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <optional>
#include <sstream>

#include "hostctl/HostCtlException.h"
#include "hostctl/SnmpAgent.h"
#include "hostsim/agents/snmp/SnmpNotifier.h"
#include "hostsim/agents/snmp/SnmpSettings.h"
#include "hostsim/agents/snmp/UsmKeys.h"
#include "hostsim/core/DurableWrite.h"
#include "hostsim/core/Hooks.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"

namespace {

namespace fs = std::filesystem;
namespace Snmp = BrixSim::Snmp;
using BrixSim::Store;
using HostCtl::Lib::HostCtlException;

constexpr const char* kConfigPath = "/etc/ostrel/snmp.xml";
constexpr const char* kLockPath = "/etc/ostrel/.snmp.xml.lock";
constexpr const char* kBootPath = "/var/tmp/snmp_boot.txt";
constexpr const char* kNotValid =
    "The SNMP agent configuration /etc/ostrel/snmp.xml is not valid xml: repair it, or replace "
    "it with 'system snmp set --reset'.";

const BrixSim::Operation kFactory{"HostCtl::System::SnmpAgentConfigFactory"};
const BrixSim::Operation kCommit{"HostCtl::System::SnmpAgentConfig::Commit"};
const BrixSim::Operation kIsEnabled{"HostCtl::System::SnmpAgentConfig::IsEnabled"};
const BrixSim::Operation kSetEnabled{"HostCtl::System::SnmpAgentConfig::SetEnabled"};
const BrixSim::Operation kGetPort{"HostCtl::System::SnmpAgentConfig::GetPort"};
const BrixSim::Operation kSetPort{"HostCtl::System::SnmpAgentConfig::SetPort"};
const BrixSim::Operation kGetCommunities{"HostCtl::System::SnmpAgentConfig::GetCommunities"};
const BrixSim::Operation kSetCommunities{"HostCtl::System::SnmpAgentConfig::SetCommunities"};
const BrixSim::Operation kGetTargets{"HostCtl::System::SnmpAgentConfig::GetTargets"};
const BrixSim::Operation kSetTargets{"HostCtl::System::SnmpAgentConfig::SetTargets"};
const BrixSim::Operation kGetOptions{"HostCtl::System::SnmpAgentConfig::GetOptions"};
const BrixSim::Operation kSetOptions{"HostCtl::System::SnmpAgentConfig::SetOptions"};
const BrixSim::Operation kResetToDefaults{"HostCtl::System::SnmpAgentConfig::ResetToDefaults"};
const BrixSim::Operation kSendWarmStart{"HostCtl::System::SnmpAgentConfig::SendWarmStart"};
const BrixSim::Operation kTestUser{"HostCtl::System::SnmpAgentConfig::TestUser"};
const BrixSim::Operation kGenerateLocalizedHashes{
    "HostCtl::System::SnmpAgentConfig::GenerateLocalizedHashes"};
const BrixSim::Operation kGetV3Targets{"HostCtl::System::SnmpAgentConfig::GetV3Targets"};
const BrixSim::Operation kLoad{"HostCtl::System::SnmpAgentConfig::Load"};
const BrixSim::Operation kGetUsers{"HostCtl::System::SnmpAgentConfig::GetUsers"};
const BrixSim::Operation kSetUsers{"HostCtl::System::SnmpAgentConfig::SetUsers"};
const BrixSim::Operation kGetRemoteUsers{"HostCtl::System::SnmpAgentConfig::GetRemoteUsers"};
const BrixSim::Operation kSetRemoteUsers{"HostCtl::System::SnmpAgentConfig::SetRemoteUsers"};
const BrixSim::Operation kGetLargeStorage{"HostCtl::System::SnmpAgentConfig::GetLargeStorage"};
const BrixSim::Operation kSetLargeStorage{"HostCtl::System::SnmpAgentConfig::SetLargeStorage"};
const BrixSim::Operation kSetV3Targets{"HostCtl::System::SnmpAgentConfig::SetV3Targets"};

// The engine id of an agent without a stored one: RFC 3411 text format under the vendor's
// enterprise number (47077), the text being the tail of the host's UUID, so that the whole id
// fits the 32 hexadecimal digits that settings take.
constexpr char kEnterpriseTextPrefix[] = {'\x80', '\x00', '\xb7', '\xe5', '\x04'};
constexpr size_t kEngineTextLength = 11;

[[noreturn]] void SystemFailure(const std::string& what) {
    throw HostCtlException(what + ": " + std::strerror(errno));
}

fs::path HostFile(Store& store, const char* hostPath) {
    const auto path = store.Resolve(hostPath);
    if (!path) throw HostCtlException(std::string("Host path ") + hostPath + " is not accessible.");
    return *path;
}

// A file of the agent, through the host's one durable write; its failures are the agent's.
class AgentFile {
  public:
    AgentFile(const fs::path& target, const std::string& content, mode_t mode) {
        std::error_code ignored;
        fs::create_directories(target.parent_path(), ignored);
        AsAgentError([&] { staged_.emplace(target, content, mode); });
    }
    void Publish() {
        AsAgentError([&] { staged_->Publish(); });
    }

  private:
    template <class Work>
    static void AsAgentError(Work&& work) {
        try {
            work();
        } catch (const std::system_error& error) {
            std::string message = error.what();
            message[0] = static_cast<char>(std::toupper(static_cast<unsigned char>(message[0])));
            throw HostCtlException(message);
        }
    }

    std::optional<BrixSim::StagedFile> staged_;
};

// Held while a writer reads, merges and replaces the configuration file.
class ExclusiveLock {
  public:
    explicit ExclusiveLock(const fs::path& path) {
        std::error_code ignored;
        fs::create_directories(path.parent_path(), ignored);
        fd_ = BrixSim::Fd(open(path.c_str(), O_RDWR | O_CREAT | O_NOFOLLOW | O_CLOEXEC, 0600));
        if (!fd_) SystemFailure("Cannot lock " + std::string(kConfigPath));
        while (flock(fd_.Get(), LOCK_EX) != 0) {
            if (errno != EINTR) SystemFailure("Cannot lock " + std::string(kConfigPath));
        }
    }

  private:
    BrixSim::Fd fd_;
};

struct Stored {
    bool exists = false;
    bool wellFormed = true;
    Snmp::Settings settings = Snmp::FactoryDefaults();
};

Stored ReadStored(Store& store) {
    const fs::path path = HostFile(store, kConfigPath);
    Stored stored;
    std::ifstream in(path, std::ios::binary);
    if (!in) {
        if (errno == ENOENT) return stored;  // a host without the file has the defaults
        SystemFailure(std::string("Cannot read ") + kConfigPath);
    }
    std::ostringstream text;
    text << in.rdbuf();
    stored.exists = true;
    auto parsed = Snmp::ParseSettings(text.str());
    stored.wellFormed = parsed.has_value();
    if (parsed) stored.settings = std::move(*parsed);
    return stored;
}

std::string DefaultEngineId(Store& store) {
    std::string hex;
    for (const char c : store.GetValue("system.uuid", "")) {
        if (std::isxdigit(static_cast<unsigned char>(c))) {
            hex += static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
        }
    }
    if (hex.size() > kEngineTextLength) hex.erase(0, hex.size() - kEngineTextLength);
    if (hex.empty()) hex = "brixhost";
    return std::string(kEnterpriseTextPrefix, sizeof kEnterpriseTextPrefix) + hex;
}

// Engine boots and the time since the agent's boot, from its boot state; a missing boot state
// (a new engine id) starts over at boot 1.
void ReadBootState(Store& store, Snmp::AgentState& agent) {
    const fs::path path = HostFile(store, kBootPath);
    std::ifstream in(path);
    std::string word;
    long long boots = 0;
    while (in >> word) {
        if (word == "engineBoots" && in >> boots) break;
    }
    if (!in.is_open()) {
        boots = 1;
        AgentFile(path, "engineBoots 1\n", 0644).Publish();
    }
    agent.engineBoots = static_cast<uint32_t>(std::clamp<long long>(boots, 1, 2147483647));
    struct stat info {};
    const time_t now = time(nullptr);
    const time_t since = stat(path.c_str(), &info) == 0 ? now - info.st_mtime : 0;
    agent.engineTime = static_cast<uint32_t>(std::clamp<time_t>(since, 0, 2147483647));
    agent.upTime = static_cast<uint32_t>(static_cast<uint64_t>(agent.engineTime) * 100);
}

std::string Join(const std::vector<std::string>& parts, const char* separator) {
    std::string joined;
    for (const auto& part : parts) {
        if (!joined.empty()) joined += separator;
        joined += part;
    }
    return joined;
}

// Brings the settings that differ between `base` and `current` into `next`, naming each.
void ApplyChanges(const Snmp::Settings& base, const Snmp::Settings& current, Snmp::Settings& next,
                  std::vector<std::string>& changes) {
    auto field = [&](const char* name, const auto& from, const auto& to, auto& into) {
        if (from != to) {
            into = to;
            changes.emplace_back(name);
        }
    };
    field("enable", base.enabled, current.enabled, next.enabled);
    field("port", base.port, current.port, next.port);
    field("communities", base.communities, current.communities, next.communities);
    field("targets", base.targets, current.targets, next.targets);
    std::map<std::string, std::string> keys = base.options;
    keys.insert(current.options.begin(), current.options.end());
    for (const auto& [key, unused] : keys) {
        const auto before = base.options.find(key);
        const auto after = current.options.find(key);
        const bool hadIt = before != base.options.end();
        const bool hasIt = after != current.options.end();
        if (hadIt == hasIt && (!hasIt || before->second == after->second)) continue;
        if (hasIt) {
            next.options[key] = after->second;
        } else {
            next.options.erase(key);
        }
        changes.push_back(key);
    }
    field("users", base.users, current.users, next.users);
    field("remote-users", base.remoteUsers, current.remoteUsers, next.remoteUsers);
    field("v3targets", base.v3Targets, current.v3Targets, next.v3Targets);
    field("largestorage", base.largeStorage, current.largeStorage, next.largeStorage);
}

// The boot state belongs to the engine id: its removal, asked for before the commit that stores
// a new id, waits for that commit, so a set that fails keeps the boots of the id that stays.
// Within the commit the new configuration is published first: a crash between the two leaves
// the new id with the old count, which only makes receivers learn the boots again.
bool bootResetPending = false;

int HoldBootReset() {
    struct stat info {};
    if (stat(HostFile(Store::Get(), kBootPath).c_str(), &info) != 0) return errno;
    bootResetPending = true;
    return 0;
}

class AgentConfig final : public HostCtl::System::SnmpAgentConfig {
  public:
    AgentConfig() {
        bootResetPending = false;  // a removal asked for under an earlier object lapsed with it
        Reload();
    }

    void Commit() override {
        auto& store = Begin(kCommit);
        ExclusiveLock lock(HostFile(store, kLockPath));
        BrixSim::RemoveStaleTemporaries(HostFile(store, kConfigPath));
        const Stored stored = ReadStored(store);
        if (!stored.wellFormed && !reset_) throw HostCtlException(kNotValid);
        const Snmp::Settings base = reset_ ? Snmp::FactoryDefaults() : loaded_;
        Snmp::Settings next = reset_ ? Snmp::FactoryDefaults() : stored.settings;
        std::vector<std::string> changes;
        if (reset_) changes.emplace_back("reset");
        ApplyChanges(base, current_, next, changes);
        Snmp::CheckConsistency(next);

        std::optional<AgentFile> staged;
        if (!stored.exists || !stored.wellFormed || next != stored.settings) {
            staged.emplace(HostFile(store, kConfigPath), Snmp::FormatSettings(next), 0600);
        }
        store.Write([&] {
            store.JournalCall(kCommit, std::vector<BrixSim::Value>(changes.begin(), changes.end()));
            if (staged) staged->Publish();
            if (bootResetPending) ::unlink(HostFile(store, kBootPath).c_str());
            bootResetPending = false;
        });
        loaded_ = current_ = next;
        reset_ = false;
        valid_ = true;
    }

    bool IsEnabled() override {
        Read(kIsEnabled);
        return current_.enabled;
    }
    void SetEnabled(bool enabled) override {
        Begin(kSetEnabled);
        current_.enabled = enabled;
    }
    int GetPort() override {
        Read(kGetPort);
        return current_.port;
    }
    void SetPort(uint16_t port) override {
        Begin(kSetPort);
        if (port == 0)
            throw HostCtlException("The agent cannot be polled on port 0: use 1 - 65535.");
        current_.port = port;
    }
    std::vector<std::string> GetCommunities() override {
        Read(kGetCommunities);
        return current_.communities;
    }
    void SetCommunities(const std::vector<std::string>& communities) override {
        Begin(kSetCommunities);
        current_.communities = Snmp::CheckCommunities(communities);
    }
    std::vector<std::string> GetTargets() override {
        Read(kGetTargets);
        return current_.targets;
    }
    void SetTargets(const std::vector<std::string>& targets) override {
        Begin(kSetTargets);
        current_.targets = Snmp::CheckTargets(targets);
    }
    std::map<std::string, std::string> GetOptions() override {
        auto& store = Read(kGetOptions);
        auto options = current_.options;
        // The engine id in use, stored or not.
        options.emplace("engineid", Snmp::ToHex(EngineId(store)));
        return options;
    }
    void SetOptions(const std::map<std::string, std::string>& options) override {
        Begin(kSetOptions);
        auto next = current_.options;
        for (const auto& [key, value] : options) {
            if (auto stored = Snmp::CheckOption(key, value)) {
                next[key] = std::move(*stored);
            } else {
                next.erase(key);
            }
        }
        current_.options = std::move(next);
    }
    void ResetToDefaults() override {
        Begin(kResetToDefaults);
        current_ = Snmp::FactoryDefaults();
        reset_ = true;
    }

    int SendWarmStart(std::string reason) override {
        auto& store = Read(kSendWarmStart);
        Snmp::AgentState agent;
        agent.engineId = EngineId(store);
        ReadBootState(store, agent);
        const auto deliveries = Snmp::SendWarmStarts(current_, agent);
        std::vector<BrixSim::Value> sent{reason};
        std::vector<std::string> failures;
        for (const auto& delivery : deliveries) {
            if (delivery.error.empty()) {
                sent.emplace_back(delivery.what);
            } else {
                failures.push_back(delivery.what + ": " + delivery.error);
            }
        }
        store.Write([&] { store.JournalCall(kSendWarmStart, sent); });
        if (!failures.empty()) {
            throw HostCtlException(
                "warmStart could not be delivered to " + std::to_string(failures.size()) + " of " +
                std::to_string(deliveries.size()) + " targets: " + Join(failures, "; "));
        }
        return static_cast<int>(sent.size() - 1);
    }

    bool TestUser(const std::string& user, const std::string& authSecret,
                  const std::string& privSecret, std::string& verdict) override {
        auto& store = Read(kTestUser);
        return CheckUser(store, user, authSecret, privSecret, verdict);
    }

    bool GenerateLocalizedHashes(const std::string& authSecret, const std::string& privSecret,
                                 const std::string& authProtocol, const std::string& privProtocol,
                                 std::string& authHash, std::string& privHash,
                                 std::string& error) override {
        auto& store = Read(kGenerateLocalizedHashes);
        authHash.clear();
        privHash.clear();
        error.clear();
        const auto protocol = Snmp::ParseAuthProtocol(authProtocol);
        if (authProtocol == "none") {
            error =
                "The authentication protocol is none, so there is no key to localize: set "
                "--authentication MD5 or SHA1 first.";
        } else if (!protocol || authProtocol == "SHA") {
            error = "Unsupported authentication protocol '" + authProtocol + "': use MD5 or SHA1.";
        } else if (authSecret.size() < 8) {
            error = "The authentication secret is shorter than eight characters.";
        } else if (!privSecret.empty() && privProtocol == "none") {
            error =
                "The privacy protocol is none, so there is no privacy key to localize: set "
                "--privacy AES128 first.";
        } else if (!privSecret.empty() && privProtocol != "AES128") {
            error = "Unsupported privacy protocol '" + privProtocol + "': use AES128.";
        } else if (!privSecret.empty() && privSecret.size() < 8) {
            error = "The privacy secret is shorter than eight characters.";
        }
        if (!error.empty()) return false;
        const std::string engineId = EngineId(store);
        authHash = Snmp::ToHex(Snmp::LocalizedKey(*protocol, authSecret, engineId));
        if (!privSecret.empty()) {
            privHash =
                Snmp::ToHex(Snmp::LocalizedKey(*protocol, privSecret, engineId).substr(0, 16));
        }
        return true;
    }

    std::vector<std::string> GetV3Targets() override {
        Read(kGetV3Targets);
        return current_.v3Targets;
    }
    bool Load() override {
        Begin(kLoad);
        Reload();
        return valid_;
    }
    std::vector<std::string> GetUsers() override {
        Read(kGetUsers);
        return current_.users;
    }
    void SetUsers(const std::vector<std::string>& users) override {
        Begin(kSetUsers);
        current_.users = Snmp::CheckUsers(users);
    }
    std::vector<std::string> GetRemoteUsers() override {
        Read(kGetRemoteUsers);
        return current_.remoteUsers;
    }
    void SetRemoteUsers(const std::vector<std::string>& users) override {
        Begin(kSetRemoteUsers);
        current_.remoteUsers = Snmp::CheckRemoteUsers(users);
    }
    bool GetLargeStorage() override {
        Read(kGetLargeStorage);
        return current_.largeStorage;
    }
    void SetLargeStorage(bool enabled) override {
        Begin(kSetLargeStorage);
        current_.largeStorage = enabled;
    }
    void SetV3Targets(const std::vector<std::string>& targets) override {
        Begin(kSetV3Targets);
        current_.v3Targets = Snmp::CheckV3Targets(targets);
    }

  private:
    static Store& Begin(const BrixSim::Operation& operation) {
        auto& store = Store::Get();
        store.Check(operation);
        return store;
    }
    // As Begin, for an operation that needs readable stored settings.
    Store& Read(const BrixSim::Operation& operation) {
        auto& store = Begin(operation);
        if (!valid_ && !reset_) throw HostCtlException(kNotValid);
        return store;
    }

    void Reload() {
        const Stored stored = ReadStored(Store::Get());
        valid_ = stored.wellFormed;
        loaded_ = current_ = stored.settings;
        reset_ = false;
    }

    std::string EngineId(Store& store) const {
        const auto stored = current_.options.find("engineid");
        if (stored != current_.options.end()) {
            if (auto bytes = Snmp::FromHex(stored->second)) return *bytes;
        }
        return DefaultEngineId(store);
    }

    // The user's verdict: exists, and whether each given secret yields its stored key.
    bool CheckUser(Store& store, const std::string& name, const std::string& authSecret,
                   const std::string& privSecret, std::string& verdict) const {
        std::string authProtocol;
        std::string privProtocol;
        std::string authHash;
        std::string privHash;
        std::string engineId;
        std::string kind;
        for (const auto& entry : current_.users) {
            const auto user = Snmp::ParseLocalUser(entry);
            if (user.name != name) continue;
            const auto options = current_.options;
            auto option = [&](const char* key) {
                const auto found = options.find(key);
                return found == options.end() ? std::string() : found->second;
            };
            authProtocol = option("authentication");
            privProtocol = option("privacy") == "AES128" ? "AES" : "none";
            authHash = user.authHash;
            privHash = user.privHash;
            engineId = EngineId(store);
            kind = "User '" + name + "' exists (model " + user.model + ")";
        }
        for (const auto& entry : current_.remoteUsers) {
            if (!kind.empty()) break;
            const auto user = Snmp::ParseRemoteUser(entry);
            if (user.name != name) continue;
            authProtocol = user.authProtocol;
            privProtocol = user.privProtocol;
            authHash = user.authHash;
            privHash = user.privHash;
            engineId = Snmp::FromHex(user.engineId).value_or(std::string());
            kind = "Remote user '" + name + "' exists (engine id " + user.engineId + ")";
        }
        if (kind.empty()) {
            verdict =
                "User '" + name + "' is not configured: add it with 'system snmp set --users'.";
            return false;
        }

        bool passed = true;
        std::vector<std::string> findings;
        const auto protocol = Snmp::ParseAuthProtocol(authProtocol);
        auto check = [&](const char* what, const std::string& secret, const std::string& stored,
                         bool available, size_t keySize) {
            if (secret.empty()) return;
            std::string finding;
            if (!protocol) {
                finding = std::string(what) +
                          " secret cannot be checked: no authentication "
                          "protocol is set";
            } else if (!available) {
                finding = std::string(what) +
                          " secret cannot be checked: no privacy protocol "
                          "is set";
            } else if (stored.empty()) {
                finding = std::string("the user has no ") + what + " hash";
            } else {
                std::string key = Snmp::LocalizedKey(*protocol, secret, engineId);
                if (keySize != 0) key.resize(keySize);
                std::string expected = stored;
                for (char& c : expected)
                    c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
                if (keySize != 0) expected.resize(std::min(expected.size(), keySize * 2));
                if (Snmp::ToHex(key) == expected) {
                    findings.push_back(std::string(what) + " secret matches");
                    return;
                }
                finding = std::string(what) + " secret does not match the stored hash";
            }
            passed = false;
            findings.push_back(finding);
        };
        check("authentication", authSecret, authHash, true, 0);
        check("privacy", privSecret, privHash, privProtocol == "AES", 16);
        verdict = kind;
        if (!findings.empty()) verdict += ": " + Join(findings, "; ");
        verdict += ".";
        return passed;
    }

    Snmp::Settings loaded_;   // as read from the store
    Snmp::Settings current_;  // with this object's changes
    bool valid_ = true;
    bool reset_ = false;
};

void Seed(Store& store) {
    Snmp::Settings settings = Snmp::FactoryDefaults();
    settings.options["syslocation"] = "Lindenhall DC, hall 2, rack C14";
    settings.options["syscontact"] = "Brix operations <noc@lindenhall.example>";
    AgentFile(HostFile(store, kConfigPath), Snmp::FormatSettings(settings), 0600).Publish();
    AgentFile(HostFile(store, kBootPath), "engineBoots 7\n", 0644).Publish();
}

const bool registered = [] {
    BrixSim::RegisterHeldFile(kBootPath, HoldBootReset);
    return BrixSim::RegisterTables({"snmp", "", Seed});
}();

}  // namespace

namespace HostCtl::System {

std::unique_ptr<SnmpAgentConfig> SnmpAgentConfigFactory() {
    Store::Get().Check(kFactory);
    return std::make_unique<AgentConfig>();
}

}  // namespace HostCtl::System

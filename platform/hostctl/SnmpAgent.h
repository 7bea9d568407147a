// The SNMP agent's configuration object: the stored configuration of the host's SNMP agent
// ("/etc/ostrel/snmp.xml"), the agent's own limits, key localization for SNMPv3 users and the
// test notification. Every operation may throw HostCtl::Lib::HostCtlException.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace HostCtl::System {

class SnmpAgentConfig {
  public:
    virtual ~SnmpAgentConfig() = default;

    // Writes the settings changed through this object to the store and applies them to the agent.
    virtual void Commit() = 0;
    virtual bool IsEnabled() = 0;
    virtual void SetEnabled(bool enabled) = 0;
    // The UDP port the agent is polled on.
    virtual int GetPort() = 0;
    virtual void SetPort(uint16_t port) = 0;
    virtual std::vector<std::string> GetCommunities() = 0;
    virtual void SetCommunities(const std::vector<std::string>& communities) = 0;
    // SNMPv1 trap targets: "ip-or-hostname[@port]/community".
    virtual std::vector<std::string> GetTargets() = 0;
    virtual void SetTargets(const std::vector<std::string>& targets) = 0;
    // The keyed scalar options ("syslocation", "EventFilter", ...).
    virtual std::map<std::string, std::string> GetOptions() = 0;
    // Changes only the keys present in `options`.
    virtual void SetOptions(const std::map<std::string, std::string>& options) = 0;
    virtual void ResetToDefaults() = 0;
    // Sends a warmStart notification to every configured target; answers how many were sent.
    virtual int SendWarmStart(std::string reason) = 0;
    // Checks that `user` exists and that each non-empty secret yields its stored hash; `verdict`
    // receives a one-line report. True when every check passed.
    virtual bool TestUser(const std::string& user, const std::string& authSecret,
                          const std::string& privSecret, std::string& verdict) = 0;
    // Localizes the secrets with the agent's engine id; false with `error` set on failure.
    virtual bool GenerateLocalizedHashes(const std::string& authSecret,
                                         const std::string& privSecret,
                                         const std::string& authProtocol,
                                         const std::string& privProtocol, std::string& authHash,
                                         std::string& privHash, std::string& error) = 0;
    // SNMPv3 notification targets: "ip-or-hostname[@port]/remote-user/security-level/trap|inform".
    virtual std::vector<std::string> GetV3Targets() = 0;
    // Reads the stored configuration again; false when the stored file is not valid XML.
    virtual bool Load() = 0;
    // Local users: "user/-|auth-hash/-|priv-hash/model".
    virtual std::vector<std::string> GetUsers() = 0;
    virtual void SetUsers(const std::vector<std::string>& users) = 0;
    // Inform users: "user/auth-proto/-|auth-hash/priv-proto/-|priv-hash/engine-id".
    virtual std::vector<std::string> GetRemoteUsers() = 0;
    virtual void SetRemoteUsers(const std::vector<std::string>& users) = 0;
    virtual bool GetLargeStorage() = 0;
    virtual void SetLargeStorage(bool enabled) = 0;
    virtual void SetV3Targets(const std::vector<std::string>& targets) = 0;

  protected:
    SnmpAgentConfig() = default;
};

// The agent's configuration object, already holding the stored configuration.
std::unique_ptr<SnmpAgentConfig> SnmpAgentConfigFactory();

}  // namespace HostCtl::System

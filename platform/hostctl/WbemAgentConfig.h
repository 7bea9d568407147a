// The configuration of the host's WBEM services (the CIM object manager and the WS-Management
// service) and of its CIM providers. Setters change this object only; Commit stores and applies.
#pragma once

#include <string>
#include <vector>

namespace HostCtl::System {

struct ProviderInfo {
    std::string name;
    bool enabled = false;
    bool loaded = false;
};

// Authorization models of incoming requests.
enum WbemAuthModel : int {
    WBEM_AUTH_NOT_SUPPORTED = 0,
    WBEM_AUTH_PASSWORD = 1,
    WBEM_AUTH_CERTIFICATE = 2,
};

class WbemAgentConfig {
  public:
    virtual ~WbemAgentConfig();

    // Stores the changed settings and restarts the services so that they take effect.
    virtual void Commit() = 0;
    virtual bool IsEnabled() = 0;
    virtual bool IsWsManEnabled() = 0;
    virtual void SetEnabled(bool enabled) = 0;
    virtual void SetWsManEnabled(bool enabled) = 0;
    // Throws HostCtl::Lib::HostCtlException for a provider that is not installed.
    virtual void SetProviderEnabled(const std::string& name, bool enabled) = 0;
    virtual int GetPort() = 0;
    virtual void SetPort(int port) = 0;
    virtual std::string GetLogLevel() = 0;
    virtual void SetLogLevel(const std::string& level) = 0;
    // A WbemAuthModel code.
    virtual int GetAuthModel() = 0;
    virtual void SetAuthModel(int model) = 0;
    virtual std::vector<ProviderInfo> GetProviders() = 0;
    virtual void ResetToDefaults() = 0;

  protected:
    WbemAgentConfig() = default;
};

}  // namespace HostCtl::System

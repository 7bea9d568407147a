// Host name service of a network stack: the host's short name, its DNS domain and the fully
// qualified name made of both.
#pragma once

#include <string>

namespace KernCtl::Network {

class DnsConfigImpl {
  public:
    // Opens the DNS configuration of the named network stack ("defaultTcpipStack").
    explicit DnsConfigImpl(const std::string& stackName);
    ~DnsConfigImpl();
    DnsConfigImpl(const DnsConfigImpl&) = delete;
    DnsConfigImpl& operator=(const DnsConfigImpl&) = delete;

    // The configuration as this object holds it, including changes not yet saved.
    std::string GetHostname();
    std::string GetDomain();
    // "host.domain", or the host name alone when the domain is empty.
    std::string GetFqdn();

    // The setters validate the name and change the configuration held by this object; with
    // `saveNow` true they also save it at once (as SaveConfig()).
    //
    // A host name is one label: 1 to 63 letters, digits and '-', not beginning or ending with
    // '-'. A domain is empty or labels of that form joined by '.', at most 253 characters
    // together with the host name.
    void SetHostname(const std::string& hostname, bool saveNow);
    void SetDomain(const std::string& domain, bool saveNow);
    // Splits `fqdn` at its first '.' into host name and domain. A name without a '.' takes
    // `defaultDomain` as its domain (empty: no domain).
    void SetFqdn(const std::string& fqdn, bool saveNow, const std::string& defaultDomain);

    // Writes the changed configuration to the host; nothing reaches the host before. Only
    // what this object changed is written, so a concurrent change of the other name stays.
    void SaveConfig();

  private:
    std::string stack_;
    std::string hostname_;
    std::string domain_;
    bool hostnameChanged_ = false;
    bool domainChanged_ = false;
};

}  // namespace KernCtl::Network

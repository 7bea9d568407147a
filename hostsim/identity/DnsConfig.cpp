// The host name service: host name and DNS domain of each network stack, validated the way a
// resolver configuration expects them and written to the store only by SaveConfig().
#include "kernctl/DnsConfig.h"

#include <string_view>

#include "hostctl/HostCtlException.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"

namespace {

const BrixSim::Operation kOpen{"KernCtl::Network::DnsConfigImpl::DnsConfigImpl"};
const BrixSim::Operation kGetHostname{"KernCtl::Network::DnsConfigImpl::GetHostname"};
const BrixSim::Operation kGetDomain{"KernCtl::Network::DnsConfigImpl::GetDomain"};
const BrixSim::Operation kGetFqdn{"KernCtl::Network::DnsConfigImpl::GetFqdn"};
const BrixSim::Operation kSetHostname{"KernCtl::Network::DnsConfigImpl::SetHostname"};
const BrixSim::Operation kSetDomain{"KernCtl::Network::DnsConfigImpl::SetDomain"};
const BrixSim::Operation kSetFqdn{"KernCtl::Network::DnsConfigImpl::SetFqdn"};
const BrixSim::Operation kSave{"KernCtl::Network::DnsConfigImpl::SaveConfig"};

constexpr size_t kMaxLabel = 63;
constexpr size_t kMaxName = 253;

const bool registered = [] {
    return BrixSim::RegisterTables({
        "dns",
        "CREATE TABLE IF NOT EXISTS dns_config ("
        " stack TEXT PRIMARY KEY,"  // network stack name
        " hostname TEXT NOT NULL,"
        " domain TEXT NOT NULL);",  // empty: no domain
        [](BrixSim::Store& store) {
            store
                .Prepare(
                    "INSERT INTO dns_config VALUES ('defaultTcpipStack', 'bx-node07',"
                    " 'lab.example.net')")
                .Run();
        },
    });
}();

[[noreturn]] void Reject(const std::string& message) {
    throw HostCtl::Lib::HostCtlException(message);
}

// Why `label` is not a valid DNS label, or empty when it is.
std::string LabelProblem(std::string_view label) {
    if (label.empty()) return "empty label";
    if (label.size() > kMaxLabel) return "label longer than 63 characters";
    for (char c : label) {
        const bool letterOrDigit =
            (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9');
        if (!letterOrDigit && c != '-') {
            return std::string("character '") + c + "' not allowed";
        }
    }
    if (label.front() == '-' || label.back() == '-') return "label begins or ends with '-'";
    return {};
}

void CheckHostname(const std::string& hostname) {
    std::string problem = LabelProblem(hostname);
    if (hostname.find('.') != std::string::npos) problem = "a host name cannot contain '.'";
    if (!problem.empty()) {
        Reject("Invalid host name '" + hostname + "': " + problem +
               ". A host name is 1 to 63 letters, digits and '-', and cannot begin or end "
               "with '-'.");
    }
}

// Drops one trailing '.', the root of an absolute name.
std::string WithoutRootDot(const std::string& name) {
    if (name.size() > 1 && name.back() == '.') return name.substr(0, name.size() - 1);
    return name;
}

void CheckDomain(const std::string& domain) {
    if (domain.empty()) return;
    std::string problem;
    if (domain.size() > kMaxName) problem = "longer than 253 characters";
    size_t start = 0;
    while (problem.empty()) {
        size_t dot = domain.find('.', start);
        std::string_view label(domain.data() + start,
                               (dot == std::string::npos ? domain.size() : dot) - start);
        problem = LabelProblem(label);
        if (dot == std::string::npos) break;
        start = dot + 1;
    }
    if (!problem.empty()) {
        Reject("Invalid domain name '" + domain + "': " + problem +
               ". A domain name is labels of 1 to 63 letters, digits and '-' separated by '.'.");
    }
}

void CheckLength(const std::string& hostname, const std::string& domain) {
    if (hostname.size() + (domain.empty() ? 0 : domain.size() + 1) > kMaxName) {
        Reject("Invalid fully qualified domain name '" + hostname + "." + domain +
               "': longer than 253 characters.");
    }
}

}  // namespace

namespace KernCtl::Network {

DnsConfigImpl::DnsConfigImpl(const std::string& stackName) : stack_(stackName) {
    auto& store = BrixSim::Store::Get();
    store.Check(kOpen);
    auto row = store.Prepare("SELECT hostname, domain FROM dns_config WHERE stack = ?");
    row.Bind(1, stackName);
    if (!row.Step()) Reject("Network stack '" + stackName + "' not found.");
    hostname_ = row.Text(0);
    domain_ = row.Text(1);
}

DnsConfigImpl::~DnsConfigImpl() = default;

std::string DnsConfigImpl::GetHostname() {
    BrixSim::Store::Get().Check(kGetHostname);
    return hostname_;
}

std::string DnsConfigImpl::GetDomain() {
    BrixSim::Store::Get().Check(kGetDomain);
    return domain_;
}

std::string DnsConfigImpl::GetFqdn() {
    BrixSim::Store::Get().Check(kGetFqdn);
    return domain_.empty() ? hostname_ : hostname_ + "." + domain_;
}

void DnsConfigImpl::SetHostname(const std::string& hostname, bool saveNow) {
    BrixSim::Store::Get().Check(kSetHostname);
    CheckHostname(hostname);
    CheckLength(hostname, domain_);
    hostname_ = hostname;
    hostnameChanged_ = true;
    if (saveNow) SaveConfig();
}

void DnsConfigImpl::SetDomain(const std::string& domain, bool saveNow) {
    BrixSim::Store::Get().Check(kSetDomain);
    const std::string name = WithoutRootDot(domain);
    CheckDomain(name);
    CheckLength(hostname_, name);
    domain_ = name;
    domainChanged_ = true;
    if (saveNow) SaveConfig();
}

void DnsConfigImpl::SetFqdn(const std::string& fqdn, bool saveNow,
                            const std::string& defaultDomain) {
    BrixSim::Store::Get().Check(kSetFqdn);
    const std::string name = WithoutRootDot(fqdn);
    const size_t dot = name.find('.');
    const std::string hostname = name.substr(0, dot);
    const std::string domain =
        dot == std::string::npos ? WithoutRootDot(defaultDomain) : name.substr(dot + 1);
    if (name.size() > kMaxName) {
        Reject("Invalid fully qualified domain name '" + fqdn + "': longer than 253 characters.");
    }
    CheckHostname(hostname);
    CheckDomain(domain);
    CheckLength(hostname, domain);
    hostname_ = hostname;
    domain_ = domain;
    hostnameChanged_ = domainChanged_ = true;
    if (saveNow) SaveConfig();
}

void DnsConfigImpl::SaveConfig() {
    auto& store = BrixSim::Store::Get();
    store.Check(kSave);
    store.Write([&] {
        // The names as stored now, with this object's changes applied: another process may
        // have saved the other name since this object read them.
        {
            auto row = store.Prepare("SELECT hostname, domain FROM dns_config WHERE stack = ?");
            row.Bind(1, stack_);
            if (row.Step()) {
                if (!hostnameChanged_) hostname_ = row.Text(0);
                if (!domainChanged_) domain_ = row.Text(1);
            }
        }
        CheckLength(hostname_, domain_);
        auto update =
            store.Prepare("UPDATE dns_config SET hostname = ?, domain = ? WHERE stack = ?");
        update.Bind(1, hostname_).Bind(2, domain_).Bind(3, stack_).Run();
        store.JournalCall(kSave, {stack_, hostname_, domain_});
    });
}

}  // namespace KernCtl::Network

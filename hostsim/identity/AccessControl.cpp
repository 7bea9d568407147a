// The kernel's access-control interface: keyword maps, the domain slots and their enforcement
// levels. Level changes apply to the running system; the domains themselves live in
// secpolicy_domains.
#include <string>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"
#include "kernctl/KernAccess.h"

namespace {

const BrixSim::Operation kOpen{
    "KernCtl::Security::KernAccessInterfaceImpl::KernAccessInterfaceImpl"};
const BrixSim::Operation kGetKeywordsMap{
    "KernCtl::Security::KernAccessInterfaceImpl::GetKeywordsMap"};
const BrixSim::Operation kGetMaxDomains{
    "KernCtl::Security::KernAccessInterfaceImpl::GetMaxDomains"};
const BrixSim::Operation kGetDomainInfo{
    "KernCtl::Security::KernAccessInterfaceImpl::GetDomainInfo"};
const BrixSim::Operation kEnable{"KernCtl::Security::KernAccessInterfaceImpl::Enable"};
const BrixSim::Operation kEnableDomain{"KernCtl::Security::KernAccessInterfaceImpl::EnableDomain"};

constexpr int64_t kDefaultMaxDomains = 16;

const bool registered = [] {
    return BrixSim::RegisterTables({
        "secpolicy-keywords",
        "CREATE TABLE IF NOT EXISTS secpolicy_keywords ("
        " type INTEGER NOT NULL,"  // keyword kind; 0: enforcement levels
        " keyword TEXT NOT NULL,"
        " value INTEGER NOT NULL,"
        " PRIMARY KEY (type, keyword));",
        [](BrixSim::Store& store) {
            store.Exec(
                "INSERT INTO secpolicy_keywords VALUES"
                " (0, 'disabled', 0), (0, 'audit', 1), (0, 'enforcing', 2);");
        },
    });
}();

// Throws unless `level` is an enforcement-level keyword, naming the valid ones.
void CheckLevel(BrixSim::Store& store, const std::string& level) {
    auto known = store.Prepare("SELECT 1 FROM secpolicy_keywords WHERE type = 0 AND keyword = ?");
    known.Bind(1, level);
    if (known.Step()) return;
    std::string valid;
    auto all =
        store.Prepare("SELECT keyword FROM secpolicy_keywords WHERE type = 0 ORDER BY value");
    while (all.Step()) valid += (valid.empty() ? "" : ", ") + all.Text(0);
    throw HostCtl::Lib::HostCtlException("Invalid enforcement level '" +
                                         CmdKit::MessageExcerpt(level) +
                                         "'. Valid levels are: " + valid + ".");
}

}  // namespace

namespace KernCtl::Security {

KernAccessInterfaceImpl::KernAccessInterfaceImpl() {
    BrixSim::Store::Get().Check(kOpen);
}

KernAccessInterfaceImpl::~KernAccessInterfaceImpl() = default;

std::map<std::string, int> KernAccessInterfaceImpl::GetKeywordsMap(KernAccess_KeywordType type) {
    auto& store = BrixSim::Store::Get();
    store.Check(kGetKeywordsMap);
    if (type != KERNACCESS_KEYWORD_LEVEL) {
        throw HostCtl::Lib::HostCtlException("Unknown keyword type " +
                                             std::to_string(static_cast<int>(type)) + ".");
    }
    std::map<std::string, int> keywords;
    auto rows = store.Prepare("SELECT keyword, value FROM secpolicy_keywords WHERE type = ?");
    rows.Bind(1, static_cast<int>(type));
    while (rows.Step()) keywords.emplace(rows.Text(0), static_cast<int>(rows.Int(1)));
    return keywords;
}

uint32_t KernAccessInterfaceImpl::GetMaxDomains() {
    auto& store = BrixSim::Store::Get();
    store.Check(kGetMaxDomains);
    const int64_t max = store.GetInt("secpolicy.max_domains", kDefaultMaxDomains);
    return max < 0 ? 0 : static_cast<uint32_t>(max);
}

bool KernAccessInterfaceImpl::GetDomainInfo(uint32_t id, std::string& name, std::string& level) {
    auto& store = BrixSim::Store::Get();
    store.Check(kGetDomainInfo);
    const int64_t max = store.GetInt("secpolicy.max_domains", kDefaultMaxDomains);
    if (static_cast<int64_t>(id) >= max) {
        throw HostCtl::Lib::HostCtlException("Invalid domain id " + std::to_string(id) +
                                             ": the kernel has " + std::to_string(max) +
                                             " domain slots.");
    }
    auto row = store.Prepare("SELECT name, level FROM secpolicy_domains WHERE id = ?");
    row.Bind(1, static_cast<int64_t>(id));
    if (!row.Step()) return false;
    name = row.Text(0);
    level = row.Text(1);
    return true;
}

void KernAccessInterfaceImpl::Enable(const std::string& level) {
    auto& store = BrixSim::Store::Get();
    store.Check(kEnable);
    store.Write([&] {
        CheckLevel(store, level);
        store.Prepare("UPDATE secpolicy_domains SET level = ?").Bind(1, level).Run();
        store.JournalCall(kEnable, {level});
    });
}

void KernAccessInterfaceImpl::EnableDomain(const std::string& name, const std::string& level) {
    auto& store = BrixSim::Store::Get();
    store.Check(kEnableDomain);
    store.Write([&] {
        CheckLevel(store, level);
        auto known = store.Prepare("SELECT 1 FROM secpolicy_domains WHERE name = ?");
        known.Bind(1, name);
        if (!known.Step()) {
            throw HostCtl::Lib::HostCtlException("Domain '" + CmdKit::MessageExcerpt(name) +
                                                 "' not found.");
        }
        store.Prepare("UPDATE secpolicy_domains SET level = ? WHERE name = ?")
            .Bind(1, level)
            .Bind(2, name)
            .Run();
        store.JournalCall(kEnableDomain, {name, level});
    });
}

}  // namespace KernCtl::Security

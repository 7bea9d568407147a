// Kernel access control: security domains, their enforcement levels and labels.
#pragma once

#include <cstdint>
#include <map>
#include <string>

enum KernAccess_KeywordType : int {
    KERNACCESS_KEYWORD_LEVEL = 0,
};

namespace KernCtl::Security {

class KernAccessInterfaceImpl {
  public:
    KernAccessInterfaceImpl();
    ~KernAccessInterfaceImpl();

    // --- security domains ---
    // The keywords of one kind and their values; kind 0 holds the enforcement levels.
    std::map<std::string, int> GetKeywordsMap(KernAccess_KeywordType type);
    // The number of domain slots; slots are numbered from 0 and may be empty.
    uint32_t GetMaxDomains();
    // True, with the domain's name and enforcement level, when slot `id` holds a domain; false
    // for an empty slot. Throws for a slot number at or beyond GetMaxDomains().
    bool GetDomainInfo(uint32_t id, std::string& name, std::string& level);
    // Sets the enforcement level of every domain, or of the named one, for the running system.
    // The level must be a keyword of kind 0.
    void Enable(const std::string& level);
    void EnableDomain(const std::string& name, const std::string& level);

    // --- labels ---
    // The label of a domain number; label type 0 is the domain's name.
    std::string GetLabel(uint32_t domain, int labelType);
};

}  // namespace KernCtl::Security

// The kernel's advanced options as the host interfaces see them: a tree of branches whose
// leaves are integer or string options, addressed by slash-separated paths ("/Misc/HostName").
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace HostCtl::Adv {

enum AdvancedOptionType : int {
    ADV_OPTION_INTEGER = 0,
    ADV_OPTION_STRING = 1,
};

class AdvancedOption {
  public:
    virtual ~AdvancedOption() = default;

    virtual std::string GetPath() = 0;
    // An AdvancedOptionType code.
    virtual int GetType() = 0;
    virtual std::string GetDescription() = 0;
    virtual void ResetToDefault() = 0;

  protected:
    AdvancedOption() = default;
};

class AdvancedStringOption : public virtual AdvancedOption {
  public:
    virtual std::string GetDefault() = 0;
    // The characters the value may hold; empty when any character is allowed.
    virtual std::string GetValidCharacters() = 0;
    virtual std::string GetValue() = 0;
    virtual void SetValue(const std::string& value) = 0;
};

class AdvancedIntegerOption : public virtual AdvancedOption {
  public:
    virtual uint32_t GetDefault() = 0;
    virtual uint32_t GetMin() = 0;
    virtual uint32_t GetMax() = 0;
    virtual uint32_t GetValue() = 0;
    virtual void SetValue(uint32_t value) = 0;
};

class AdvancedOptionBranch {
  public:
    virtual ~AdvancedOptionBranch() = default;

    // The options directly in this branch.
    virtual std::vector<std::unique_ptr<AdvancedOption>> GetOptions() = 0;
    // The branches directly below this one.
    virtual std::vector<std::unique_ptr<AdvancedOptionBranch>> GetBranches() = 0;
    // The branch directly below this one with that name, or null.
    virtual std::unique_ptr<AdvancedOptionBranch> GetBranch(const std::string& name) = 0;

  protected:
    AdvancedOptionBranch() = default;
};

}  // namespace HostCtl::Adv

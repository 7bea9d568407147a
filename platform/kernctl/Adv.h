// The kernel-control implementation of the advanced-option tree.
//
// Options of the kernel's own modules are AdvancedIntegerOptionImpl and AdvancedStringOptionImpl.
// Options that a user or agent created at run time ("User" options) are kept by the kernel
// apart and have classes of their own with the same operations. An option whose value handler
// is not available is an AdvancedOptionImpl only: its path, type and description can be read,
// its value cannot.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "hostctl/Adv.h"

namespace KernCtl::Adv {

// An option's state as the kernel reports it.
struct AdvancedOptionData {
    std::string path;
    int type = HostCtl::Adv::ADV_OPTION_INTEGER;
    std::string description;
    uint32_t intValue = 0;
    uint32_t intDefault = 0;
    uint32_t intMin = 0;
    uint32_t intMax = 0;
    std::string stringValue;
    std::string stringDefault;
    std::string validCharacters;
};

// Changes an option object holds until it applies them.
struct StagedOptionChange;

class AdvancedOptionImpl : public virtual HostCtl::Adv::AdvancedOption {
  public:
    explicit AdvancedOptionImpl(AdvancedOptionData data);
    ~AdvancedOptionImpl() override;

    // The option at a full path; throws HostCtl::Lib::HostCtlException for an unknown path.
    static std::unique_ptr<AdvancedOptionImpl> FindOption(const std::string& path);

    std::string GetPath() override;
    int GetType() override;
    std::string GetDescription() override;
    // Changes made through this object (a reset, a new value, a cleared override) are staged
    // in it; ApplyChange commits them together. An object released without ApplyChange, or
    // whose ApplyChange fails, changes nothing.
    void ResetToDefault() override;

    // Drops the record that the option's value was chosen by the user; called after a reset.
    void ClearOverride();
    // Makes the changes staged since the last call take effect in the running kernel, all at
    // once.
    void ApplyChange();

  protected:
    // Qualified class name, for operation names ("KernCtl::Adv::AdvancedIntegerOptionImpl").
    virtual const char* ClassName() const;
    // Stages a new value, checked against the option's limits.
    void StoreInteger(uint32_t value);
    void StoreString(const std::string& value);

    AdvancedOptionData data_;

  private:
    // The changes staged since the last ApplyChange, made on first use.
    StagedOptionChange& Staged();

    std::unique_ptr<StagedOptionChange> staged_;  // null while nothing is staged
};

class AdvancedIntegerOptionImpl : public HostCtl::Adv::AdvancedIntegerOption,
                                  public AdvancedOptionImpl {
  public:
    explicit AdvancedIntegerOptionImpl(AdvancedOptionData data);
    ~AdvancedIntegerOptionImpl() override;

    uint32_t GetDefault() override;
    uint32_t GetMin() override;
    uint32_t GetMax() override;
    uint32_t GetValue() override;
    void SetValue(uint32_t value) override;

  protected:
    const char* ClassName() const override;
};

class AdvancedStringOptionImpl : public HostCtl::Adv::AdvancedStringOption,
                                 public AdvancedOptionImpl {
  public:
    explicit AdvancedStringOptionImpl(AdvancedOptionData data);
    ~AdvancedStringOptionImpl() override;

    std::string GetDefault() override;
    std::string GetValidCharacters() override;
    std::string GetValue() override;
    void SetValue(const std::string& value) override;

  protected:
    const char* ClassName() const override;
};

class AdvancedUserIntegerOptionImpl : public AdvancedOptionImpl {
  public:
    explicit AdvancedUserIntegerOptionImpl(AdvancedOptionData data);
    ~AdvancedUserIntegerOptionImpl() override;

    virtual uint32_t GetDefault();
    virtual uint32_t GetMin();
    virtual uint32_t GetMax();
    virtual uint32_t GetValue();
    virtual void SetValue(uint32_t value);

  protected:
    const char* ClassName() const override;
};

class AdvancedUserStringOptionImpl : public AdvancedOptionImpl {
  public:
    explicit AdvancedUserStringOptionImpl(AdvancedOptionData data);
    ~AdvancedUserStringOptionImpl() override;

    virtual std::string GetDefault();
    virtual std::string GetValidCharacters();
    virtual std::string GetValue();
    virtual void SetValue(const std::string& value);

  protected:
    const char* ClassName() const override;
};

class AdvancedOptionBranchImpl : public HostCtl::Adv::AdvancedOptionBranch {
  public:
    // The root of the tree.
    AdvancedOptionBranchImpl();
    // The branch at a full path ("/Net/Tcp"), which must exist.
    explicit AdvancedOptionBranchImpl(std::string path);
    ~AdvancedOptionBranchImpl() override;

    const std::string& GetPath() const { return path_; }

    std::vector<std::unique_ptr<HostCtl::Adv::AdvancedOption>> GetOptions() override;
    std::vector<std::unique_ptr<HostCtl::Adv::AdvancedOptionBranch>> GetBranches() override;
    std::unique_ptr<HostCtl::Adv::AdvancedOptionBranch> GetBranch(const std::string& name) override;

  private:
    std::string path_;  // "" for the root
};

}  // namespace KernCtl::Adv

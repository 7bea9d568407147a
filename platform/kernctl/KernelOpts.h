// The kernel's boot settings: named values the kernel reads when it starts. Each has a
// configured value (used by the next start), a runtime value (used by the running kernel) and a
// default. Names match without regard to case.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "hostctl/KernelOption.h"

namespace KernCtl::System {

class KernelOpts {
  public:
    struct CaseInsensitiveStringLessThan {
        bool operator()(const std::string& left, const std::string& right) const;
    };

    struct OptionInfo {
        std::string name;
        HostCtl::System::KernelOption::OptionType type =
            HostCtl::System::KernelOption::OPTION_STRING;
        std::string description;
        std::string configured;
        std::string runtime;
        std::string defaultValue;
    };

    KernelOpts();
    ~KernelOpts();

    std::vector<std::string> GetOptionNames();
    // Each throws HostCtl::Lib::HostCtlException for an unknown name.
    HostCtl::System::KernelOption::OptionType GetOptionType(const std::string& name);
    std::string GetOptionDescription(const std::string& name);
    std::string GetOption(const std::string& name);
    std::string GetRuntimeValue(const std::string& name);
    std::string GetOptionDefault(const std::string& name);
    // The text that names a type: "string", "bool", "uint32", "uint8", "int32", "uint64".
    std::string GetOptionTypeString(HostCtl::System::KernelOption::OptionType type);

    // Changes the configured value, checked against the setting's type; the running kernel
    // takes it at its next start.
    void SetOption(const std::string& name, const std::string& value);

  private:
    OptionInfo& Find(const std::string& name);
    void Load();

    bool loaded_ = false;
    std::map<std::string, OptionInfo, CaseInsensitiveStringLessThan> options_;
};

}  // namespace KernCtl::System

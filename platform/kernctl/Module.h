// The kernel-control implementation of a loadable module, addressed by name.
#pragma once

#include <map>
#include <memory>
#include <string>
#include <vector>

#include "hostctl/Module.h"

namespace KernCtl::System {

class ModuleImpl : public HostCtl::System::Module {
  public:
    // The kernel's record of a module, read on first use.
    struct Record;

    // Nothing is read until an operation needs it; an unknown name fails in that operation.
    explicit ModuleImpl(const std::string& name);
    // A module whose record was read already.
    explicit ModuleImpl(std::unique_ptr<Record> record);
    ~ModuleImpl() override;
    ModuleImpl(const ModuleImpl&) = delete;
    ModuleImpl& operator=(const ModuleImpl&) = delete;

    // True when a module of exactly this name exists (an alias is not a module name).
    static bool IsValidName(const std::string& name);

    std::string GetName() override;
    bool IsLoaded() override;
    std::string GetVersion() override;
    bool IsEnabled() override;
    HostCtl::System::ModuleNamespace GetProvidedNamespace() override;
    std::string GetFileVersion() override;
    std::string GetLicense() override;
    std::vector<HostCtl::System::ModuleNamespace> GetRequiredNamespaces() override;
    std::string GetModuleFile() override;
    std::string GetBuildType() override;
    std::string GetContainingPackage() override;
    std::string GetAcceptanceLevel() override;

    void SetParameterString(const std::string& parameters, bool force) override;
    void AppendParameterString(const std::string& parameters, bool force) override;
    void CopyParameters(const std::string& source, const std::vector<std::string>& keys,
                        bool force) override;

    std::vector<HostCtl::System::LogLevel> GetLogLevels() override;
    void SetLogLevel(const std::string& name, uint32_t level) override;
    void SetDefaultLogLevel(const std::string& name) override;

    // Whether the module loads at boot. SetEnabled also accepts an alias of a module.
    bool GetEnabled();
    void SetEnabled(bool enabled);
    // Loads the module now; an empty `parameters` uses the configured parameter string.
    // `force` loads a disabled module.
    void Load(const std::string& parameters, bool force);

    // The parameters the module declares (none for an unknown name), and its configured values
    // by parameter name.
    std::vector<HostCtl::System::ModuleParam> GetParameters();
    std::map<std::string, std::string> GetOptions();

  private:
    const Record& Data();

    std::string name_;
    std::unique_ptr<Record> record_;
};

}  // namespace KernCtl::System

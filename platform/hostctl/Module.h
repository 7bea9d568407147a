// Loadable kernel modules as the host interfaces see them: metadata, load-time parameters and
// log levels.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

namespace HostCtl::System {

// A namespace of kernel symbols that a module provides or requires, with its versions.
struct ModuleNamespace {
    std::string name;
    std::vector<std::string> versions;
};

// A load-time parameter that a module declares.
struct ModuleParam {
    std::string name;
    std::string type;
    std::string description;
};

// A named verbosity counter of the kernel core or of a module.
class LogLevel {
  public:
    LogLevel(std::string name, int32_t current, int32_t defaultLevel)
        : name_(std::move(name)), current_(current), default_(defaultLevel) {}

    const std::string& GetName() const { return name_; }
    int32_t GetCurrentLevel() const { return current_; }
    int32_t GetDefaultLevel() const { return default_; }

  private:
    std::string name_;
    int32_t current_;
    int32_t default_;
};

class Module {
  public:
    virtual ~Module() = default;

    virtual std::string GetName() = 0;
    virtual bool IsLoaded() = 0;
    virtual std::string GetVersion() = 0;
    virtual bool IsEnabled() = 0;
    virtual ModuleNamespace GetProvidedNamespace() = 0;
    virtual std::string GetFileVersion() = 0;
    virtual std::string GetLicense() = 0;
    virtual std::vector<ModuleNamespace> GetRequiredNamespaces() = 0;
    virtual std::string GetModuleFile() = 0;
    virtual std::string GetBuildType() = 0;
    // The software package that delivered the module, and that package's acceptance level.
    virtual std::string GetContainingPackage() = 0;
    virtual std::string GetAcceptanceLevel() = 0;

    // The configured parameter string, passed to the module when it loads. `force` accepts an
    // alias or a name that is not (yet) a module.
    virtual void SetParameterString(const std::string& parameters, bool force) = 0;
    virtual void AppendParameterString(const std::string& parameters, bool force) = 0;
    // Copies the listed keys of `source`'s configured parameters into this module's; `force`
    // skips the validity check of the source name.
    virtual void CopyParameters(const std::string& source, const std::vector<std::string>& keys,
                                bool force) = 0;

    virtual std::vector<LogLevel> GetLogLevels() = 0;
    virtual void SetLogLevel(const std::string& name, uint32_t level) = 0;
    virtual void SetDefaultLogLevel(const std::string& name) = 0;

  protected:
    Module() = default;
};

// The modules of one moment, read as they are walked rather than all at once.
class ModuleList {
  public:
    virtual ~ModuleList() = default;
    // Calls `module` for each module, in the kernel's order; every walk sees the same modules.
    // The module passed is valid only during the call.
    virtual void Each(const std::function<void(Module& module)>& module) = 0;

  protected:
    ModuleList() = default;
};

}  // namespace HostCtl::System

#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class SettingsKernelSet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<SettingsKernelSet> New();
    ~SettingsKernelSet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    SettingsKernelSet();
};

}  // namespace OstrelCli::System

#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class MaintenanceModeSet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<MaintenanceModeSet> New();
    ~MaintenanceModeSet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    MaintenanceModeSet();
};

}  // namespace OstrelCli::System

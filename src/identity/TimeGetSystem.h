#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class TimeGetSystem : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<TimeGetSystem> New();
    ~TimeGetSystem() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    TimeGetSystem();
};

}  // namespace OstrelCli::System

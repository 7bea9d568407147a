#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class InstallTimeGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<InstallTimeGet> New();
    ~InstallTimeGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    InstallTimeGet();
};

}  // namespace OstrelCli::System

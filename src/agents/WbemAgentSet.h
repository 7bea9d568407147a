#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class WbemAgentSet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<WbemAgentSet> New();
    ~WbemAgentSet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    WbemAgentSet();
};

}  // namespace OstrelCli::System

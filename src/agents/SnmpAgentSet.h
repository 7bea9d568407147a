#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class SnmpAgentSet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<SnmpAgentSet> New();
    ~SnmpAgentSet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    SnmpAgentSet();
};

}  // namespace OstrelCli::System

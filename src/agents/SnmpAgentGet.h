#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class SnmpAgentGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<SnmpAgentGet> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~SnmpAgentGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    SnmpAgentGet();
};

}  // namespace OstrelCli::System

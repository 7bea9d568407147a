#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class SnmpAgentHash : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<SnmpAgentHash> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~SnmpAgentHash() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    SnmpAgentHash();
};

}  // namespace OstrelCli::System

#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class SnmpAgentTest : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<SnmpAgentTest> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~SnmpAgentTest() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    SnmpAgentTest();
};

}  // namespace OstrelCli::System

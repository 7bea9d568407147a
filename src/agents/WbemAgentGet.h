#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class WbemAgentGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<WbemAgentGet> New();
    ~WbemAgentGet() override;

    // The empty "WbemAgentConfig" structure, every field in display order.
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    WbemAgentGet();
};

}  // namespace OstrelCli::System

#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class ProcessStatsLoadGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<ProcessStatsLoadGet> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~ProcessStatsLoadGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    ProcessStatsLoadGet();
};

}  // namespace OstrelCli::System

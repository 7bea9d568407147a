#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class ProcessStatsRunningGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<ProcessStatsRunningGet> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~ProcessStatsRunningGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    ProcessStatsRunningGet();
};

}  // namespace OstrelCli::System

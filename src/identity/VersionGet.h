#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class VersionGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<VersionGet> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~VersionGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    VersionGet();
};

}  // namespace OstrelCli::System

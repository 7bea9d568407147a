#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class HostnameGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<HostnameGet> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~HostnameGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    HostnameGet();
};

}  // namespace OstrelCli::System

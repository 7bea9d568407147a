#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class BootDeviceGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<BootDeviceGet> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~BootDeviceGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    BootDeviceGet();
};

}  // namespace OstrelCli::System

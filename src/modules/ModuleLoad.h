#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class ModuleLoad : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<ModuleLoad> New();
    ~ModuleLoad() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    ModuleLoad();
};

}  // namespace OstrelCli::System

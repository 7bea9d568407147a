#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class ModuleParametersCopy : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<ModuleParametersCopy> New();
    ~ModuleParametersCopy() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    ModuleParametersCopy();
};

}  // namespace OstrelCli::System

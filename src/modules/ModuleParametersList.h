#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class ModuleParametersList : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<ModuleParametersList> New();
    ~ModuleParametersList() override;
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    ModuleParametersList();
};

}  // namespace OstrelCli::System

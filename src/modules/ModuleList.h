#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class ModuleList : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<ModuleList> New();
    ~ModuleList() override;
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    ModuleList();
};

}  // namespace OstrelCli::System

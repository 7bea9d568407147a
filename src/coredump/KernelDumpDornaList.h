#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class KernelDumpDornaList : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<KernelDumpDornaList> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~KernelDumpDornaList() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    KernelDumpDornaList();
};

}  // namespace OstrelCli::System

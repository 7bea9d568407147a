#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class KernelDumpDornaGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<KernelDumpDornaGet> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~KernelDumpDornaGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    KernelDumpDornaGet();
};

}  // namespace OstrelCli::System

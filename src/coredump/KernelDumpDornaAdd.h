#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class KernelDumpDornaAdd : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<KernelDumpDornaAdd> New();
    ~KernelDumpDornaAdd() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    KernelDumpDornaAdd();
};

}  // namespace OstrelCli::System

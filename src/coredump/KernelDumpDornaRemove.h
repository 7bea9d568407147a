#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class KernelDumpDornaRemove : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<KernelDumpDornaRemove> New();
    ~KernelDumpDornaRemove() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    KernelDumpDornaRemove();
};

}  // namespace OstrelCli::System

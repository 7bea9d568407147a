#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class KernelDumpNetworkCheck : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<KernelDumpNetworkCheck> New();
    ~KernelDumpNetworkCheck() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    KernelDumpNetworkCheck();
};

}  // namespace OstrelCli::System

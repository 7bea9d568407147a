#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class KernelDumpNetworkGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<KernelDumpNetworkGet> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~KernelDumpNetworkGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    KernelDumpNetworkGet();
};

}  // namespace OstrelCli::System

#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class KernelDumpPartitionGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<KernelDumpPartitionGet> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~KernelDumpPartitionGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    KernelDumpPartitionGet();
};

}  // namespace OstrelCli::System

#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class KernelDumpPartitionList : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<KernelDumpPartitionList> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~KernelDumpPartitionList() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    KernelDumpPartitionList();
};

}  // namespace OstrelCli::System

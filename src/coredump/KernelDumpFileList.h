#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class KernelDumpFileList : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<KernelDumpFileList> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~KernelDumpFileList() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    KernelDumpFileList();
};

}  // namespace OstrelCli::System

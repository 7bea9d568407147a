#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class KernelDumpFileGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<KernelDumpFileGet> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~KernelDumpFileGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    KernelDumpFileGet();
};

}  // namespace OstrelCli::System

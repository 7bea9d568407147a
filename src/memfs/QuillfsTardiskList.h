#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class QuillfsTardiskList : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<QuillfsTardiskList> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~QuillfsTardiskList() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    QuillfsTardiskList();
};

}  // namespace OstrelCli::System

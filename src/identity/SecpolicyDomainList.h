#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class SecpolicyDomainList : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<SecpolicyDomainList> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~SecpolicyDomainList() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    SecpolicyDomainList();
};

}  // namespace OstrelCli::System

#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class SecpolicyDomainSet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<SecpolicyDomainSet> New();
    ~SecpolicyDomainSet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    SecpolicyDomainSet();
};

}  // namespace OstrelCli::System

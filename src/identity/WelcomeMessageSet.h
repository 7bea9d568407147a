#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class WelcomeMessageSet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<WelcomeMessageSet> New();
    ~WelcomeMessageSet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    WelcomeMessageSet();
};

}  // namespace OstrelCli::System

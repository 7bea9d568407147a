#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class UuidGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<UuidGet> New();
    ~UuidGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    UuidGet();
};

}  // namespace OstrelCli::System

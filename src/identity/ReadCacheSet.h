#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class ReadCacheSet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<ReadCacheSet> New();
    ~ReadCacheSet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    ReadCacheSet();
};

}  // namespace OstrelCli::System

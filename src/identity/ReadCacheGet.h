#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class ReadCacheGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<ReadCacheGet> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~ReadCacheGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    ReadCacheGet();
};

}  // namespace OstrelCli::System

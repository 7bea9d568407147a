#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class QuillfsGet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<QuillfsGet> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~QuillfsGet() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    QuillfsGet();
};

}  // namespace OstrelCli::System

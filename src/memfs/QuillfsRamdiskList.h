#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class QuillfsRamdiskList : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<QuillfsRamdiskList> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~QuillfsRamdiskList() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    QuillfsRamdiskList();
};

}  // namespace OstrelCli::System

#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class SettingsAdvancedList : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<SettingsAdvancedList> New();
    ~SettingsAdvancedList() override;
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    SettingsAdvancedList();
};

}  // namespace OstrelCli::System

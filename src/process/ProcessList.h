#pragma once

#include "frame/CommandKit.h"

namespace HostCtl::Resource {
class World;
}

namespace OstrelCli::System {

class ProcessList : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<ProcessList> New();
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();
    ~ProcessList() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    ProcessList();
    static std::shared_ptr<MetaObj::MetaStruct> Row(const HostCtl::Resource::World& world,
                                                    const std::string& domainLabel);
};

}  // namespace OstrelCli::System

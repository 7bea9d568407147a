#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class SlpAgentSearch : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<SlpAgentSearch> New();
    ~SlpAgentSearch() override;

    // The empty "SlpSearchResults" structure, every field in display order.
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    SlpAgentSearch();
};

}  // namespace OstrelCli::System

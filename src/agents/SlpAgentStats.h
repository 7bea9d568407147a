#pragma once

#include "frame/CommandKit.h"

namespace HostCtl::System {
struct SLPStats;
}

namespace OstrelCli::System {

class SlpAgentStats : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<SlpAgentStats> New();
    ~SlpAgentStats() override;

    // The empty "SlpStats" structure, every field in display order.
    static std::shared_ptr<MetaObj::MetaStruct> GetOutputStructure();

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    SlpAgentStats();
};

// Copies the statistics record into a "SlpStats" structure, field by field in display order.
void LoadStats(const HostCtl::System::SLPStats& stats,
               const std::shared_ptr<MetaObj::MetaStruct>& structure);

}  // namespace OstrelCli::System

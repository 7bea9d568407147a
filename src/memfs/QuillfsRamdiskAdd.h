#pragma once

#include "frame/CommandKit.h"

namespace OstrelCli::System {

class QuillfsRamdiskAdd : public virtual CmdKit::AutoCli::Command {
  public:
    // With `inodeOptions` the command also offers the inode limits and the core-dump flag.
    static std::shared_ptr<QuillfsRamdiskAdd> New(bool inodeOptions);
    ~QuillfsRamdiskAdd() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    explicit QuillfsRamdiskAdd(bool inodeOptions);

    bool inodeOptions_;
};

}  // namespace OstrelCli::System

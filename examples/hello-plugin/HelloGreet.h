// `hello greet`: answers a greeting for the given name.
#pragma once

#include <memory>

#include "cmdkit/AutoCli.h"

namespace HelloCli {

class HelloGreet : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<HelloGreet> New();
    ~HelloGreet() override;

  protected:
    std::shared_ptr<CmdKit::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CmdKit::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<CmdKit::CallSpec::Input> input,
                         std::shared_ptr<CmdKit::CallSpec::Output> output) override;

  private:
    HelloGreet();
};

}  // namespace HelloCli

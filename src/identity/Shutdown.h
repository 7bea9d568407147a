#pragma once

#include <ctime>
#include <string>

#include "frame/CommandKit.h"

namespace OstrelCli::System {

enum ShutdownOperation : int {
    SHUTDOWN_REBOOT = 0,
    SHUTDOWN_POWEROFF = 1,
};

// Reboots or powers off a host in maintenance mode, after logging the user's reason.
class Shutdown : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<Shutdown> New(ShutdownOperation operation);
    ~Shutdown() override;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(InputPtr input, OutputPtr output) override;

  private:
    explicit Shutdown(ShutdownOperation operation);

    // Sleeps the whole time, resuming after interruptions by signals.
    void SafeSleep(time_t seconds);
    void LogMsgEvt(const std::string& text);
    void LogMsgSyslog(const std::string& text);
    void LogReason(const std::string& reason);

    // Set once a shutdown of this process has passed its checks; the host is going down.
    static bool _operationInProgress;

    ShutdownOperation operation_;
};

}  // namespace OstrelCli::System

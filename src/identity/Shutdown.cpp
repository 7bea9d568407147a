#include "identity/Shutdown.h"

#include <syslog.h>

#include <cerrno>
#include <csignal>

#include "evt/EvtUser.h"
#include "kernctl/SystemInfoImpl.h"
#include "os/HostOs.h"

namespace OstrelCli::System {

namespace {

constexpr size_t kMaxReason = 512;
static_assert(SIGTERM == 15 && SIGUSR2 == 12 && LOG_CRIT == 2);
// The pause between logging the reason and signalling init.
constexpr time_t kLogPause = 10;

}  // namespace

bool Shutdown::_operationInProgress = false;

std::shared_ptr<Shutdown> Shutdown::New(ShutdownOperation operation) {
    return AdoptSelf(std::shared_ptr<Shutdown>(new Shutdown(operation)));
}

Shutdown::Shutdown(ShutdownOperation operation) : operation_(operation) {
    Describe(*this,
             operation == SHUTDOWN_REBOOT
                 ? "Reboot the system. The host must be in maintenance mode."
                 : "Power off the system. The host must be in maintenance mode.",
             nullptr, "operation");
}

Shutdown::~Shutdown() = default;

std::shared_ptr<CallSpec::InputSpec> Shutdown::GetInputSpecInternal() {
    return Params()
        .Add("reason", CallSpec::PARAM_STRING, "r", "Reason for performing the operation", true)
        .Add("delay", CallSpec::PARAM_INT, "d", "Delay interval in seconds", false,
             IntRange(10, 4294967295));
}

std::shared_ptr<CallSpec::OutputSpec> Shutdown::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void Shutdown::SafeSleep(time_t seconds) {
    struct timespec request {
        seconds, 0
    };
    struct timespec remaining {};
    while (HostOs::nanosleep(&request, &remaining) != 0 && errno == EINTR) request = remaining;
}

void Shutdown::LogMsgEvt(const std::string& text) {
    if (EvtUserLib_Init() != 0) return;
    EvtUserLib_AddEvt(operation_ == SHUTDOWN_REBOOT ? "@&!*@*@(evt.user.brixcli.host.reboot)%s"
                                                    : "@&!*@*@(evt.user.brixcli.host.poweroff)%s",
                      text.c_str());
    EvtUserLib_Close();
}

void Shutdown::LogMsgSyslog(const std::string& text) {
    // The record is the text as given: a '%' in the user's reason prints as itself.
    HostOs::syslog(LOG_CRIT, "%s", text.c_str());
}

void Shutdown::LogReason(const std::string& reason) {
    const std::string text =
        (operation_ == SHUTDOWN_REBOOT ? "Reason for reboot: <" : "Reason for power off: <") +
        reason + ">";
    LogMsgEvt(text);
    LogMsgSyslog(text);
    SafeSleep(kLogPause);
}

void Shutdown::ExecuteInternal(InputPtr input, OutputPtr output) {
    GuardDetailed(*output, [&] {
        const std::string reason = input->GetParameter("reason");
        if (reason.size() > kMaxReason) {
            Fail(*output, "Reason message cannot be longer than 512 characters.");
            return;
        }
        KernCtl::System::SystemInfoImpl systemInfo;
        if (systemInfo.GetMaintenanceModeState() != 1) {
            Fail(*output, "System is not in maintenance mode. Cannot perform requested operation.");
            return;
        }
        if (_operationInProgress) {
            Fail(*output, "System is already performing requested operation.");
            return;
        }
        _operationInProgress = true;
        // The whole delay lies between the command and the signal; logging takes the last
        // ten seconds of it.
        if (input->HasParameter("delay")) {
            SafeSleep(static_cast<time_t>(input->GetParameterInt("delay")) - kLogPause);
        }
        LogReason(reason);
        HostOs::kill(1, operation_ == SHUTDOWN_REBOOT ? SIGTERM : SIGUSR2);
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

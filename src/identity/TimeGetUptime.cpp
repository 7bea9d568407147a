#include "identity/TimeGetUptime.h"

#include "hostctl/ServerStats.h"

namespace OstrelCli::System {

std::shared_ptr<TimeGetUptime> TimeGetUptime::New() {
    return AdoptSelf(std::shared_ptr<TimeGetUptime>(new TimeGetUptime));
}

TimeGetUptime::TimeGetUptime() {
    Describe(*this, "Display the number of microseconds the system has been running.", "simple",
             "fetcher");
}

TimeGetUptime::~TimeGetUptime() = default;

std::shared_ptr<CallSpec::InputSpec> TimeGetUptime::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> TimeGetUptime::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaInt::New());
}

void TimeGetUptime::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(
        *output,
        [&] {
            HostCtl::AdvStats::ServerStats stats;
            stats.FetchAllStats();
            Answer(*output, MetaObj::MetaInt::New(static_cast<long>(stats.GetUptime())));
        },
        "Unable to get system uptime: ");
}

}  // namespace OstrelCli::System

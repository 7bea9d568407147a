#include "identity/TimeGetSystem.h"

#include <cerrno>
#include <cstring>
#include <iomanip>
#include <sstream>

#include "os/HostOs.h"

namespace OstrelCli::System {

std::shared_ptr<TimeGetSystem> TimeGetSystem::New() {
    return AdoptSelf(std::shared_ptr<TimeGetSystem>(new TimeGetSystem));
}

TimeGetSystem::TimeGetSystem() {
    Describe(*this, "Disply the current system time.", "simple", "fetcher");
}

TimeGetSystem::~TimeGetSystem() = default;

std::shared_ptr<CallSpec::InputSpec> TimeGetSystem::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> TimeGetSystem::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaString::New());
}

void TimeGetSystem::ExecuteInternal(InputPtr, OutputPtr output) {
    const time_t now = HostOs::time(nullptr);
    const struct tm* local = HostOs::localtime(&now);
    if (local == nullptr) {  // a clock beyond what a calendar record can hold
        Fail(*output, std::strerror(errno));
        return;
    }
    // The fields are local time; the trailing "Z" is part of the established output.
    std::ostringstream text;
    text << std::setfill('0') << std::setw(4) << local->tm_year + 1900 << '-' << std::setw(2)
         << local->tm_mon + 1 << '-' << std::setw(2) << local->tm_mday << 'T' << std::setw(2)
         << local->tm_hour << ':' << std::setw(2) << local->tm_min << ':' << std::setw(2)
         << local->tm_sec << 'Z';
    Answer(*output, MetaObj::MetaString::New(text.str()));
}

}  // namespace OstrelCli::System

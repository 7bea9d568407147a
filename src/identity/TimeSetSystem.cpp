#include "identity/TimeSetSystem.h"

#include <cerrno>
#include <climits>
#include <cstring>

#include "os/HostOs.h"

namespace OstrelCli::System {

namespace {

// One calendar field of `time set`: its option, its accepted range and its message.
struct Field {
    const char* name;
    long min;
    long max;
    const char* message;
    int tm::*member;
    long offset;  // subtracted before storing
};

// Checked and taken in this order. 1970 passes although the message says "> 1970"; hour 24
// and minute or second 60 pass and are normalised by mktime.
constexpr Field kFields[] = {
    {"year", 1970, LONG_MAX, "Year must be > 1970", &tm::tm_year, 1900},
    {"month", 1, 12, "Month must be between 1 and 12", &tm::tm_mon, 1},
    {"day", 1, 31, "Invalid day", &tm::tm_mday, 0},
    {"hour", 0, 24, "Invalid hour", &tm::tm_hour, 0},
    {"min", 0, 60, "Invalid minute", &tm::tm_min, 0},
    {"sec", 0, 60, "Invalid second", &tm::tm_sec, 0},
};

}  // namespace

std::shared_ptr<TimeSetSystem> TimeSetSystem::New() {
    return AdoptSelf(std::shared_ptr<TimeSetSystem>(new TimeSetSystem));
}

TimeSetSystem::TimeSetSystem() {
    Describe(*this,
             "Set the system clock time. Any missing parameters will default to the current time",
             nullptr, "operation");
}

TimeSetSystem::~TimeSetSystem() = default;

std::shared_ptr<CallSpec::InputSpec> TimeSetSystem::GetInputSpecInternal() {
    return Params()
        .Add("year", CallSpec::PARAM_INT, "y", "Year", false)
        .Add("month", CallSpec::PARAM_INT, "M", "Month", false)
        .Add("day", CallSpec::PARAM_INT, "d", "Day", false)
        .Add("hour", CallSpec::PARAM_INT, "H", "Hour", false)
        .Add("min", CallSpec::PARAM_INT, "m", "Minute", false)
        .Add("sec", CallSpec::PARAM_INT, "s", "Second", false);
}

std::shared_ptr<CallSpec::OutputSpec> TimeSetSystem::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void TimeSetSystem::ExecuteInternal(InputPtr input, OutputPtr output) {
    // Fields not given keep their current value, the daylight-saving flag included.
    const time_t now = HostOs::time(nullptr);
    struct tm broken {};
    HostOs::localtime_r(&now, &broken);

    bool any = false;
    for (const Field& field : kFields) any = any || input->HasParameter(field.name);
    if (!any) {
        Fail(*output, "You must specify one of year, month, day, hour, minute or second");
        return;
    }
    bool representable = true;
    for (const Field& field : kFields) {
        if (!input->HasParameter(field.name)) continue;
        const long value = input->GetParameterInt(field.name);
        if (value < field.min || value > field.max) {
            Fail(*output, field.message);
            return;
        }
        // Only a year can be too large for the calendar record; no clock can hold it.
        if (value - field.offset > INT_MAX) {
            representable = false;
        } else {
            broken.*field.member = static_cast<int>(value - field.offset);
        }
    }

    const time_t when = representable ? HostOs::mktime(&broken) : static_cast<time_t>(-1);
    if (when == static_cast<time_t>(-1)) {
        Fail(*output, "Invalid time");
        return;
    }
    const struct timeval clock { when, 0 };
    if (HostOs::settimeofday(&clock, nullptr) != 0) {
        Fail(*output, std::string("Unable to set time: ") + std::strerror(errno));
        return;
    }
    Succeed(*output);
}

}  // namespace OstrelCli::System

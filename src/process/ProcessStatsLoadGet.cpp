#include "process/ProcessStatsLoadGet.h"

#include <iomanip>
#include <sstream>

#include "hostctl/ServerStats.h"
#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

namespace {

const std::string& kDoc = MetaObj::MetaStruct::_docEmpty;

// A load figure divided by the scale, in fixed notation with two decimals. No guard against
// a zero scale: the stream then writes its infinity or not-a-number text.
std::string LoadText(uint32_t figure, float divisor) {
    std::ostringstream text;
    text << std::fixed << std::setprecision(2) << static_cast<float>(figure) / divisor;
    return text.str();
}

}  // namespace

std::shared_ptr<ProcessStatsLoadGet> ProcessStatsLoadGet::New() {
    return AdoptSelf(std::shared_ptr<ProcessStatsLoadGet>(new ProcessStatsLoadGet));
}

ProcessStatsLoadGet::ProcessStatsLoadGet() {
    Describe(*this, "System load average over the last 1, 5 and 15 minutes.", "simple", "fetcher");
}

ProcessStatsLoadGet::~ProcessStatsLoadGet() = default;

std::shared_ptr<MetaObj::MetaStruct> ProcessStatsLoadGet::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("ProcessStatsLoadGet");
    result->SetField("Load 1 Minute", MetaObj::MetaString::New(), kDoc);
    result->SetField("Load 5 Minutes", MetaObj::MetaString::New(), kDoc);
    result->SetField("Load 15 Minutes", MetaObj::MetaString::New(), kDoc);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> ProcessStatsLoadGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> ProcessStatsLoadGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void ProcessStatsLoadGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::System::SystemInfoImpl systemInfo;
        HostCtl::AdvStats::ServerStats stats;
        stats.FetchAllStats();
        // The figures are kept as N x 100 times the load; the product is a 32-bit int.
        const auto scale = static_cast<int32_t>(static_cast<uint32_t>(stats.GetLoadCount()) * 100u);
        const auto divisor = static_cast<float>(scale);
        auto result = GetOutputStructure();
        result->SetField("Load 1 Minute", LoadText(stats.GetLoad1(), divisor), kDoc);
        result->SetField("Load 5 Minutes", LoadText(stats.GetLoad5(), divisor), kDoc);
        result->SetField("Load 15 Minutes", LoadText(stats.GetLoad15(), divisor), kDoc);
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

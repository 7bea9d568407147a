#include "process/ProcessStatsRunningGet.h"

#include "hostctl/ServerStats.h"
#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<ProcessStatsRunningGet> ProcessStatsRunningGet::New() {
    return AdoptSelf(std::shared_ptr<ProcessStatsRunningGet>(new ProcessStatsRunningGet));
}

ProcessStatsRunningGet::ProcessStatsRunningGet() {
    Describe(*this, "Number of currently running processes.", "simple", "fetcher");
}

ProcessStatsRunningGet::~ProcessStatsRunningGet() = default;

std::shared_ptr<MetaObj::MetaStruct> ProcessStatsRunningGet::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("ProcessStatsRunningGet");
    result->SetField("Running Processes", MetaObj::MetaInt::New(), MetaObj::MetaStruct::_docEmpty);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> ProcessStatsRunningGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> ProcessStatsRunningGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void ProcessStatsRunningGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::System::SystemInfoImpl systemInfo;
        HostCtl::AdvStats::ServerStats stats;
        stats.FetchAllStats();
        auto result = GetOutputStructure();
        result->SetField("Running Processes", static_cast<long>(stats.GetRunningProcesses()),
                         MetaObj::MetaStruct::_docEmpty);
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

#include "coredump/KernelDumpPartitionGet.h"

#include "kernctl/Storage.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpPartitionGet> KernelDumpPartitionGet::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpPartitionGet>(new KernelDumpPartitionGet));
}

KernelDumpPartitionGet::KernelDumpPartitionGet() {
    Describe(*this,
             "Get one of the dump partition configured values. This command will print either the "
             "active dump partition or the configured dump partition depending on the flags "
             "passed.",
             "simple", "fetcher");
}

KernelDumpPartitionGet::~KernelDumpPartitionGet() = default;

std::shared_ptr<MetaObj::MetaStruct> KernelDumpPartitionGet::GetOutputStructure() {
    // The structure's name is spelled this way on purpose.
    auto result = MetaObj::MetaStruct::New("KernelDumpParition");
    result->SetField("Active", "", MetaObj::MetaStruct::_docEmpty);
    result->SetField("Configured", "", MetaObj::MetaStruct::_docEmpty);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> KernelDumpPartitionGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpPartitionGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void KernelDumpPartitionGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Storage::StorageInfoImpl storage;
        const auto active = storage.GetActiveDiagnosticPartition();
        const auto configured = storage.GetConfiguredDiagnosticPartition();
        std::string activeName;
        std::string configuredName;
        if (active) activeName = active->GetName();
        if (configured) configuredName = configured->GetName();
        auto result = GetOutputStructure();
        result->SetField("Active", activeName, MetaObj::MetaStruct::_docEmpty);
        result->SetField("Configured", configuredName, MetaObj::MetaStruct::_docEmpty);
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

#include "coredump/KernelDumpDornaGet.h"

#include "kernctl/Storage.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpDornaGet> KernelDumpDornaGet::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpDornaGet>(new KernelDumpDornaGet));
}

KernelDumpDornaGet::KernelDumpDornaGet() {
    Describe(*this, "Get the UUID of the active and/or configured Dorna dump object.", "simple",
             "fetcher");
}

KernelDumpDornaGet::~KernelDumpDornaGet() = default;

std::shared_ptr<MetaObj::MetaStruct> KernelDumpDornaGet::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("KernelDumpDorna");
    result->SetField("Active", "", MetaObj::MetaStruct::_docEmpty);
    result->SetField("Configured", "", MetaObj::MetaStruct::_docEmpty);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> KernelDumpDornaGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpDornaGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void KernelDumpDornaGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Storage::StorageInfoImpl storage;
        const auto active = storage.GetActiveDiagnosticDorna();
        const auto configured = storage.GetConfiguredDiagnosticDorna();
        std::string activeUuid;
        std::string configuredUuid;
        if (active) activeUuid = active->GetUuid();
        if (configured) configuredUuid = configured->GetUuid();
        auto result = GetOutputStructure();
        result->SetField("Active", activeUuid, MetaObj::MetaStruct::_docEmpty);
        result->SetField("Configured", configuredUuid, MetaObj::MetaStruct::_docEmpty);
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

#include "coredump/KernelDumpFileGet.h"

#include "kernctl/Storage.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpFileGet> KernelDumpFileGet::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpFileGet>(new KernelDumpFileGet));
}

KernelDumpFileGet::KernelDumpFileGet() {
    Describe(*this,
             "Get the dump file path. This command will print the path to the active and/or "
             "configured DSFS Dump File.",
             "simple", "fetcher");
}

KernelDumpFileGet::~KernelDumpFileGet() = default;

std::shared_ptr<MetaObj::MetaStruct> KernelDumpFileGet::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("KernelDumpFile");
    result->SetField("Active", "", MetaObj::MetaStruct::_docEmpty);
    result->SetField("Configured", "", MetaObj::MetaStruct::_docEmpty);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> KernelDumpFileGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpFileGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void KernelDumpFileGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Storage::StorageInfoImpl storage;
        const auto active = storage.GetActiveDiagnosticFile();
        const auto configured = storage.GetConfiguredDiagnosticFile();
        std::string activePath;
        std::string configuredPath;
        if (active) activePath = active->GetPath();
        if (configured) configuredPath = configured->GetPath();
        auto result = GetOutputStructure();
        result->SetField("Active", activePath, MetaObj::MetaStruct::_docEmpty);
        result->SetField("Configured", configuredPath, MetaObj::MetaStruct::_docEmpty);
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

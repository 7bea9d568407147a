#include "coredump/KernelDumpFileList.h"

#include "coredump/DumpTargetList.h"
#include "kernctl/Storage.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpFileList> KernelDumpFileList::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpFileList>(new KernelDumpFileList));
}

KernelDumpFileList::KernelDumpFileList() {
    Describe(*this, "List the active and configured DSFS Diagnostic Files.", "table", "fetcher");
    SetDefaultOutputParameter("fields:DumpFile", "Path,Active,Configured,Size");
}

KernelDumpFileList::~KernelDumpFileList() = default;

std::shared_ptr<MetaObj::MetaStruct> KernelDumpFileList::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("DumpFile");
    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    result->SetField("Path", "", doc);
    result->SetField("Active", false, doc);
    result->SetField("Configured", false, doc);
    result->SetField("Size", MetaObj::MetaInt::New(), doc);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> KernelDumpFileList::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpFileList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void KernelDumpFileList::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Storage::StorageInfoImpl storage;
        auto list = StructList(GetOutputStructure());
        const auto path = [](const HostCtl::Storage::DiagnosticFile& file) {
            return file.GetPath();
        };
        const std::string configured =
            ReadTargetIdQuietly([&] { return storage.GetConfiguredDiagnosticFile(); }, path);
        const std::string active =
            ReadTargetIdQuietly([&] { return storage.GetActiveDiagnosticFile(); }, path);
        ListDumpTargets<KernCtl::Storage::DiagnosticFileImpl>(
            storage.GetPotentialDiagnosticFiles(), configured, active, path, "Path",
            [] { return MetaObj::MetaStruct::New("DumpFile"); }, *list);
        Answer(*output, list);
    });
}

}  // namespace OstrelCli::System

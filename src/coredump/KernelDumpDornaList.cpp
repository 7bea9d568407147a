#include "coredump/KernelDumpDornaList.h"

#include "coredump/DumpTargetList.h"
#include "kernctl/Storage.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpDornaList> KernelDumpDornaList::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpDornaList>(new KernelDumpDornaList));
}

KernelDumpDornaList::KernelDumpDornaList() {
    Describe(*this, "List all local Diagnostic Dorna dump objects.", "table", "fetcher");
    SetDefaultOutputParameter("fields:DumpDorna", "UUID,Active,Configured,Size");
}

KernelDumpDornaList::~KernelDumpDornaList() = default;

std::shared_ptr<MetaObj::MetaStruct> KernelDumpDornaList::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("DumpDorna");
    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    result->SetField("UUID", "", doc);
    result->SetField("Active", false, doc);
    result->SetField("Configured", false, doc);
    result->SetField("Size", MetaObj::MetaInt::New(), doc);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> KernelDumpDornaList::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpDornaList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void KernelDumpDornaList::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Storage::StorageInfoImpl storage;
        auto list = StructList(GetOutputStructure());
        const auto uuid = [](const HostCtl::Storage::DiagnosticDorna& object) {
            return object.GetUuid();
        };
        const std::string configured =
            ReadTargetIdQuietly([&] { return storage.GetConfiguredDiagnosticDorna(); }, uuid);
        const std::string active =
            ReadTargetIdQuietly([&] { return storage.GetActiveDiagnosticDorna(); }, uuid);
        ListDumpTargets<KernCtl::Storage::DiagnosticDornaImpl>(
            storage.GetPotentialDiagnosticDornas(), configured, active, uuid, "UUID",
            [] { return MetaObj::MetaStruct::New("DumpDorna"); }, *list);
        Answer(*output, list);
    });
}

}  // namespace OstrelCli::System

#include "coredump/KernelDumpPartitionList.h"

#include "kernctl/Storage.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpPartitionList> KernelDumpPartitionList::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpPartitionList>(new KernelDumpPartitionList));
}

KernelDumpPartitionList::KernelDumpPartitionList() {
    Describe(*this,
             "List all of the partitions on the system that have a partition type matching the "
             "Ostrel Core partition type. Also indicate which partition, if any, is being used as "
             "the system's dump partition and which is configured to be used at next boot.",
             "table", "fetcher");
    SetDefaultOutputParameter("fields:DumpPartition", "Name,Path,Active,Configured");
}

KernelDumpPartitionList::~KernelDumpPartitionList() = default;

std::shared_ptr<MetaObj::MetaStruct> KernelDumpPartitionList::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("DumpPartition");
    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    result->SetField("Name", "", doc);
    result->SetField("Path", "", doc);
    result->SetField("Active", false, doc);
    result->SetField("Configured", false, doc);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> KernelDumpPartitionList::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpPartitionList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void KernelDumpPartitionList::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Storage::StorageInfoImpl storage;
        auto list = StructList(GetOutputStructure());
        const auto partitions = storage.GetPotentialDiagnosticPartitions();
        // Without a readable configured partition the list is still worth showing.
        std::unique_ptr<HostCtl::Storage::DiagnosticPartition> configured;
        try {
            configured = storage.GetConfiguredDiagnosticPartition();
        } catch (const HostCtl::Lib::HostCtlException&) {
            output->AddErrorMessage("no configured dump partition found; skipping");
        }
        const auto active = storage.GetActiveDiagnosticPartition();
        const std::string activeName = active ? active->GetName() : std::string();
        const std::string configuredName = configured ? configured->GetName() : std::string();
        list->Reserve(partitions.size());
        const auto& doc = MetaObj::MetaStruct::_docEmpty;
        for (const auto& partition : partitions) {
            const std::string name = partition->GetName();
            auto row = MetaObj::MetaStruct::New("DumpPartition");
            row->SetField("Name", name, doc);
            row->SetField("Path", partition->GetPath(), doc);
            row->SetField("Active", active != nullptr && name == activeName, doc);
            row->SetField("Configured", configured != nullptr && name == configuredName, doc);
            list->Add(row);
        }
        Answer(*output, list);
    });
}

}  // namespace OstrelCli::System

#include "memfs/QuillfsTardiskList.h"

#include "memfs/KsiRecord.h"

namespace OstrelCli::System {

namespace {

const std::string& kDoc = MetaObj::MetaStruct::_docEmpty;
namespace T = KernCtl::Ksi::TardiskRecord;

}  // namespace

std::shared_ptr<QuillfsTardiskList> QuillfsTardiskList::New() {
    return AdoptSelf(std::shared_ptr<QuillfsTardiskList>(new QuillfsTardiskList));
}

QuillfsTardiskList::QuillfsTardiskList() {
    Describe(*this, "List the tardisks used by the host.", "table", "operation");
    SetDefaultOutputParameter("table-columns", "Tardisk Name,System,Size");
    SetDefaultOutputParameter("units:QuillfsTardisk.Size", "B");
}

QuillfsTardiskList::~QuillfsTardiskList() = default;

std::shared_ptr<MetaObj::MetaStruct> QuillfsTardiskList::GetOutputStructure() {
    auto row = MetaObj::MetaStruct::New("QuillfsTardisk");
    row->SetField("Tardisk Name", MetaObj::MetaString::New(), kDoc);
    row->SetField("System", MetaObj::MetaBool::New(), kDoc);
    row->SetField("Size", MetaObj::MetaInt::New(), kDoc);
    return row;
}

std::shared_ptr<CallSpec::InputSpec> QuillfsTardiskList::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> QuillfsTardiskList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void QuillfsTardiskList::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        auto list = StructList(GetOutputStructure());
        ForEachInstance(KSI_NODE_system_quillfs_tardisks, KSI_NODE_system_quillfs_tardisks_stats,
                        T::kSize, [&](const std::string& name, const unsigned char* record) {
                            auto row = GetOutputStructure();
                            row->SetField("Tardisk Name", name, kDoc);
                            row->SetField("System", record[T::kSystem] != 0, kDoc);
                            row->SetField("Size", static_cast<long>(ReadU32(record, T::kBytes)),
                                          kDoc);
                            list->Add(row);
                        });
        Answer(*output, list);
    });
}

}  // namespace OstrelCli::System

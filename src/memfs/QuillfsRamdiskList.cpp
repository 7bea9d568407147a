#include "memfs/QuillfsRamdiskList.h"

#include "memfs/KsiRecord.h"

namespace OstrelCli::System {

namespace {

const std::string& kDoc = MetaObj::MetaStruct::_docEmpty;
namespace R = KernCtl::Ksi::RamdiskRecord;

}  // namespace

std::shared_ptr<QuillfsRamdiskList> QuillfsRamdiskList::New() {
    return AdoptSelf(std::shared_ptr<QuillfsRamdiskList>(new QuillfsRamdiskList));
}

QuillfsRamdiskList::QuillfsRamdiskList() {
    Describe(*this, "List the RAM disks used by the host.", "table", "operation");
    SetDefaultOutputParameter("table-columns",
                              "Ramdisk Name,System,Include in Coredumps,Reserved,Maximum,Used,Peak "
                              "Used,Free,Reserved Free,Maximum Inodes,Allocated Inodes,Used "
                              "Inodes,Mount Point");
    for (const char* field : {"Reserved", "Maximum", "Used", "Peak Used"}) {
        SetDefaultOutputParameter(std::string("units:QuillfsRamdisk.") + field, "KiB");
    }
    SetDefaultOutputParameter("units:QuillfsRamdisk.Free", "%");
    SetDefaultOutputParameter("units:QuillfsRamdisk.Reserved Free", "%");
}

QuillfsRamdiskList::~QuillfsRamdiskList() = default;

std::shared_ptr<MetaObj::MetaStruct> QuillfsRamdiskList::GetOutputStructure() {
    auto row = MetaObj::MetaStruct::New("QuillfsRamdisk");
    row->SetField("Ramdisk Name", MetaObj::MetaString::New(), kDoc);
    row->SetField("System", MetaObj::MetaBool::New(), kDoc);
    row->SetField("Include in Coredumps", MetaObj::MetaBool::New(), kDoc);
    for (const char* field : {"Reserved", "Maximum", "Used", "Peak Used", "Free", "Reserved Free",
                              "Maximum Inodes", "Allocated Inodes", "Used Inodes"}) {
        row->SetField(field, MetaObj::MetaInt::New(), kDoc);
    }
    row->SetField("Mount Point", MetaObj::MetaString::New(), kDoc);
    return row;
}

std::shared_ptr<CallSpec::InputSpec> QuillfsRamdiskList::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> QuillfsRamdiskList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void QuillfsRamdiskList::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        auto list = StructList(GetOutputStructure());
        ForEachInstance(
            KSI_NODE_system_quillfs_ramdisks, KSI_NODE_system_quillfs_ramdisks_stats, R::kSize,
            [&](const std::string& name, const unsigned char* record) {
                // Sizes in KiB: the kernel counts MiB for the limits and 4 KiB pages for use.
                const int64_t reserved = int64_t{ReadU32(record, R::kReservedMib)} * 1024;
                const int64_t maximum = int64_t{ReadU32(record, R::kMaximumMib)} * 1024;
                const int64_t used = int64_t{ReadU32(record, R::kUsedPages)} * 4;
                const int64_t peakUsed = int64_t{ReadU32(record, R::kPeakPages)} * 4;
                const int64_t free = maximum == 0 ? 0 : (maximum - used) * 100 / maximum;
                const int64_t reservedFree =
                    used >= reserved ? 0 : (reserved - used) * 100 / reserved;

                auto row = GetOutputStructure();
                row->SetField("Ramdisk Name", name, kDoc);
                row->SetField("System", record[R::kSystem] != 0, kDoc);
                row->SetField("Include in Coredumps", record[R::kCoredump] != 0, kDoc);
                row->SetField("Reserved", static_cast<long>(reserved), kDoc);
                row->SetField("Maximum", static_cast<long>(maximum), kDoc);
                row->SetField("Used", static_cast<long>(used), kDoc);
                row->SetField("Peak Used", static_cast<long>(peakUsed), kDoc);
                row->SetField("Free", static_cast<long>(free), kDoc);
                row->SetField("Reserved Free", static_cast<long>(reservedFree), kDoc);
                row->SetField("Maximum Inodes", static_cast<long>(ReadU32(record, R::kMaxInodes)),
                              kDoc);
                row->SetField("Allocated Inodes",
                              static_cast<long>(ReadU32(record, R::kAllocatedInodes)), kDoc);
                row->SetField("Used Inodes", static_cast<long>(ReadU32(record, R::kUsedInodes)),
                              kDoc);
                row->SetField("Mount Point", ReadText(record, R::kMountPoint, R::kMountPointWidth),
                              kDoc);
                list->Add(row);
            });
        Answer(*output, list);
    });
}

}  // namespace OstrelCli::System

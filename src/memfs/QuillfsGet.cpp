#include "memfs/QuillfsGet.h"

#include "memfs/KsiRecord.h"

namespace OstrelCli::System {

namespace {

const std::string& kDoc = MetaObj::MetaStruct::_docEmpty;
namespace S = KernCtl::Ksi::QuillfsStatusRecord;

const char* const kFields[] = {
    "Total Inodes",         "Used Inodes",        "Unlinked Inodes",
    "Reserved Inodes",      "Peak Used Inodes",   "Peak Unlinked Inodes",
    "Peak Reserved Inodes", "Free Inode Percent", "Lowest Free Inode Percent",
};

}  // namespace

std::shared_ptr<QuillfsGet> QuillfsGet::New() {
    return AdoptSelf(std::shared_ptr<QuillfsGet>(new QuillfsGet));
}

QuillfsGet::QuillfsGet() {
    Describe(*this, "Obtain status information on the memory filesystem as a whole.", "simple",
             "operation");
    SetDefaultOutputParameter(
        "fields:QuillfsStatus",
        "Total Inodes,Used Inodes,Unlinked Inodes,Reserved Inodes,Peak Used Inodes,Peak Unlinked "
        "Inodes,Peak Reserved Inodes,Free Inode Percent,Lowest Free Inode Percent");
    SetDefaultOutputParameter("show-header:QuillfsStatus", "false");
}

QuillfsGet::~QuillfsGet() = default;

std::shared_ptr<MetaObj::MetaStruct> QuillfsGet::GetOutputStructure() {
    auto status = MetaObj::MetaStruct::New("QuillfsStatus");
    for (const char* field : kFields) status->SetField(field, MetaObj::MetaInt::New(), kDoc);
    return status;
}

std::shared_ptr<CallSpec::InputSpec> QuillfsGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> QuillfsGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void QuillfsGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Util::Sysinfo node(KSI_NODE_system_quillfs_stats);
        unsigned char record[S::kSize];
        node.Get(record, sizeof record);
        const int64_t total = ReadU32(record, S::kTotal);
        const int64_t used = ReadU32(record, S::kUsed);
        const int64_t peakUsed = ReadU32(record, S::kPeakUsed);

        auto status = GetOutputStructure();
        status->SetField("Total Inodes", static_cast<long>(total), kDoc);
        status->SetField("Used Inodes", static_cast<long>(used), kDoc);
        status->SetField("Peak Used Inodes", static_cast<long>(peakUsed), kDoc);
        status->SetField("Unlinked Inodes", static_cast<long>(ReadU32(record, S::kUnlinked)), kDoc);
        status->SetField("Reserved Inodes", static_cast<long>(ReadU32(record, S::kReserved)), kDoc);
        status->SetField("Peak Unlinked Inodes",
                         static_cast<long>(ReadU32(record, S::kPeakUnlinked)), kDoc);
        status->SetField("Peak Reserved Inodes",
                         static_cast<long>(ReadU32(record, S::kPeakReserved)), kDoc);
        // The kernel never reports a total of zero.
        status->SetField("Free Inode Percent", static_cast<long>((total - used) * 100 / total),
                         kDoc);
        status->SetField("Lowest Free Inode Percent",
                         static_cast<long>((total - peakUsed) * 100 / total), kDoc);
        Answer(*output, status);
    });
}

}  // namespace OstrelCli::System

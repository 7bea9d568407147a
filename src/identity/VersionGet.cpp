#include "identity/VersionGet.h"

#include <cstring>

#include "kernctl/Sysinfo.h"

namespace OstrelCli::System {

namespace {

// The kernel's system-version record: NUL-terminated text fields at fixed offsets.
constexpr size_t kRecordSize = 312;
struct TextField {
    size_t offset;
    size_t width;
};
constexpr TextField kProduct{0, 32};
constexpr TextField kVersion{32, 32};
constexpr TextField kBuild{64, 96};
constexpr TextField kUpdate{160, 32};
constexpr TextField kPatch{192, 120};

std::string Read(const char* record, TextField field) {
    const char* start = record + field.offset;
    return std::string(start, strnlen(start, field.width));
}

}  // namespace

std::shared_ptr<VersionGet> VersionGet::New() {
    return AdoptSelf(std::shared_ptr<VersionGet>(new VersionGet));
}

VersionGet::VersionGet() {
    Describe(*this, "Display the product name, version and build information.", "simple",
             "fetcher");
    SetDefaultOutputParameter("fields:VersionGet", "Product,Version,Build,Update,Patch");
    SetDefaultOutputParameter("show-header:VersionGet", "false");
}

VersionGet::~VersionGet() = default;

std::shared_ptr<MetaObj::MetaStruct> VersionGet::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("VersionGet");
    for (const char* field : {"Product", "Version", "Build", "Update", "Patch"}) {
        result->SetField(field, "", MetaObj::MetaStruct::_docEmpty);
    }
    return result;
}

std::shared_ptr<CallSpec::InputSpec> VersionGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> VersionGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void VersionGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(
        *output,
        [&] {
            auto result = MetaObj::MetaStruct::New("VersionGet");
            KernCtl::Util::Sysinfo node(KSI_NODE_system_version);
            char record[kRecordSize] = {};
            node.Get(record, sizeof record);
            const auto& doc = MetaObj::MetaStruct::_docEmpty;
            result->SetField("Build", Read(record, kBuild), doc);
            result->SetField("Version", Read(record, kVersion), doc);
            result->SetField("Product", Read(record, kProduct), doc);
            result->SetField("Update", Read(record, kUpdate), doc);
            result->SetField("Patch", Read(record, kPatch), doc);
            Answer(*output, result);
        },
        "Unable to query product version: ");
}

}  // namespace OstrelCli::System

#include "identity/ReadCacheGet.h"

#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<ReadCacheGet> ReadCacheGet::New() {
    return AdoptSelf(std::shared_ptr<ReadCacheGet>(new ReadCacheGet));
}

ReadCacheGet::ReadCacheGet() {
    Describe(*this, "Get the status of the Content Based Read Cache.", "simple", "fetcher");
}

ReadCacheGet::~ReadCacheGet() = default;

std::shared_ptr<MetaObj::MetaStruct> ReadCacheGet::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("CBRCStatus");
    result->SetField("Active", false, MetaObj::MetaStruct::_docEmpty);
    result->SetField("Enabled On Reboot", false, MetaObj::MetaStruct::_docEmpty);
    return result;
}

std::shared_ptr<CallSpec::InputSpec> ReadCacheGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> ReadCacheGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void ReadCacheGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::System::SystemInfoImpl systemInfo;
        auto result = GetOutputStructure();
        result->SetField("Active", systemInfo.GetCbrcRuntimeEnabled(),
                         MetaObj::MetaStruct::_docEmpty);
        result->SetField("Enabled On Reboot", systemInfo.GetCbrcConfiguredEnabled(),
                         MetaObj::MetaStruct::_docEmpty);
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

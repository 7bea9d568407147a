#include "identity/BootDeviceGet.h"

#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<BootDeviceGet> BootDeviceGet::New() {
    return AdoptSelf(std::shared_ptr<BootDeviceGet>(new BootDeviceGet));
}

BootDeviceGet::BootDeviceGet() {
    Describe(*this, "Get the systems boot device.", "simple", "fetcher");
}

BootDeviceGet::~BootDeviceGet() = default;

std::shared_ptr<MetaObj::MetaStruct> BootDeviceGet::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("SystemBootDevice");
    for (const char* field : {"Boot NIC", "Boot Filesystem UUID", "Stateless Boot NIC"}) {
        result->SetField(field, "", MetaObj::MetaStruct::_docEmpty);
    }
    return result;
}

std::shared_ptr<CallSpec::InputSpec> BootDeviceGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> BootDeviceGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void BootDeviceGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        auto result = MetaObj::MetaStruct::New("SystemBootDevice");
        KernCtl::System::SystemInfoImpl systemInfo;
        const auto& doc = MetaObj::MetaStruct::_docEmpty;
        result->SetField("Boot NIC", systemInfo.GetBootNicMacAddress(), doc);
        result->SetField("Boot Filesystem UUID", systemInfo.GetBootFsUUID(), doc);
        result->SetField("Stateless Boot NIC", systemInfo.GetStatelessBootNicMacAddress(), doc);
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System

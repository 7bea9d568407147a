#include "identity/UuidGet.h"

#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<UuidGet> UuidGet::New() {
    return AdoptSelf(std::shared_ptr<UuidGet>(new UuidGet));
}

UuidGet::UuidGet() {
    Describe(*this, "Get the system UUID.", "simple", "fetcher");
}

UuidGet::~UuidGet() = default;

std::shared_ptr<CallSpec::InputSpec> UuidGet::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> UuidGet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaString::New());
}

void UuidGet::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::System::SystemInfoImpl systemInfo;
        Answer(*output, MetaObj::MetaString::New(systemInfo.GetSystemUuid()));
    });
}

}  // namespace OstrelCli::System

#include "identity/ReadCacheSet.h"

#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<ReadCacheSet> ReadCacheSet::New() {
    return AdoptSelf(std::shared_ptr<ReadCacheSet>(new ReadCacheSet));
}

// Marked a fetcher although it changes the configured state; its callers rely on the mark.
ReadCacheSet::ReadCacheSet() {
    Describe(*this, "Configure the Content Based Read Cache", nullptr, "fetcher");
}

ReadCacheSet::~ReadCacheSet() = default;

std::shared_ptr<CallSpec::InputSpec> ReadCacheSet::GetInputSpecInternal() {
    return Params().Add("enabled", CallSpec::PARAM_BOOL, "e",
                        "Indicate to the system whether it should enable the content based read "
                        "cache module in the brixkernel",
                        true);
}

std::shared_ptr<CallSpec::OutputSpec> ReadCacheSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void ReadCacheSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::System::SystemInfoImpl systemInfo;
        systemInfo.SetCbrcEnabled(input->GetParameterBool("enabled"));
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System

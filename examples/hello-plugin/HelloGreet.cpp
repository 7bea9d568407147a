#include "HelloGreet.h"

namespace HelloCli {

namespace CallSpec = CmdKit::CallSpec;
namespace MetaObj = CmdKit::MetaObj;

std::shared_ptr<HelloGreet> HelloGreet::New() {
    return AdoptSelf(std::shared_ptr<HelloGreet>(new HelloGreet));
}

HelloGreet::HelloGreet() {
    SetDescription("Greet someone by name.");
    SetDefaultOutputFormatter("simple");
    SetMetaDataField("type", "fetcher");
}

HelloGreet::~HelloGreet() = default;

std::shared_ptr<CallSpec::InputSpec> HelloGreet::GetInputSpecInternal() {
    auto spec = CallSpec::InputSpec::New();
    auto name = CallSpec::ParameterSpec::New("name", CallSpec::PARAM_STRING);
    name->SetShortName("n");
    name->SetDescription("Who to greet.");
    name->SetRequired(true);
    spec->AddParameter(name);
    return spec;
}

std::shared_ptr<CallSpec::OutputSpec> HelloGreet::GetOutputSpecInternal() {
    auto spec = CallSpec::OutputSpec::New();
    spec->SetRootObject(MetaObj::MetaString::New());
    return spec;
}

void HelloGreet::ExecuteInternal(std::shared_ptr<CallSpec::Input> input,
                                 std::shared_ptr<CallSpec::Output> output) {
    const std::string name = input->GetParameter("name");
    if (name.empty()) {
        output->AddErrorMessage("The name must not be empty.");
        return;
    }
    output->SetRootObject(MetaObj::MetaString::New("Hello, " + name + "!"));
    output->SetComplete();
}

}  // namespace HelloCli

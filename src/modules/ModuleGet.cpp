#include "modules/ModuleGet.h"

#include <string>
#include <vector>

#include "kernctl/Module.h"
#include "modules/GetModuleInfo.h"

namespace OstrelCli::System {

std::shared_ptr<ModuleGet> ModuleGet::New() {
    return AdoptSelf(std::shared_ptr<ModuleGet>(new ModuleGet));
}

ModuleGet::ModuleGet() {
    Describe(*this, "Show information for a Brixkernel module.", "simple", "fetcher");
    SetDefaultOutputParameter("fields:ModuleDetails",
                              "Module,Module File,License,Version,Build Type,Provided Namespaces,"
                              "Required Namespaces,Containing QPK,QPK Acceptance Level");
}

ModuleGet::~ModuleGet() = default;

std::shared_ptr<MetaObj::MetaStruct> ModuleGet::GetOutputStructure() {
    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    auto details = MetaObj::MetaStruct::New("ModuleDetails");
    for (const char* field : {"Module", "Module File", "License", "Version", "Build Type",
                              "File Version", "Provided Namespaces"}) {
        details->SetField(field, "", doc);
    }
    details->SetField("Required Namespaces", std::vector<std::string>(), doc);
    for (const char* field : {"Signed Status", "Signature Issuer", "Signature Digest",
                              "Signature FingerPrint", "Containing QPK", "QPK Acceptance Level"}) {
        details->SetField(field, "", doc);
    }
    return details;
}

std::shared_ptr<CallSpec::InputSpec> ModuleGet::GetInputSpecInternal() {
    return Params()
        .Add("module", CallSpec::PARAM_STRING, "m", "The name of the Brixkernel module.", true)
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> ModuleGet::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void ModuleGet::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        const std::string name = input->GetParameter("module");
        KernCtl::System::ModuleImpl module(name);
        if (!KernCtl::System::ModuleImpl::IsValidName(name)) {
            Fail(*output, "unknown module '" + MessageExcerpt(name) + "'");
            return;
        }
        auto details = GetOutputStructure();
        GetModuleInfo(module, *details);
        Answer(*output, details);
    });
}

}  // namespace OstrelCli::System

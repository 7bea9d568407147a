#include "modules/ModuleParametersList.h"

#include <string>

#include "kernctl/Module.h"

namespace OstrelCli::System {

std::shared_ptr<ModuleParametersList> ModuleParametersList::New() {
    return AdoptSelf(std::shared_ptr<ModuleParametersList>(new ModuleParametersList));
}

ModuleParametersList::ModuleParametersList() {
    Describe(*this,
             "List the parameters, a descriptions of each parameter supported for a given module "
             "name and the user defined value for each parameter.",
             "table", "fetcher");
    SetDefaultOutputParameter("fields:ModuleParameter", "Name,Type,Value,Description");
}

ModuleParametersList::~ModuleParametersList() = default;

std::shared_ptr<MetaObj::MetaStruct> ModuleParametersList::GetOutputStructure() {
    auto row = MetaObj::MetaStruct::New("ModuleParameter");
    for (const char* field : {"Name", "Type", "Value", "Description"}) {
        row->SetField(field, "", MetaObj::MetaStruct::_docEmpty);
    }
    return row;
}

std::shared_ptr<CallSpec::InputSpec> ModuleParametersList::GetInputSpecInternal() {
    return Params()
        .Add("module", CallSpec::PARAM_STRING, "m",
             "The name of the Brixkernel module to get the option string for.", true)
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> ModuleParametersList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void ModuleParametersList::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        const std::string name = input->GetParameter("module");
        KernCtl::System::ModuleImpl module(name);
        const auto declared = module.GetParameters();
        const auto configured = module.GetOptions();
        if (!KernCtl::System::ModuleImpl::IsValidName(name)) {
            Fail(*output, "unknown module '" + MessageExcerpt(name) + "'");
            return;
        }
        const auto& doc = MetaObj::MetaStruct::_docEmpty;
        auto list = StructList(GetOutputStructure());
        list->Reserve(declared.size());
        for (const auto& parameter : declared) {
            auto row = MetaObj::MetaStruct::New("ModuleParameter");
            row->SetField("Name", parameter.name, doc);
            row->SetField("Type", parameter.type, doc);
            const auto value = configured.find(parameter.name);
            row->SetField("Value", value == configured.end() ? std::string() : value->second, doc);
            row->SetField("Description", parameter.description, doc);
            list->Add(row);
        }
        Answer(*output, list);
    });
}

}  // namespace OstrelCli::System

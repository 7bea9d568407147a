#include "settings/SettingsKernelList.h"

#include <string>
#include <vector>

#include "kernctl/KernelOpts.h"
#include "settings/IsDelta.h"

namespace OstrelCli::System {

std::shared_ptr<SettingsKernelList> SettingsKernelList::New() {
    return AdoptSelf(std::shared_ptr<SettingsKernelList>(new SettingsKernelList));
}

SettingsKernelList::SettingsKernelList() {
    Describe(*this, "List Brixkernel kernel settings.", "table", "fetcher");
    SetDefaultOutputParameter("fields:SettingsKernel",
                              "Name,Type,Description,Configured,Runtime,Default");
    SetDefaultOutputParameter("wrap-last", "true");
}

SettingsKernelList::~SettingsKernelList() = default;

std::shared_ptr<MetaObj::MetaStruct> SettingsKernelList::GetOutputStructure() {
    auto row = MetaObj::MetaStruct::New("SettingsKernel");
    for (const char* field : {"Name", "Type", "Description", "Configured", "Runtime", "Default"}) {
        row->SetField(field, "", MetaObj::MetaStruct::_docEmpty);
    }
    return row;
}

std::shared_ptr<CallSpec::InputSpec> SettingsKernelList::GetInputSpecInternal() {
    return Params()
        .Add("option", CallSpec::PARAM_STRING, "o",
             "The name of the Brixkernel kernel setting to get.", false)
        .Add("delta", CallSpec::PARAM_FLAG, "d",
             "Only display options whose values differ from their default.", false)
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> SettingsKernelList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void SettingsKernelList::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::System::KernelOpts options;
        const bool delta = input->IsFlagSet("delta");
        const std::vector<std::string> names = input->HasParameter("option")
                                                   ? std::vector{input->GetParameter("option")}
                                                   : options.GetOptionNames();

        const auto& doc = MetaObj::MetaStruct::_docEmpty;
        auto list = StructList(GetOutputStructure());
        for (const auto& name : names) {
            const auto type = options.GetOptionType(name);
            const auto description = options.GetOptionDescription(name);
            const auto configured = options.GetOption(name);
            const auto runtime = options.GetRuntimeValue(name);
            const auto defaultValue = options.GetOptionDefault(name);
            if (delta && !IsDelta(type, defaultValue, configured, runtime)) continue;

            auto row = MetaObj::MetaStruct::New("SettingsKernel");
            row->SetField("Name", name, doc);
            row->SetField("Type", options.GetOptionTypeString(type), doc);
            row->SetField("Description", description, doc);
            row->SetField("Configured", configured, doc);
            row->SetField("Runtime", runtime, doc);
            row->SetField("Default", defaultValue, doc);
            list->Add(row);
        }
        Answer(*output, list);
    });
}

}  // namespace OstrelCli::System

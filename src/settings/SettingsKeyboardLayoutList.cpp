#include "settings/SettingsKeyboardLayoutList.h"

#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<SettingsKeyboardLayoutList> SettingsKeyboardLayoutList::New() {
    return AdoptSelf(std::shared_ptr<SettingsKeyboardLayoutList>(new SettingsKeyboardLayoutList));
}

SettingsKeyboardLayoutList::SettingsKeyboardLayoutList() {
    Describe(*this, "List the keyboard layout", "table", "fetcher");
    SetDefaultOutputParameter("fields:Layout", "Layout");
}

SettingsKeyboardLayoutList::~SettingsKeyboardLayoutList() = default;

std::shared_ptr<MetaObj::MetaStruct> SettingsKeyboardLayoutList::GetOutputStructure() {
    auto row = MetaObj::MetaStruct::New("Layout");
    row->SetField("Layout", "", MetaObj::MetaStruct::_docEmpty);
    return row;
}

std::shared_ptr<CallSpec::InputSpec> SettingsKeyboardLayoutList::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> SettingsKeyboardLayoutList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void SettingsKeyboardLayoutList::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        auto list = StructList(GetOutputStructure());
        KernCtl::System::SystemInfoImpl systemInfo;
        for (const auto& name : systemInfo.GetKeyboardLayouts()) {
            auto row = MetaObj::MetaStruct::New("Layout");
            row->SetField("Layout", name, MetaObj::MetaStruct::_docEmpty);
            list->Add(row);
        }
        Answer(*output, list);
    });
}

}  // namespace OstrelCli::System

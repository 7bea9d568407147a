#include "modules/ModuleList.h"

#include "hostctl/Module.h"
#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<ModuleList> ModuleList::New() {
    return AdoptSelf(std::shared_ptr<ModuleList>(new ModuleList));
}

ModuleList::ModuleList() {
    Describe(*this, "List the Brixkernel modules that the system knows about.", "table", "fetcher");
    SetDefaultOutputParameter("fields:Module", "Name,Is Loaded,Is Enabled");
}

ModuleList::~ModuleList() = default;

std::shared_ptr<MetaObj::MetaStruct> ModuleList::GetOutputStructure() {
    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    auto row = MetaObj::MetaStruct::New("Module");
    row->SetField("Name", "", doc);
    row->SetField("Is Loaded", false, doc);
    row->SetField("Is Enabled", false, doc);
    return row;
}

std::shared_ptr<CallSpec::InputSpec> ModuleList::GetInputSpecInternal() {
    return Params()
        .Add("loaded", CallSpec::PARAM_BOOL, "l",
             "List the loaded / not loaded Brixkernel modules and device drivers.", false)
        .Add("enabled", CallSpec::PARAM_BOOL, "e",
             "List the enabled / disabled Brixkernel modules and device drivers.", false)
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> ModuleList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void ModuleList::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        const bool filterLoaded = input->HasParameter("loaded");
        const bool wantLoaded = filterLoaded && input->GetParameterBool("loaded");
        const bool filterEnabled = input->HasParameter("enabled");
        const bool wantEnabled = filterEnabled && input->GetParameterBool("enabled");

        auto modules = KernCtl::System::SystemInfoImpl().GetModules();
        auto each = [=](const RowCallback& emit) {
            const auto& doc = MetaObj::MetaStruct::_docEmpty;
            modules->Each([&](HostCtl::System::Module& module) {
                const bool loaded = module.IsLoaded();
                const bool enabled = module.IsEnabled();
                if (filterLoaded && loaded != wantLoaded) return;
                if (filterEnabled && enabled != wantEnabled) return;
                auto row = MetaObj::MetaStruct::New("Module");
                row->SetField("Name", module.GetName(), doc);
                row->SetField("Is Loaded", loaded, doc);
                row->SetField("Is Enabled", enabled, doc);
                emit(row);
            });
        };
        Answer(*output, StreamedList(GetOutputStructure(), each));
    });
}

}  // namespace OstrelCli::System

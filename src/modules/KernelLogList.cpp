#include "modules/KernelLogList.h"

#include <optional>
#include <string>
#include <vector>

#include "hostctl/Module.h"
#include "kernctl/Module.h"
#include "kernctl/SystemInfoImpl.h"

namespace OstrelCli::System {

std::shared_ptr<KernelLogList> KernelLogList::New() {
    return AdoptSelf(std::shared_ptr<KernelLogList>(new KernelLogList));
}

KernelLogList::KernelLogList() {
    Describe(*this,
             "List the current loglevels available in the Brixkernel. Optionally with the "
             "--module option list the loglevels for a given module.",
             "table", "fetcher");
    SetDefaultOutputParameter("fields:LogLevel", "Name,Current Level,Default Level");
}

KernelLogList::~KernelLogList() = default;

std::shared_ptr<MetaObj::MetaStruct> KernelLogList::GetOutputStructure() {
    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    auto row = MetaObj::MetaStruct::New("LogLevel");
    row->SetField("Name", "", doc);
    row->SetField("Current Level", MetaObj::MetaInt::New(), doc);
    row->SetField("Default Level", MetaObj::MetaInt::New(), doc);
    return row;
}

std::shared_ptr<CallSpec::InputSpec> KernelLogList::GetInputSpecInternal() {
    return Params()
        .Add("module", CallSpec::PARAM_STRING, "m",
             "List the log levels for a given Brixkernel module instead of the Brixkernel core "
             "loglevels.",
             false)
        .Add("level-name", CallSpec::PARAM_STRING, "l",
             "Limit the output of this command to a specific log level with the given name.", false)
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> KernelLogList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void KernelLogList::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::System::SystemInfoImpl systemInfo;
        auto list = StructList(GetOutputStructure());
        std::optional<std::string> filter;
        if (input->HasParameter("level-name")) filter = input->GetParameter("level-name");

        std::vector<HostCtl::System::LogLevel> levels;
        if (input->HasParameter("module")) {
            const std::string name = input->GetParameter("module");
            auto module = systemInfo.GetModuleByName(name);
            auto* kernelModule = dynamic_cast<KernCtl::System::ModuleImpl*>(module.get());
            if (kernelModule == nullptr) {
                Fail(*output, "Could not find module with the name '" + MessageExcerpt(name) + "'");
                return;
            }
            levels = kernelModule->GetLogLevels();
        } else {
            levels = systemInfo.GetAllLogLevels();
        }

        const auto& doc = MetaObj::MetaStruct::_docEmpty;
        for (const auto& level : levels) {
            if (filter && level.GetName() != *filter) continue;
            auto row = MetaObj::MetaStruct::New("LogLevel");
            row->SetField("Name", level.GetName(), doc);
            row->SetField("Current Level", static_cast<long>(level.GetCurrentLevel()), doc);
            row->SetField("Default Level", static_cast<long>(level.GetDefaultLevel()), doc);
            list->Add(row);
        }
        Answer(*output, list);
    });
}

}  // namespace OstrelCli::System

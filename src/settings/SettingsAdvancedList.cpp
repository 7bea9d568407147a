#include "settings/SettingsAdvancedList.h"

#include <string>

#include "hostctl/Misc.h"
#include "kernctl/Adv.h"
#include "settings/FormatOption.h"

namespace OstrelCli::System {

std::shared_ptr<SettingsAdvancedList> SettingsAdvancedList::New() {
    return AdoptSelf(std::shared_ptr<SettingsAdvancedList>(new SettingsAdvancedList));
}

SettingsAdvancedList::SettingsAdvancedList() {
    Describe(*this, "List the advanced options available from the Brixkernel.", "simple",
             "fetcher");
    SetDefaultOutputParameter("fields:SettingsAdvancedOption",
                              "Path,Type,Int Value,Default Int Value,Min Value,Max Value,"
                              "String Value,Default String Value,Valid Characters,Description");
}

SettingsAdvancedList::~SettingsAdvancedList() = default;

std::shared_ptr<MetaObj::MetaStruct> SettingsAdvancedList::GetOutputStructure() {
    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    auto row = MetaObj::MetaStruct::New("SettingsAdvancedOption");
    row->SetField("Path", "", doc);
    row->SetField("Type", "", doc);
    for (const char* field : {"Int Value", "Default Int Value", "Min Value", "Max Value"}) {
        row->SetField(field, MetaObj::MetaInt::New(), doc);
    }
    for (const char* field :
         {"String Value", "Default String Value", "Valid Characters", "Description"}) {
        row->SetField(field, "", doc);
    }
    return row;
}

std::shared_ptr<CallSpec::InputSpec> SettingsAdvancedList::GetInputSpecInternal() {
    return Params()
        .Add("tree", CallSpec::PARAM_STRING, "t",
             "Limit the list of advanced option to a specific sub tree.", false)
        .Add("option", CallSpec::PARAM_STRING, "o",
             "Only get the information for a single Brixkernel advanced option.", false)
        .Add("delta", CallSpec::PARAM_FLAG, "d",
             "Only display options whose values differ from their default.", false)
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> SettingsAdvancedList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void SettingsAdvancedList::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        auto list = StructList(GetOutputStructure());
        if (input->HasParameter("option")) {
            // A single option is shown whatever its value: no delta, no tree.
            auto option =
                KernCtl::Adv::AdvancedOptionImpl::FindOption(input->GetParameter("option"));
            if (option) {
                bool include = true;
                list->Add(FormatOption(*option, false, include));
            }
            Answer(*output, list);
            return;
        }

        std::shared_ptr<HostCtl::Adv::AdvancedOptionBranch> branch =
            std::make_shared<KernCtl::Adv::AdvancedOptionBranchImpl>();
        const bool hasTree = input->HasParameter("tree");
        const std::string tree = hasTree ? input->GetParameter("tree") : std::string();
        const bool delta = input->IsFlagSet("delta");
        if (hasTree) {
            for (const auto& name : HostCtl::Misc::StringTokenize(tree, "/")) {
                branch = branch->GetBranch(name);
                if (!branch) break;
            }
        }
        if (branch) {
            Answer(*output,
                   StreamedList(GetOutputStructure(), [branch, delta](const RowCallback& row) {
                       FormatBranch(*branch, row, delta);
                   }));
            return;
        } else {
            // The caller still receives the (empty) list.
            output->AddErrorMessage("Invalid value for --tree No tree with the name " +
                                    MessageExcerpt(tree) + " found");
        }
        Answer(*output, list);
    });
}

}  // namespace OstrelCli::System

#include "identity/SecpolicyDomainList.h"

#include "kernctl/KernAccess.h"

namespace OstrelCli::System {

std::shared_ptr<SecpolicyDomainList> SecpolicyDomainList::New() {
    return AdoptSelf(std::shared_ptr<SecpolicyDomainList>(new SecpolicyDomainList));
}

SecpolicyDomainList::SecpolicyDomainList() {
    Describe(*this, "List the enforcement level for each domain.", "table", "fetcher");
    SetDefaultOutputParameter("fields:DomainList", "Domain Name,Enforcement Level");
}

SecpolicyDomainList::~SecpolicyDomainList() = default;

std::shared_ptr<MetaObj::MetaStruct> SecpolicyDomainList::GetOutputStructure() {
    auto row = MetaObj::MetaStruct::New("DomainList");
    row->SetField("Domain Name", "", MetaObj::MetaStruct::_docEmpty);
    row->SetField("Enforcement Level", "", MetaObj::MetaStruct::_docEmpty);
    return row;
}

std::shared_ptr<CallSpec::InputSpec> SecpolicyDomainList::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> SecpolicyDomainList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void SecpolicyDomainList::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        auto list = StructList(GetOutputStructure());
        KernCtl::Security::KernAccessInterfaceImpl access;
        access.GetKeywordsMap(KERNACCESS_KEYWORD_LEVEL);
        const uint32_t maxDomains = access.GetMaxDomains();
        for (uint32_t id = 0; id < maxDomains; ++id) {
            std::string name;
            std::string level;
            if (!access.GetDomainInfo(id, name, level)) continue;
            auto row = GetOutputStructure();
            row->SetField("Domain Name", name, MetaObj::MetaStruct::_docEmpty);
            row->SetField("Enforcement Level", level, MetaObj::MetaStruct::_docEmpty);
            list->Add(row);
        }
        Answer(*output, list);
    });
}

}  // namespace OstrelCli::System

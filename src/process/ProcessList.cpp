#include "process/ProcessList.h"

#include <string>
#include <unordered_map>

#include "kernctl/KernAccess.h"
#include "kernctl/Resource.h"

namespace OstrelCli::System {

namespace {
const std::string& kDoc = MetaObj::MetaStruct::_docEmpty;
}  // namespace

std::shared_ptr<ProcessList> ProcessList::New() {
    return AdoptSelf(std::shared_ptr<ProcessList>(new ProcessList));
}

ProcessList::ProcessList() {
    Describe(*this, "List the Brixkernel UserWorld processes currently on the host.", "table",
             "fetcher");
    SetDefaultOutputParameter("fields:UserWorld", "Id,Cartel Id,Name,Security Domain,Command Line");
}

ProcessList::~ProcessList() = default;

std::shared_ptr<MetaObj::MetaStruct> ProcessList::GetOutputStructure() {
    auto row = MetaObj::MetaStruct::New("UserWorld");
    row->SetField("Id", MetaObj::MetaInt::New(), kDoc);
    row->SetField("Name", MetaObj::MetaString::New(), kDoc);
    row->SetField("Command Line", MetaObj::MetaString::New(), kDoc);
    row->SetField("Cartel Id", MetaObj::MetaInt::New(), kDoc);
    row->SetField("Parent Cartel Id", MetaObj::MetaInt::New(), kDoc);
    row->SetField("World Group Id", MetaObj::MetaInt::New(), kDoc);
    row->SetField("Cartel Group Id", MetaObj::MetaInt::New(), kDoc);
    row->SetField("Session Id", MetaObj::MetaInt::New(), kDoc);
    row->SetField("World Flags", MetaObj::MetaInt::New(), kDoc);
    row->SetField("World State", MetaObj::MetaString::New(), kDoc);
    row->SetField("World Type", MetaObj::MetaString::New(), kDoc);
    row->SetField("Security Domain", MetaObj::MetaString::New(), kDoc);
    return row;
}

std::shared_ptr<CallSpec::InputSpec> ProcessList::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> ProcessList::GetOutputSpecInternal() {
    return Returns(StructList(GetOutputStructure()));
}

void ProcessList::ExecuteInternal(InputPtr, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Resource::ResourceInfoImpl resources;
        auto worlds = resources.GetAllWorlds();
        // A host has a handful of security domains and may have many thousands of worlds: each
        // domain's label is asked for once.
        auto labels = std::make_shared<std::unordered_map<uint32_t, std::string>>();
        auto each = [worlds, labels](const RowCallback& emit) {
            KernCtl::Security::KernAccessInterfaceImpl access;
            auto label = [&](uint32_t domain) -> const std::string& {
                auto found = labels->find(domain);
                if (found == labels->end()) {
                    found = labels->emplace(domain, access.GetLabel(domain, 0)).first;
                }
                return found->second;
            };
            worlds->Each([&](const HostCtl::Resource::World& world) {
                emit(Row(world, label(world.GetSecurityDomain())));
            });
        };
        Answer(*output, StreamedList(GetOutputStructure(), each));
    });
}

std::shared_ptr<MetaObj::MetaStruct> ProcessList::Row(const HostCtl::Resource::World& world,
                                                      const std::string& domainLabel) {
    auto row = MetaObj::MetaStruct::New("UserWorld");
    row->SetField("Id", static_cast<long>(world.GetId()), kDoc);
    row->SetField("Name", world.GetName(), kDoc);
    row->SetField("Command Line", world.GetCommandLine(), kDoc);
    row->SetField("Cartel Id", static_cast<long>(world.GetCartelId()), kDoc);
    row->SetField("Parent Cartel Id", static_cast<long>(world.GetParentCartelId()), kDoc);
    row->SetField("World Group Id", static_cast<long>(world.GetWorldGroupId()), kDoc);
    row->SetField("Cartel Group Id", static_cast<long>(world.GetCartelGroupId()), kDoc);
    row->SetField("Session Id", static_cast<long>(world.GetSessionId()), kDoc);
    row->SetField("World Flags", static_cast<long>(world.GetFlags()), kDoc);
    row->SetField("World State", world.GetStateName(), kDoc);
    row->SetField("World Type", world.GetTypeName(), kDoc);
    row->SetField("Security Domain", domainLabel, kDoc);
    return row;
}

}  // namespace OstrelCli::System

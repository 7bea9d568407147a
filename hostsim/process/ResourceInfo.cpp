// Resource information: the user-level worlds, read from the kernel's world records.
#include <iterator>
#include <string>
#include <utility>

#include "hostsim/core/KsiRecord.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"
#include "kernctl/Resource.h"
#include "kernctl/Sysinfo.h"
#include "kernctl/SysinfoRecords.h"

namespace {

const BrixSim::Operation kGetAllWorlds{"KernCtl::Resource::ResourceInfoImpl::GetAllWorlds"};

namespace R = KernCtl::Ksi::WorldRecord;
using KernCtl::Ksi::ReadU32;

// The kernel's names for its world state and type codes; a code this library does not know
// is shown with its number.
std::string StateName(uint8_t code) {
    static const char* const names[] = {"Ready",    "Running", "Waiting",
                                        "Sleeping", "Stopped", "Zombie"};
    if (code < std::size(names)) return names[code];
    return "Unknown (" + std::to_string(code) + ")";
}

std::string TypeName(uint8_t code) {
    static const char* const names[] = {"System", "Idle", "User", "Vcpu", "Helper"};
    if (code < std::size(names)) return names[code];
    return "Unknown (" + std::to_string(code) + ")";
}

class WorldImpl final : public HostCtl::Resource::World {
  public:
    explicit WorldImpl(const unsigned char* record)
        : id_(ReadU32(record, R::kId)),
          cartel_(ReadU32(record, R::kCartelId)),
          parentCartel_(ReadU32(record, R::kParentCartelId)),
          worldGroup_(ReadU32(record, R::kWorldGroupId)),
          cartelGroup_(ReadU32(record, R::kCartelGroupId)),
          session_(ReadU32(record, R::kSessionId)),
          flags_(ReadU32(record, R::kFlags)),
          state_(record[R::kState]),
          type_(record[R::kType]),
          domain_(ReadU32(record, R::kDomain)),
          name_(KernCtl::Ksi::ReadText(record, R::kName, R::kNameWidth)),
          commandLine_(KernCtl::Ksi::ReadText(record, R::kCommandLine, R::kCommandLineWidth)) {}

    uint32_t GetId() const override { return id_; }
    std::string GetName() const override { return name_; }
    std::string GetCommandLine() const override { return commandLine_; }
    uint32_t GetCartelId() const override { return cartel_; }
    uint32_t GetParentCartelId() const override { return parentCartel_; }
    uint32_t GetWorldGroupId() const override { return worldGroup_; }
    uint32_t GetCartelGroupId() const override { return cartelGroup_; }
    uint32_t GetSessionId() const override { return session_; }
    uint32_t GetFlags() const override { return flags_; }
    std::string GetStateName() const override { return StateName(state_); }
    std::string GetTypeName() const override { return TypeName(type_); }
    uint32_t GetSecurityDomain() const override { return domain_; }

  private:
    uint32_t id_, cartel_, parentCartel_, worldGroup_, cartelGroup_, session_, flags_;
    uint8_t state_, type_;
    uint32_t domain_;
    std::string name_, commandLine_;
};

// The listing's records through the system-information nodes, one at a time, all in the read
// transaction the list holds.
class WorldListImpl final : public HostCtl::Resource::WorldList {
  public:
    WorldListImpl() : hold_(BrixSim::Store::Get()) {}

    void Each(const std::function<void(const HostCtl::Resource::World&)>& world) override {
        KernCtl::Util::Sysinfo list(KSI_NODE_system_worlds);
        KernCtl::Util::Sysinfo info(KSI_NODE_system_worlds_info);
        unsigned char record[R::kSize];
        list.Each([&](const std::string& id) {
            info.ResetInstance();
            info.AddInstancePath(id);
            info.Get(record, sizeof record);
            world(WorldImpl(record));
        });
    }

  private:
    BrixSim::Store::ReadHold hold_;
};

}  // namespace

namespace KernCtl::Resource {

ResourceInfoImpl::ResourceInfoImpl() = default;
ResourceInfoImpl::~ResourceInfoImpl() = default;

std::shared_ptr<HostCtl::Resource::WorldList> ResourceInfoImpl::GetAllWorlds() {
    BrixSim::Store::Get().Check(kGetAllWorlds);
    return std::make_shared<WorldListImpl>();
}

}  // namespace KernCtl::Resource

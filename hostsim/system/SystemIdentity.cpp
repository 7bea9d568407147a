// The host's identity: UUID, boot devices, console banner, product version record and install
// time stamp, kept as scalar settings of the host.
#include <algorithm>
#include <cstring>

#include "hostctl/HostCtlException.h"
#include "hostctl/SystemInfo.h"
#include "hostsim/core/Hooks.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"
#include "kernctl/Sysinfo.h"
#include "kernctl/SystemInfoImpl.h"

namespace {

using BrixSim::Store;

const BrixSim::Operation kGetSystemUuid{"KernCtl::System::SystemInfoImpl::GetSystemUuid"};
const BrixSim::Operation kGetBootNic{"KernCtl::System::SystemInfoImpl::GetBootNicMacAddress"};
const BrixSim::Operation kGetBootFs{"KernCtl::System::SystemInfoImpl::GetBootFsUUID"};
const BrixSim::Operation kGetStatelessNic{
    "KernCtl::System::SystemInfoImpl::GetStatelessBootNicMacAddress"};
const BrixSim::Operation kGetWelcome{"KernCtl::System::SystemInfoImpl::GetWelcomeMessage"};
const BrixSim::Operation kSetWelcome{"KernCtl::System::SystemInfoImpl::SetWelcomeMessage"};
const BrixSim::Operation kGetInception{"HostCtl::System::SystemInfo::GetInceptionTime"};

// The system-version record: NUL-terminated text fields at fixed offsets.
struct VersionField {
    const char* key;
    size_t offset;
    size_t width;
};
constexpr size_t kVersionRecordSize = 312;
constexpr VersionField kVersionFields[] = {
    {"system.product", 0, 32},  {"system.version", 32, 32}, {"system.build", 64, 96},
    {"system.update", 160, 32}, {"system.patch", 192, 120},
};

void SeedIdentity(Store& store) {
    const std::pair<const char*, const char*> values[] = {
        {"system.uuid", "6a3f0c1e-52d8-4b7e-9f21-0c4d7e8a9b13"},
        {"system.boot_nic", ""},
        {"system.boot_fs_uuid", "c41f9e02-7d3a-4e6b-a8c5-2f90b17d64e8"},
        {"system.stateless_boot_nic", ""},
        {"system.welcome", "Welcome to Brix Host"},
        {"system.product", "Brix Host"},
        {"system.version", "8.2.0"},
        {"system.build", "Releasebuild-24160381"},
        {"system.update", "2"},
        {"system.patch", "41"},
        {"system.inception", "2025-03-14T09:26:53.589793+00:00"},
    };
    for (const auto& [key, value] : values) store.SetValue(key, value);
}

void GetVersionRecord(const std::vector<std::string>&, void* buffer, size_t size) {
    char record[kVersionRecordSize] = {};
    auto& store = Store::Get();
    for (const auto& field : kVersionFields) {
        const std::string text = store.GetValue(field.key, "");
        // Keep the terminating NUL inside the field.
        std::memcpy(record + field.offset, text.data(), std::min(text.size(), field.width - 1));
    }
    std::memset(buffer, 0, size);
    std::memcpy(buffer, record, std::min(size, sizeof record));
}

const bool registered = [] {
    BrixSim::RegisterSysinfoNode(KSI_NODE_system_version, {GetVersionRecord, nullptr});
    return BrixSim::RegisterTables({"identity", "", SeedIdentity});
}();

std::string Read(const BrixSim::Operation& operation, const char* key) {
    auto& store = Store::Get();
    store.Check(operation);
    return store.GetValue(key, "");
}

}  // namespace

namespace KernCtl::System {

SystemInfoImpl::SystemInfoImpl() = default;
SystemInfoImpl::~SystemInfoImpl() = default;

std::string SystemInfoImpl::GetSystemUuid() {
    return Read(kGetSystemUuid, "system.uuid");
}

std::string SystemInfoImpl::GetBootNicMacAddress() {
    return Read(kGetBootNic, "system.boot_nic");
}

std::string SystemInfoImpl::GetBootFsUUID() {
    return Read(kGetBootFs, "system.boot_fs_uuid");
}

std::string SystemInfoImpl::GetStatelessBootNicMacAddress() {
    return Read(kGetStatelessNic, "system.stateless_boot_nic");
}

std::string SystemInfoImpl::GetWelcomeMessage() {
    return Read(kGetWelcome, "system.welcome");
}

void SystemInfoImpl::SetWelcomeMessage(const std::string& text) {
    auto& store = Store::Get();
    store.Check(kSetWelcome);
    store.Write([&] {
        store.SetValue("system.welcome", text);
        store.JournalCall(kSetWelcome, {text});
    });
}

}  // namespace KernCtl::System

namespace HostCtl::System {

std::string SystemInfo::GetInceptionTime() {
    return Read(kGetInception, "system.inception");
}

}  // namespace HostCtl::System

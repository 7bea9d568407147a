// Diagnostic partitions of the simulated host: disks with partition tables, some partitions of
// the core-dump type, and the active and configured dump partition.
#include <optional>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/core/Operation.h"
#include "hostsim/coredump/DumpTargets.h"
#include "kernctl/Storage.h"

namespace {

using BrixSim::Store;
using BrixSim::Coredump::kPartitionKeys;
using HostCtl::Lib::HostCtlException;
using HostCtl::Storage::DiagnosticPartition;

const BrixSim::Operation kGetActive{
    "KernCtl::Storage::StorageInfoImpl::GetActiveDiagnosticPartition"};
const BrixSim::Operation kGetConfigured{
    "KernCtl::Storage::StorageInfoImpl::GetConfiguredDiagnosticPartition"};
const BrixSim::Operation kGetPotential{
    "KernCtl::Storage::StorageInfoImpl::GetPotentialDiagnosticPartitions"};
const BrixSim::Operation kSet{"KernCtl::Storage::StorageInfoImpl::SetDiagnosticPartition"};
const BrixSim::Operation kActivate{
    "KernCtl::Storage::StorageInfoImpl::ActivateDiagnosticPartition"};
const BrixSim::Operation kDeactivate{
    "KernCtl::Storage::StorageInfoImpl::DeactivateDiagnosticPartition"};
const BrixSim::Operation kSmart{
    "KernCtl::Storage::StorageInfoImpl::SmartActivateDiagnosticPartition"};
const BrixSim::Operation kUnconfigure{
    "KernCtl::Storage::StorageInfoImpl::UnconfigureDiagnosticPartition"};
const BrixSim::Operation kGetName{"HostCtl::Storage::DiagnosticPartition::GetName"};
const BrixSim::Operation kGetPath{"HostCtl::Storage::DiagnosticPartition::GetPath"};

constexpr const char* kCoreDumpType = "coredump";

const bool registered = [] {
    return BrixSim::RegisterTables({
        "coredump.partitions",
        "CREATE TABLE IF NOT EXISTS coredump_disks ("
        " name TEXT PRIMARY KEY,"    // device name, e.g. naa.6000c2912f4e8a61
        " ord INTEGER NOT NULL,"     // scan order
        " local INTEGER NOT NULL,"   // attached to this host (not shared storage)
        " online INTEGER NOT NULL,"  // the device answers I/O
        " vendor TEXT NOT NULL, model TEXT NOT NULL);"
        "CREATE TABLE IF NOT EXISTS coredump_partitions ("
        " disk TEXT NOT NULL,"  // a coredump_disks name
        " number INTEGER NOT NULL,"
        " type TEXT NOT NULL,"  // 'coredump', 'boot', 'dsfs', 'scratch'
        " size_mb INTEGER NOT NULL,"
        " PRIMARY KEY (disk, number));",
        [](Store& store) {
            struct Disk {
                const char* name;
                bool local;
                bool online;
                const char* vendor;
                const char* model;
            };
            const Disk disks[] = {
                {"naa.6000c2912f4e8a61", true, true, "Kestrel", "KS-480 NVMe"},
                {"naa.6000c29b7d03e145", true, true, "Kestrel", "KS-1920 SAS SSD"},
                {"naa.600a098038304b2f", false, true, "Tarnwell", "TW-Array 8400"},
                {"naa.6000c29e51c2d7f0", true, false, "Orbis", "OR-2T SATA"},
            };
            auto disk = store.Prepare("INSERT INTO coredump_disks VALUES (?, ?, ?, ?, ?, ?)");
            int ord = 0;
            for (const auto& d : disks) {
                disk.Bind(1, d.name).Bind(2, ord++).Bind(3, d.local).Bind(4, d.online);
                disk.Bind(5, d.vendor).Bind(6, d.model).Run();
                disk.Reset();
            }
            struct Partition {
                const char* disk;
                int number;
                const char* type;
                int sizeMb;
            };
            const Partition partitions[] = {
                {"naa.6000c2912f4e8a61", 1, "boot", 100},
                {"naa.6000c2912f4e8a61", 5, "boot", 4096},
                {"naa.6000c2912f4e8a61", 7, kCoreDumpType, 2560},
                {"naa.6000c2912f4e8a61", 8, "scratch", 4096},
                {"naa.6000c29b7d03e145", 1, "dsfs", 1830400},
                {"naa.6000c29b7d03e145", 2, kCoreDumpType, 2560},
                {"naa.600a098038304b2f", 1, kCoreDumpType, 4096},
                {"naa.600a098038304b2f", 2, "dsfs", 4190208},
                {"naa.6000c29e51c2d7f0", 3, kCoreDumpType, 2560},
            };
            auto part = store.Prepare("INSERT INTO coredump_partitions VALUES (?, ?, ?, ?)");
            for (const auto& p : partitions) {
                part.Bind(1, p.disk).Bind(2, p.number).Bind(3, p.type).Bind(4, p.sizeMb).Run();
                part.Reset();
            }
            store.SetValue(kPartitionKeys.active, "naa.6000c2912f4e8a61:7");
            store.SetValue(kPartitionKeys.configured, "naa.6000c2912f4e8a61:7");
        },
    });
}();

struct PartitionRow {
    std::string name;
    std::string type;
    bool local = false;
    bool online = false;
};

std::string DevicePath(const std::string& name) {
    return "/dev/disks/" + name;
}

std::unique_ptr<DiagnosticPartition> MakePartition(const std::string& name) {
    return std::make_unique<KernCtl::Storage::DiagnosticPartitionImpl>(name, DevicePath(name));
}

// The partition called "<disk>:<number>", if the host has it.
std::optional<PartitionRow> FindPartition(Store& store, const std::string& name) {
    const auto colon = name.rfind(':');
    if (colon == std::string::npos || colon == 0 || colon + 1 == name.size()) return std::nullopt;
    const std::string number = name.substr(colon + 1);
    if (number.find_first_not_of("0123456789") != std::string::npos || number.size() > 6) {
        return std::nullopt;
    }
    auto row = store.Prepare(
        "SELECT p.type, d.local, d.online FROM coredump_partitions p"
        " JOIN coredump_disks d ON d.name = p.disk WHERE p.disk = ? AND p.number = ?");
    row.Bind(1, name.substr(0, colon)).Bind(2, static_cast<int64_t>(std::stoll(number)));
    if (!row.Step()) return std::nullopt;
    return PartitionRow{name, row.Text(0), row.Int(1) != 0, row.Int(2) != 0};
}

// Every partition of the core-dump type, in device scan order.
std::vector<PartitionRow> CoreDumpPartitions(Store& store) {
    auto rows = store.Prepare(
        "SELECT p.disk || ':' || p.number, d.local, d.online FROM coredump_partitions p"
        " JOIN coredump_disks d ON d.name = p.disk WHERE p.type = ? ORDER BY d.ord, p.number");
    rows.Bind(1, kCoreDumpType);
    std::vector<PartitionRow> result;
    while (rows.Step()) {
        result.push_back({rows.Text(0), kCoreDumpType, rows.Int(1) != 0, rows.Int(2) != 0});
    }
    return result;
}

// A usable dump partition: exists, has the core-dump type, and its device is online.
PartitionRow RequireUsable(Store& store, const std::string& name) {
    auto partition = FindPartition(store, name);
    if (!partition)
        throw HostCtlException("Partition " + CmdKit::MessageExcerpt(name) + " not found.");
    if (partition->type != kCoreDumpType) {
        throw HostCtlException("Partition " + CmdKit::MessageExcerpt(name) +
                               " is not a diagnostic partition.");
    }
    if (!partition->online) {
        throw HostCtlException("Device " + CmdKit::MessageExcerpt(name.substr(0, name.rfind(':'))) +
                               " is not accessible.");
    }
    return *partition;
}

// The partition a setting names; throws when the setting names one the host no longer has.
std::unique_ptr<DiagnosticPartition> FromSetting(Store& store, const char* key, const char* which) {
    const std::string name = store.GetValue(key, "");
    if (name.empty()) return nullptr;
    if (!FindPartition(store, name)) {
        throw HostCtlException(std::string(which) + " diagnostic partition " +
                               CmdKit::MessageExcerpt(name) + " not found.");
    }
    return MakePartition(name);
}

}  // namespace

namespace KernCtl::Storage {

DiagnosticPartitionImpl::DiagnosticPartitionImpl(std::string name, std::string path)
    : name_(std::move(name)), path_(std::move(path)) {}

std::string DiagnosticPartitionImpl::GetName() const {
    Store::Get().Check(kGetName);
    return name_;
}

std::string DiagnosticPartitionImpl::GetPath() const {
    Store::Get().Check(kGetPath);
    return path_;
}

StorageInfoImpl::StorageInfoImpl() = default;
StorageInfoImpl::~StorageInfoImpl() = default;

std::unique_ptr<DiagnosticPartition> StorageInfoImpl::GetActiveDiagnosticPartition() {
    auto& store = Store::Get();
    store.Check(kGetActive);
    return FromSetting(store, kPartitionKeys.active, "Active");
}

std::unique_ptr<DiagnosticPartition> StorageInfoImpl::GetConfiguredDiagnosticPartition() {
    auto& store = Store::Get();
    store.Check(kGetConfigured);
    return FromSetting(store, kPartitionKeys.configured, "Configured");
}

std::vector<std::unique_ptr<DiagnosticPartition>>
StorageInfoImpl::GetPotentialDiagnosticPartitions() {
    auto& store = Store::Get();
    store.Check(kGetPotential);
    std::vector<std::unique_ptr<DiagnosticPartition>> result;
    for (const auto& partition : CoreDumpPartitions(store)) {
        result.push_back(MakePartition(partition.name));
    }
    return result;
}

void StorageInfoImpl::SetDiagnosticPartition(const std::string& name, bool activate) {
    auto& store = Store::Get();
    store.Check(kSet);
    BrixSim::Coredump::Mutate(kSet, {name, activate}, [&](Store& s) {
        RequireUsable(s, name);
        s.SetValue(kPartitionKeys.configured, name);
        if (activate) s.SetValue(kPartitionKeys.active, name);
    });
}

void StorageInfoImpl::ActivateDiagnosticPartition() {
    auto& store = Store::Get();
    store.Check(kActivate);
    BrixSim::Coredump::Mutate(kActivate, {}, [&](Store& s) {
        const std::string configured = s.GetValue(kPartitionKeys.configured, "");
        if (configured.empty()) throw HostCtlException("No diagnostic partition is configured.");
        RequireUsable(s, configured);
        s.SetValue(kPartitionKeys.active, configured);
    });
}

void StorageInfoImpl::DeactivateDiagnosticPartition() {
    auto& store = Store::Get();
    store.Check(kDeactivate);
    BrixSim::Coredump::Mutate(kDeactivate, {},
                              [&](Store& s) { s.SetValue(kPartitionKeys.active, ""); });
}

namespace {

// The configured partition when it is usable; otherwise the first usable one on a local disk,
// then the first usable one anywhere; "" when there is none.
std::string ChoosePartition(Store& store) {
    const std::string configured = store.GetValue(kPartitionKeys.configured, "");
    if (auto p = FindPartition(store, configured); p && p->type == kCoreDumpType && p->online) {
        return configured;
    }
    const auto candidates = CoreDumpPartitions(store);
    for (bool wantLocal : {true, false}) {
        for (const auto& p : candidates) {
            if (p.online && (p.local || !wantLocal)) return p.name;
        }
    }
    return "";
}

// At boot the host activates its dump partition by the same choice.
const bool restarts = BrixSim::RegisterBootStep(
    [](Store& store) { store.SetValue(kPartitionKeys.active, ChoosePartition(store)); });

}  // namespace

std::unique_ptr<DiagnosticPartition> StorageInfoImpl::SmartActivateDiagnosticPartition() {
    auto& store = Store::Get();
    store.Check(kSmart);
    std::string chosen;
    store.Write([&] {
        chosen = ChoosePartition(store);
        if (chosen.empty()) throw HostCtlException("No suitable diagnostic partition found.");
        store.SetValue(kPartitionKeys.active, chosen);
        store.JournalCall(kSmart, {chosen});
    });
    return MakePartition(chosen);
}

void StorageInfoImpl::UnconfigureDiagnosticPartition() {
    auto& store = Store::Get();
    store.Check(kUnconfigure);
    BrixSim::Coredump::Mutate(kUnconfigure, {},
                              [&](Store& s) { s.SetValue(kPartitionKeys.configured, ""); });
}

}  // namespace KernCtl::Storage

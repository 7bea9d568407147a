// Dorna dump objects of the simulated host: objects in the Dorna distributed storage, named by
// UUID, with their size and read count, and the active and configured object.
#include <algorithm>
#include <cstdio>
#include <optional>
#include <random>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/core/Operation.h"
#include "hostsim/coredump/DumpTargets.h"
#include "kernctl/Storage.h"

namespace {

using BrixSim::Store;
using BrixSim::Coredump::kDornaKeys;
using BrixSim::Coredump::kMiB;
using HostCtl::Lib::HostCtlException;
using HostCtl::Storage::DiagnosticDorna;

const BrixSim::Operation kCreate{"KernCtl::Storage::StorageInfoImpl::CreateDiagnosticDorna"};
const BrixSim::Operation kAutoAdd{"KernCtl::Storage::StorageInfoImpl::AutoAddDiagnosticDorna"};
const BrixSim::Operation kGetActive{"KernCtl::Storage::StorageInfoImpl::GetActiveDiagnosticDorna"};
const BrixSim::Operation kGetConfigured{
    "KernCtl::Storage::StorageInfoImpl::GetConfiguredDiagnosticDorna"};
const BrixSim::Operation kGetPotential{
    "KernCtl::Storage::StorageInfoImpl::GetPotentialDiagnosticDornas"};
const BrixSim::Operation kSet{"KernCtl::Storage::StorageInfoImpl::SetDiagnosticDorna"};
const BrixSim::Operation kActivate{"KernCtl::Storage::StorageInfoImpl::ActivateDiagnosticDorna"};
const BrixSim::Operation kDeactivate{
    "KernCtl::Storage::StorageInfoImpl::DeactivateDiagnosticDorna"};
const BrixSim::Operation kSmart{"KernCtl::Storage::StorageInfoImpl::SmartActivateDiagnosticDorna"};
const BrixSim::Operation kUnconfigure{
    "KernCtl::Storage::StorageInfoImpl::UnconfigureDiagnosticDorna"};
const BrixSim::Operation kReadCount{"KernCtl::Storage::StorageInfoImpl::GetDumpDornaReadCount"};
const BrixSim::Operation kRemove{"KernCtl::Storage::DiagnosticDornaImpl::DumpDornaRemove"};
const BrixSim::Operation kGetUuid{"HostCtl::Storage::DiagnosticDorna::GetUuid"};
const BrixSim::Operation kGetSize{"HostCtl::Storage::DiagnosticDorna::GetSize"};
const BrixSim::Operation kIsValid{"HostCtl::Storage::DiagnosticDorna::IsValid"};

// Kernel option that lets AutoAddDiagnosticDorna create an object (kept as a host setting).
constexpr const char* kAutoCreateOption = "coredump.autoCreateDumpDorna";
// Room in the Dorna storage for dump objects.
constexpr const char* kCapacityKey = "coredump.dorna.capacity_mb";

const bool registered = [] {
    return BrixSim::RegisterTables({
        "coredump.dorna",
        "CREATE TABLE IF NOT EXISTS coredump_dorna ("
        " uuid TEXT PRIMARY KEY,"
        " seq INTEGER NOT NULL,"  // creation order
        " size_bytes INTEGER NOT NULL,"
        " allocated INTEGER NOT NULL,"  // space fully reserved in the Dorna storage
        " read_count INTEGER);",        // times its dump was read; NULL = unknown
        [](Store& store) {
            store.SetInt(kAutoCreateOption, 1);
            store.SetInt(kCapacityKey, 262144);
            const int64_t bytes =
                static_cast<int64_t>(BrixSim::Coredump::DefaultDumpSizeMb(131072) * kMiB);
            store.Prepare("INSERT INTO coredump_dorna VALUES (?, 1, ?, 1, 2)")
                .Bind(1, "3c9e7a41-5b2d-4f86-a1c0-7d84e2b9f615")
                .Bind(2, bytes)
                .Run();
            store.Prepare("INSERT INTO coredump_dorna VALUES (?, 2, ?, 1, NULL)")
                .Bind(1, "b81f04d6-2e7c-4a93-9d58-16fa0c3e72ab")
                .Bind(2, bytes * 2)
                .Run();
            store.SetValue(kDornaKeys.active, "3c9e7a41-5b2d-4f86-a1c0-7d84e2b9f615");
            store.SetValue(kDornaKeys.configured, "3c9e7a41-5b2d-4f86-a1c0-7d84e2b9f615");
        },
    });
}();

std::string NewUuid() {
    std::random_device device;
    std::uniform_int_distribution<unsigned> byte(0, 255);
    unsigned char b[16];
    for (auto& v : b) v = static_cast<unsigned char>(byte(device));
    b[6] = static_cast<unsigned char>((b[6] & 0x0f) | 0x40);
    b[8] = static_cast<unsigned char>((b[8] & 0x3f) | 0x80);
    char text[37];
    std::snprintf(text, sizeof text,
                  "%02x%02x%02x%02x-%02x%02x-%02x%02x-%02x%02x-%02x%02x%02x%02x%02x%02x", b[0],
                  b[1], b[2], b[3], b[4], b[5], b[6], b[7], b[8], b[9], b[10], b[11], b[12], b[13],
                  b[14], b[15]);
    return text;
}

// Size and allocation state of an object, if the Dorna storage holds it.
struct DornaRow {
    int64_t size = 0;
    bool allocated = false;
};

std::optional<DornaRow> FindObject(Store& store, const std::string& uuid) {
    auto row = store.Prepare("SELECT size_bytes, allocated FROM coredump_dorna WHERE uuid = ?");
    row.Bind(1, uuid);
    if (!row.Step()) return std::nullopt;
    return DornaRow{row.Int(0), row.Int(1) != 0};
}

void RequireObject(Store& store, const std::string& uuid) {
    if (!FindObject(store, uuid))
        throw HostCtlException("Dorna dump object " + CmdKit::MessageExcerpt(uuid) + " not found.");
}

std::string CreateObject(Store& store, uint64_t sizeMb) {
    if (sizeMb == 0) {
        sizeMb =
            BrixSim::Coredump::DefaultDumpSizeMb(store.GetInt(BrixSim::Coredump::kMemoryKey, 0));
    }
    auto used = store.Prepare("SELECT COALESCE(SUM(size_bytes), 0) FROM coredump_dorna");
    used.Step();
    const int64_t freeMb = std::max<int64_t>(
        store.GetInt(kCapacityKey, 0) - used.Int(0) / static_cast<int64_t>(kMiB), 0);
    if (sizeMb > static_cast<uint64_t>(freeMb)) {
        throw HostCtlException(
            "Insufficient space in the Dorna storage: " + std::to_string(sizeMb) + " MB needed, " +
            std::to_string(freeMb) + " MB free.");
    }
    auto next = store.Prepare("SELECT COALESCE(MAX(seq), 0) + 1 FROM coredump_dorna");
    next.Step();
    const std::string uuid = NewUuid();
    store.Prepare("INSERT INTO coredump_dorna VALUES (?, ?, ?, 1, 0)")
        .Bind(1, uuid)
        .Bind(2, next.Int(0))
        .Bind(3, static_cast<int64_t>(sizeMb * kMiB))
        .Run();
    return uuid;
}

std::vector<std::string> AllObjects(Store& store) {
    auto rows = store.Prepare("SELECT uuid FROM coredump_dorna ORDER BY seq, uuid");
    std::vector<std::string> result;
    while (rows.Step()) result.push_back(rows.Text(0));
    return result;
}

std::unique_ptr<DiagnosticDorna> FromSetting(Store& store, const char* key) {
    const std::string uuid = store.GetValue(key, "");
    if (uuid.empty()) return nullptr;
    return std::make_unique<KernCtl::Storage::DiagnosticDornaImpl>(uuid);
}

void CreateAndEnable(Store& store, const BrixSim::Operation& operation, uint64_t sizeMb,
                     bool enable) {
    const std::string uuid = CreateObject(store, sizeMb);
    if (enable) {
        store.SetValue(kDornaKeys.configured, uuid);
        store.SetValue(kDornaKeys.active, uuid);
    }
    store.JournalCall(operation, {static_cast<int64_t>(sizeMb), enable, uuid});
}

}  // namespace

namespace KernCtl::Storage {

DiagnosticDornaImpl::DiagnosticDornaImpl(std::string uuid) : uuid_(std::move(uuid)) {}

std::string DiagnosticDornaImpl::GetUuid() const {
    Store::Get().Check(kGetUuid);
    return uuid_;
}

int64_t DiagnosticDornaImpl::GetSize() const {
    auto& store = Store::Get();
    store.Check(kGetSize);
    const auto row = FindObject(store, uuid_);
    if (!row)
        throw HostCtlException("Dorna dump object " + CmdKit::MessageExcerpt(uuid_) +
                               " not found.");
    return row->size;
}

bool DiagnosticDornaImpl::IsValid(bool checkHeader) const {
    auto& store = Store::Get();
    store.Check(kIsValid);
    const auto row = FindObject(store, uuid_);
    return row && row->size > 0 && (!checkHeader || row->allocated);
}

void DiagnosticDornaImpl::DumpDornaRemove(const std::string& uuid) {
    auto& store = Store::Get();
    store.Check(kRemove);
    BrixSim::Coredump::Mutate(kRemove, {uuid}, [&](Store& s) {
        RequireObject(s, uuid);
        s.Prepare("DELETE FROM coredump_dorna WHERE uuid = ?").Bind(1, uuid).Run();
    });
}

void StorageInfoImpl::CreateDiagnosticDorna(uint64_t sizeMb, bool enable) {
    auto& store = Store::Get();
    store.Check(kCreate);
    store.Write([&] { CreateAndEnable(store, kCreate, sizeMb, enable); });
}

void StorageInfoImpl::AutoAddDiagnosticDorna(uint64_t sizeMb, bool enable) {
    auto& store = Store::Get();
    store.Check(kAutoAdd);
    store.Write([&] {
        if (store.GetInt(kAutoCreateOption, 1) == 0 || !AllObjects(store).empty()) return;
        CreateAndEnable(store, kAutoAdd, sizeMb, enable);
    });
}

std::unique_ptr<DiagnosticDorna> StorageInfoImpl::GetActiveDiagnosticDorna() {
    auto& store = Store::Get();
    store.Check(kGetActive);
    return FromSetting(store, kDornaKeys.active);
}

std::unique_ptr<DiagnosticDorna> StorageInfoImpl::GetConfiguredDiagnosticDorna() {
    auto& store = Store::Get();
    store.Check(kGetConfigured);
    return FromSetting(store, kDornaKeys.configured);
}

std::vector<std::unique_ptr<DiagnosticDorna>> StorageInfoImpl::GetPotentialDiagnosticDornas() {
    auto& store = Store::Get();
    store.Check(kGetPotential);
    std::vector<std::unique_ptr<DiagnosticDorna>> result;
    for (const auto& uuid : AllObjects(store)) {
        result.push_back(std::make_unique<DiagnosticDornaImpl>(uuid));
    }
    return result;
}

void StorageInfoImpl::SetDiagnosticDorna(const std::string& uuid, bool activate) {
    auto& store = Store::Get();
    store.Check(kSet);
    BrixSim::Coredump::Mutate(kSet, {uuid, activate}, [&](Store& s) {
        RequireObject(s, uuid);
        s.SetValue(kDornaKeys.configured, uuid);
        if (activate) s.SetValue(kDornaKeys.active, uuid);
    });
}

void StorageInfoImpl::ActivateDiagnosticDorna() {
    auto& store = Store::Get();
    store.Check(kActivate);
    BrixSim::Coredump::Mutate(kActivate, {}, [&](Store& s) {
        const std::string configured = s.GetValue(kDornaKeys.configured, "");
        if (configured.empty()) throw HostCtlException("No Dorna dump object is configured.");
        RequireObject(s, configured);
        s.SetValue(kDornaKeys.active, configured);
    });
}

void StorageInfoImpl::DeactivateDiagnosticDorna() {
    auto& store = Store::Get();
    store.Check(kDeactivate);
    BrixSim::Coredump::Mutate(kDeactivate, {},
                              [&](Store& s) { s.SetValue(kDornaKeys.active, ""); });
}

namespace {

// The configured object when it is usable, otherwise the oldest usable one; "" when none.
std::string ChooseDorna(Store& store) {
    const std::string configured = store.GetValue(kDornaKeys.configured, "");
    if (auto row = FindObject(store, configured); row && row->allocated) return configured;
    for (const auto& uuid : AllObjects(store)) {
        if (auto row = FindObject(store, uuid); row && row->allocated) return uuid;
    }
    return "";
}

// At boot the host activates its Dorna dump object by the same choice.
const bool restarts = BrixSim::RegisterBootStep(
    [](Store& store) { store.SetValue(kDornaKeys.active, ChooseDorna(store)); });

}  // namespace

std::unique_ptr<DiagnosticDorna> StorageInfoImpl::SmartActivateDiagnosticDorna() {
    auto& store = Store::Get();
    store.Check(kSmart);
    std::string chosen;
    store.Write([&] {
        chosen = ChooseDorna(store);
        if (chosen.empty()) throw HostCtlException("No suitable Dorna dump object found.");
        store.SetValue(kDornaKeys.active, chosen);
        store.JournalCall(kSmart, {chosen});
    });
    return std::make_unique<DiagnosticDornaImpl>(chosen);
}

void StorageInfoImpl::UnconfigureDiagnosticDorna() {
    auto& store = Store::Get();
    store.Check(kUnconfigure);
    BrixSim::Coredump::Mutate(kUnconfigure, {},
                              [&](Store& s) { s.SetValue(kDornaKeys.configured, ""); });
}

bool StorageInfoImpl::GetDumpDornaReadCount(const std::string& uuid, uint32_t& count) {
    auto& store = Store::Get();
    store.Check(kReadCount);
    auto row = store.Prepare("SELECT read_count FROM coredump_dorna WHERE uuid = ?");
    row.Bind(1, uuid);
    if (!row.Step() || row.IsNull(0)) return false;
    count = static_cast<uint32_t>(std::clamp<int64_t>(row.Int(0), 0, UINT32_MAX));
    return true;
}

}  // namespace KernCtl::Storage

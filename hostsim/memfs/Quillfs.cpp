// The in-memory root file system: its RAM disks, tardisks and inode counters, and the kernel
// information nodes that publish them.
#include <algorithm>
#include <filesystem>
#include <string>
#include <vector>

#include "cmdkit/Text.h"
#include "hostsim/core/Hooks.h"
#include "hostsim/core/KsiRecord.h"
#include "hostsim/core/Store.h"
#include "hostsim/memfs/QuillfsState.h"
#include "kernctl/Sysinfo.h"

namespace {

using BrixSim::Store;
using HostCtl::Lib::HostCtlException;

namespace StatusRecord = KernCtl::Ksi::QuillfsStatusRecord;
namespace RamdiskRecord = KernCtl::Ksi::RamdiskRecord;
namespace TardiskRecord = KernCtl::Ksi::TardiskRecord;

const char kSchema[] =
    "CREATE TABLE IF NOT EXISTS quillfs_ramdisks ("
    " id INTEGER PRIMARY KEY,"  // creation order, the kernel's listing order
    " name TEXT NOT NULL UNIQUE,"
    " mount_point TEXT NOT NULL UNIQUE,"  // normalised absolute host path
    " reserved_mib INTEGER NOT NULL CHECK (reserved_mib BETWEEN 0 AND 4294967295),"
    " max_mib INTEGER NOT NULL CHECK (max_mib BETWEEN 0 AND 4294967295),"
    " used_pages INTEGER NOT NULL CHECK (used_pages BETWEEN 0 AND 4294967295),"  // 4 KiB pages
    " peak_pages INTEGER NOT NULL CHECK (peak_pages BETWEEN 0 AND 4294967295),"
    " coredump INTEGER NOT NULL CHECK (coredump IN (0, 1)),"
    " system INTEGER NOT NULL CHECK (system IN (0, 1)),"
    " permissions INTEGER NOT NULL CHECK (permissions BETWEEN 0 AND 4095),"  // mode of its root
    " reserved_inodes INTEGER NOT NULL CHECK (reserved_inodes BETWEEN 0 AND 4294967295),"
    " max_inodes INTEGER NOT NULL CHECK (max_inodes BETWEEN 0 AND 4294967295),"
    " allocated_inodes INTEGER NOT NULL CHECK (allocated_inodes BETWEEN 0 AND 4294967295),"
    " used_inodes INTEGER NOT NULL CHECK (used_inodes BETWEEN 0 AND 4294967295));"
    "CREATE TABLE IF NOT EXISTS quillfs_tardisks ("
    " id INTEGER PRIMARY KEY,"  // load order
    " name TEXT NOT NULL UNIQUE,"
    " size INTEGER NOT NULL CHECK (size >= 0),"  // bytes; the kernel counts them in 32 bits
    " system INTEGER NOT NULL CHECK (system IN (0, 1)));"
    // One row. Used and reserved inodes are the tardisks' (base_used) plus the RAM disks'.
    "CREATE TABLE IF NOT EXISTS quillfs_inodes ("
    " id INTEGER PRIMARY KEY CHECK (id = 1),"
    " total INTEGER NOT NULL CHECK (total BETWEEN 1 AND 4294967295),"
    " base_used INTEGER NOT NULL CHECK (base_used >= 0),"
    " unlinked INTEGER NOT NULL CHECK (unlinked >= 0),"
    " peak_used INTEGER NOT NULL CHECK (peak_used >= 0),"
    " peak_unlinked INTEGER NOT NULL CHECK (peak_unlinked >= 0),"
    " peak_reserved INTEGER NOT NULL CHECK (peak_reserved >= 0));";

struct RamdiskSeed {
    const char* name;
    const char* mountPoint;
    int reservedMib, maxMib, usedPages, peakPages;
    bool coredump, system;
    int permissions, reservedInodes, maxInodes, allocatedInodes, usedInodes;
};

void Seed(Store& store) {
    const RamdiskSeed ramdisks[] = {
        {"root", "/", 32, 32, 1480, 1903, true, true, 0755, 0, 8192, 8192, 5176},
        {"etc", "/etc", 28, 48, 224, 262, true, true, 0755, 0, 4096, 1024, 597},
        {"opt", "/opt", 0, 32, 3, 3, false, true, 0755, 0, 8192, 1024, 12},
        {"var", "/var", 5, 48, 108, 142, true, true, 0755, 0, 8192, 384, 306},
        {"tmp", "/tmp", 2, 256, 760, 3911, false, true, 01777, 256, 8192, 256, 14},
        {"hostdiag", "/var/run/hostdiag", 0, 16, 41, 77, false, false, 0700, 0, 1024, 128, 9},
    };
    auto insertRamdisk = store.Prepare(
        "INSERT INTO quillfs_ramdisks (name, mount_point, reserved_mib, max_mib, used_pages,"
        " peak_pages, coredump, system, permissions, reserved_inodes, max_inodes,"
        " allocated_inodes, used_inodes) VALUES (?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?)");
    for (const auto& disk : ramdisks) {
        insertRamdisk.Bind(1, disk.name)
            .Bind(2, disk.mountPoint)
            .Bind(3, disk.reservedMib)
            .Bind(4, disk.maxMib)
            .Bind(5, disk.usedPages)
            .Bind(6, disk.peakPages)
            .Bind(7, disk.coredump)
            .Bind(8, disk.system)
            .Bind(9, disk.permissions)
            .Bind(10, disk.reservedInodes)
            .Bind(11, disk.maxInodes)
            .Bind(12, disk.allocatedInodes)
            .Bind(13, disk.usedInodes)
            .Run();
        insertRamdisk.Reset();
        // The mount points exist on the host.
        if (auto path = store.Resolve(disk.mountPoint)) std::filesystem::create_directories(*path);
    }

    const std::pair<const char*, int64_t> systemTardisks[] = {
        {"brixbase.tdk", 187614208}, {"corelibs.tdk", 24119296},  {"netdrv.tdk", 6307840},
        {"storedrv.tdk", 9449472},   {"hostagent.tdk", 41951232}, {"wbemprov.tdk", 3158016},
        {"mgmtui.tdk", 12589056},    {"bootcfg.tdk", 20480},
    };
    const std::pair<const char*, int64_t> addOnTardisks[] = {
        {"nicfw-tools.tdk", 1050624},
        {"sitecfg.tdk", 4608},
    };
    auto insertTardisk =
        store.Prepare("INSERT INTO quillfs_tardisks (name, size, system) VALUES (?, ?, ?)");
    for (const auto& [name, size] : systemTardisks) {
        insertTardisk.Bind(1, name).Bind(2, size).Bind(3, true).Run();
        insertTardisk.Reset();
    }
    for (const auto& [name, size] : addOnTardisks) {
        insertTardisk.Bind(1, name).Bind(2, size).Bind(3, false).Run();
        insertTardisk.Reset();
    }

    store.Exec("INSERT INTO quillfs_inodes VALUES (1, 655360, 7480, 3, 14388, 41, 512)");
}

void RequireInstance(const char* node, const std::vector<std::string>& instancePath) {
    if (instancePath.size() != 1) {
        throw HostCtlException(std::string("Sysinfo node ") + node + ": no instance selected");
    }
}

// The instances of a node listed by `table`.
auto NamesIn(const char* table) {
    return [table](const std::vector<std::string>& path,
                   const std::function<void(const std::string&)>& name) {
        if (!path.empty()) return;
        auto rows = Store::Get().Prepare(std::string("SELECT name FROM ") + table + " ORDER BY id");
        while (rows.Step()) name(rows.Text(0));
    };
}

void NoInstances(const std::vector<std::string>&, const std::function<void(const std::string&)>&) {}

void NoRecord(const char* node) {
    throw HostCtlException(std::string("Sysinfo node ") + node + " has no record");
}

void GetStatus(const std::vector<std::string>&, void* buffer, size_t size) {
    namespace S = StatusRecord;
    BrixSim::Ksi::RequireSize("system.quillfs.stats", size, S::kSize);
    const auto status = BrixSim::Quillfs::ReadInodeStatus(Store::Get());
    BrixSim::Ksi::RecordWriter record(buffer, size);
    auto put = [&](size_t offset, int64_t value) {
        record.U32(offset, static_cast<uint32_t>(value));
    };
    put(S::kTotal, status.total);
    put(S::kUsed, status.used);
    put(S::kPeakUsed, status.peakUsed);
    put(S::kUnlinked, status.unlinked);
    put(S::kPeakUnlinked, status.peakUnlinked);
    put(S::kReserved, status.reserved);
    put(S::kPeakReserved, status.peakReserved);
}

void GetRamdisk(const std::vector<std::string>& instancePath, void* buffer, size_t size) {
    namespace R = RamdiskRecord;
    BrixSim::Ksi::RequireSize("system.quillfs.ramdisks.stats", size, R::kSize);
    RequireInstance("system.quillfs.ramdisks.stats", instancePath);
    auto row = Store::Get().Prepare(
        "SELECT reserved_mib, max_mib, used_pages, peak_pages, reserved_inodes, permissions,"
        " coredump, system, mount_point, max_inodes, allocated_inodes, used_inodes"
        " FROM quillfs_ramdisks WHERE name = ?");
    row.Bind(1, instancePath[0]);
    if (!row.Step())
        throw HostCtlException("Ramdisk " + CmdKit::MessageExcerpt(instancePath[0]) + " not found");
    BrixSim::Ksi::RecordWriter record(buffer, size);
    auto u32 = [&](int column) { return static_cast<uint32_t>(row.Int(column)); };
    record.U32(R::kReservedMib, u32(0));
    record.U32(R::kMaximumMib, u32(1));
    record.U32(R::kUsedPages, u32(2));
    record.U32(R::kPeakPages, u32(3));
    record.U32(R::kReservedInodes, u32(4));
    record.U32(R::kPermissions, u32(5));
    record.U8(R::kCoredump, row.Int(6) != 0);
    record.U8(R::kSystem, row.Int(7) != 0);
    record.Text(R::kMountPoint, R::kMountPointWidth, row.Text(8));
    record.U32(R::kMaxInodes, u32(9));
    record.U32(R::kAllocatedInodes, u32(10));
    record.U32(R::kUsedInodes, u32(11));
}

void GetTardisk(const std::vector<std::string>& instancePath, void* buffer, size_t size) {
    namespace T = TardiskRecord;
    BrixSim::Ksi::RequireSize("system.quillfs.tardisks.stats", size, T::kSize);
    RequireInstance("system.quillfs.tardisks.stats", instancePath);
    auto row = Store::Get().Prepare("SELECT size, system FROM quillfs_tardisks WHERE name = ?");
    row.Bind(1, instancePath[0]);
    if (!row.Step())
        throw HostCtlException("Tardisk " + CmdKit::MessageExcerpt(instancePath[0]) + " not found");
    BrixSim::Ksi::RecordWriter record(buffer, size);
    // The kernel keeps the size in a 32-bit counter: 4 GiB and more wrap.
    record.U32(T::kBytes, static_cast<uint32_t>(row.Int(0)));
    record.U8(T::kSystem, row.Int(1) != 0);
}

const bool registered = [] {
    BrixSim::RegisterSysinfoNode(KSI_NODE_system_quillfs_stats, {GetStatus, NoInstances});
    BrixSim::RegisterSysinfoNode(KSI_NODE_system_quillfs_ramdisks,
                                 {[](const std::vector<std::string>&, void*, size_t) {
                                      NoRecord("system.quillfs.ramdisks");
                                  },
                                  NamesIn("quillfs_ramdisks")});
    BrixSim::RegisterSysinfoNode(KSI_NODE_system_quillfs_ramdisks_stats, {GetRamdisk, NoInstances});
    BrixSim::RegisterSysinfoNode(KSI_NODE_system_quillfs_tardisks,
                                 {[](const std::vector<std::string>&, void*, size_t) {
                                      NoRecord("system.quillfs.tardisks");
                                  },
                                  NamesIn("quillfs_tardisks")});
    BrixSim::RegisterSysinfoNode(KSI_NODE_system_quillfs_tardisks_stats, {GetTardisk, NoInstances});
    return BrixSim::RegisterTables({"memfs", kSchema, Seed});
}();

const char kCurrentSql[] =
    "SELECT i.total,"
    " i.base_used + (SELECT IFNULL(SUM(used_inodes), 0) FROM quillfs_ramdisks),"
    " i.unlinked,"
    " (SELECT IFNULL(SUM(reserved_inodes), 0) FROM quillfs_ramdisks),"
    " i.peak_used, i.peak_unlinked, i.peak_reserved"
    " FROM quillfs_inodes i";

}  // namespace

namespace BrixSim::Quillfs {

InodeStatus ReadInodeStatus(Store& store) {
    auto row = store.Prepare(kCurrentSql);
    if (!row.Step()) throw HostCtlException("Quillfs inode counters are missing");
    InodeStatus status;
    status.total = row.Int(0);
    status.used = row.Int(1);
    status.unlinked = row.Int(2);
    status.reserved = row.Int(3);
    status.peakUsed = std::max(row.Int(4), status.used);
    status.peakUnlinked = std::max(row.Int(5), status.unlinked);
    status.peakReserved = std::max(row.Int(6), status.reserved);
    return status;
}

void RecordInodePeaks(Store& store) {
    const InodeStatus status = ReadInodeStatus(store);
    store.Prepare("UPDATE quillfs_inodes SET peak_used = ?, peak_unlinked = ?, peak_reserved = ?")
        .Bind(1, status.peakUsed)
        .Bind(2, status.peakUnlinked)
        .Bind(3, status.peakReserved)
        .Run();
}

}  // namespace BrixSim::Quillfs

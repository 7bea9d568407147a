// Dump files of the simulated host: real sparse files in the dump folder of each datastore
// ("/datastores/<name>/coredump/*.dumpfile" under the host root), their read counts, and the
// active and configured dump file.
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <functional>
#include <string>
#include <system_error>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/core/DurableWrite.h"
#include "hostsim/core/Fd.h"
#include "hostsim/core/Operation.h"
#include "hostsim/coredump/DumpTargets.h"
#include "kernctl/Storage.h"

namespace HostCtl {
const std::string emptyString;
}

namespace {

namespace fs = std::filesystem;
using BrixSim::Store;
using BrixSim::Coredump::kFileKeys;
using BrixSim::Coredump::kMiB;
using HostCtl::Lib::HostCtlException;
using HostCtl::Storage::DiagnosticFile;

const BrixSim::Operation kCreate{"KernCtl::Storage::StorageInfoImpl::CreateDiagnosticFile"};
const BrixSim::Operation kAutoAdd{"KernCtl::Storage::StorageInfoImpl::AutoAddDiagnosticFile"};
const BrixSim::Operation kGetActive{"KernCtl::Storage::StorageInfoImpl::GetActiveDiagnosticFile"};
const BrixSim::Operation kGetConfigured{
    "KernCtl::Storage::StorageInfoImpl::GetConfiguredDiagnosticFile"};
const BrixSim::Operation kGetPotential{
    "KernCtl::Storage::StorageInfoImpl::GetPotentialDiagnosticFiles"};
const BrixSim::Operation kSet{"KernCtl::Storage::StorageInfoImpl::SetDiagnosticFile"};
const BrixSim::Operation kActivate{"KernCtl::Storage::StorageInfoImpl::ActivateDiagnosticFile"};
const BrixSim::Operation kDeactivate{"KernCtl::Storage::StorageInfoImpl::DeactivateDiagnosticFile"};
const BrixSim::Operation kSmart{"KernCtl::Storage::StorageInfoImpl::SmartActivateDiagnosticFile"};
const BrixSim::Operation kUnconfigure{
    "KernCtl::Storage::StorageInfoImpl::UnconfigureDiagnosticFile"};
const BrixSim::Operation kReadCount{"KernCtl::Storage::StorageInfoImpl::GetDumpFileReadCount"};
const BrixSim::Operation kGetPath{"HostCtl::Storage::DiagnosticFile::GetPath"};
const BrixSim::Operation kGetSize{"HostCtl::Storage::DiagnosticFile::GetSize"};
const BrixSim::Operation kIsValid{"HostCtl::Storage::DiagnosticFile::IsValid"};

// The kernel option that lets AutoAddDiagnosticFile create a file. The option itself belongs
// to the kernel's advanced options; the storage service reads its current value from here.
constexpr const char* kAutoCreateOption = "coredump.autoCreateDumpFile";

constexpr const char* kDumpFolder = "coredump";
constexpr const char* kSuffix = ".dumpfile";
// First bytes of every dump file the storage service creates.
constexpr char kMagic[8] = {'B', 'R', 'X', 'D', 'U', 'M', 'P', '1'};

std::string DumpFolder(const std::string& datastore) {
    return "/datastores/" + datastore + "/" + kDumpFolder;
}

// Creates `hostPath` as a sparse file of `bytes` bytes with the dump header: written to a
// temporary file, flushed, then linked into place (never replacing an existing file).
void WriteDumpFile(Store& store, const std::string& hostPath, uint64_t bytes) {
    const auto target = store.Resolve(hostPath);
    if (!target)
        throw HostCtlException("Invalid dump file path " + CmdKit::MessageExcerpt(hostPath) + ".");
    std::error_code ec;
    fs::create_directories(target->parent_path(), ec);
    if (ec) {
        throw HostCtlException("Unable to create folder for " + CmdKit::MessageExcerpt(hostPath) +
                               ": " + ec.message());
    }
    try {
        BrixSim::WriteDurably(*target, std::string_view(kMagic, sizeof kMagic), 0600,
                              BrixSim::Publish::Create, static_cast<off_t>(bytes));
    } catch (const std::system_error& error) {
        if (error.code() == std::errc::file_exists) {
            throw HostCtlException("Dump file " + CmdKit::MessageExcerpt(hostPath) +
                                   " already exists.");
        }
        throw HostCtlException("Unable to create dump file " + CmdKit::MessageExcerpt(hostPath) +
                               ": " + error.code().message());
    }
}

struct Datastore {
    std::string name;
    int64_t capacityMb = 0;
    int64_t usedMb = 0;  // space taken by other content
};

std::vector<Datastore> Datastores(Store& store) {
    auto rows = store.Prepare(
        "SELECT name, capacity_mb, used_mb FROM coredump_datastores ORDER BY ord, name");
    std::vector<Datastore> result;
    while (rows.Step()) result.push_back({rows.Text(0), rows.Int(1), rows.Int(2)});
    return result;
}

// Host paths of the dump files in one datastore's dump folder, by name.
std::vector<std::string> DumpFilesIn(Store& store, const std::string& datastore) {
    std::vector<std::string> result;
    const std::string folder = DumpFolder(datastore);
    const auto resolved = store.Resolve(folder);
    if (!resolved) return result;
    std::error_code ec;
    for (fs::directory_iterator it(*resolved, ec), end; !ec && it != end; it.increment(ec)) {
        const std::string name = it->path().filename().string();
        if (name.size() > std::strlen(kSuffix) && name.front() != '.' && name.ends_with(kSuffix) &&
            it->is_regular_file(ec)) {
            result.push_back(folder + "/" + name);
        }
    }
    std::sort(result.begin(), result.end());
    return result;
}

int64_t FileSize(Store& store, const std::string& hostPath) {
    const auto resolved = store.Resolve(hostPath);
    struct stat st {};
    if (!resolved || ::stat(resolved->c_str(), &st) != 0) return -1;
    return S_ISREG(st.st_mode) ? static_cast<int64_t>(st.st_size) : -1;
}

int64_t FreeMb(Store& store, const Datastore& datastore) {
    int64_t used = datastore.usedMb;
    for (const auto& path : DumpFilesIn(store, datastore.name)) {
        used += (std::max<int64_t>(FileSize(store, path), 0) + kMiB - 1) / kMiB;
    }
    return std::max<int64_t>(datastore.capacityMb - used, 0);
}

bool IsValidFile(Store& store, const std::string& hostPath, bool checkHeader) {
    const auto resolved = store.Resolve(hostPath);
    if (!resolved) return false;
    struct stat st {};
    if (::stat(resolved->c_str(), &st) != 0 || !S_ISREG(st.st_mode) || st.st_size <= 0) {
        return false;
    }
    if (!checkHeader) return true;
    char head[sizeof kMagic] = {};
    const BrixSim::Fd fd(::open(resolved->c_str(), O_RDONLY | O_CLOEXEC));
    if (!fd) return false;
    const bool read = ::read(fd.Get(), head, sizeof head) == static_cast<ssize_t>(sizeof head);
    return read && std::memcmp(head, kMagic, sizeof kMagic) == 0;
}

// The normal form of a host path given by a user; relative paths are refused.
std::string NormalPath(const std::string& path) {
    if (path.empty() || path.front() != '/') {
        throw HostCtlException("Dump file path " + CmdKit::MessageExcerpt(path) +
                               " is not an absolute path.");
    }
    std::string normal = fs::path(path).lexically_normal().string();
    while (normal.size() > 1 && normal.back() == '/') normal.pop_back();
    return normal;
}

std::string RequireValid(Store& store, const std::string& path) {
    const std::string normal = NormalPath(path);
    if (!IsValidFile(store, normal, false)) {
        throw HostCtlException("Dump file " + CmdKit::MessageExcerpt(normal) +
                               " does not exist or is not a valid dump file.");
    }
    return normal;
}

std::unique_ptr<DiagnosticFile> FromSetting(Store& store, const char* key) {
    const std::string path = store.GetValue(key, "");
    if (path.empty()) return nullptr;
    return std::make_unique<KernCtl::Storage::DiagnosticFileImpl>(path);
}

void CheckFileName(const std::string& name) {
    if (name.empty() || name.size() > 200 || name.front() == '.' ||
        name.find_first_of("/\\") != std::string::npos ||
        std::any_of(name.begin(), name.end(), [](unsigned char c) { return c < 0x20; })) {
        throw HostCtlException("Invalid dump file name '" + CmdKit::MessageExcerpt(name) + "'.");
    }
}

// Creates a dump file and answers its host path; runs inside the caller's transaction, and
// names the file in `created` as soon as it exists, so that the caller can take it back when
// the transaction does not commit.
std::string CreateFile(Store& store, uint64_t sizeMb, const std::string& datastoreName,
                       const std::string& fileName, std::string& created) {
    if (sizeMb == 0) {
        sizeMb =
            BrixSim::Coredump::DefaultDumpSizeMb(store.GetInt(BrixSim::Coredump::kMemoryKey, 0));
    }
    const auto datastores = Datastores(store);
    const Datastore* chosen = nullptr;
    if (!datastoreName.empty()) {
        for (const auto& d : datastores) {
            if (d.name == datastoreName) chosen = &d;
        }
        if (chosen == nullptr)
            throw HostCtlException("Datastore " + CmdKit::MessageExcerpt(datastoreName) +
                                   " not found.");
        const int64_t free = FreeMb(store, *chosen);
        if (sizeMb > static_cast<uint64_t>(free)) {
            throw HostCtlException(
                "Insufficient space on datastore " + CmdKit::MessageExcerpt(datastoreName) + ": " +
                std::to_string(sizeMb) + " MB needed, " + std::to_string(free) + " MB free.");
        }
    } else {
        for (const auto& d : datastores) {
            if (chosen == nullptr && sizeMb <= static_cast<uint64_t>(FreeMb(store, d))) {
                chosen = &d;
            }
        }
        if (chosen == nullptr) {
            throw HostCtlException("No datastore has " + std::to_string(sizeMb) +
                                   " MB free for a dump file.");
        }
    }
    const std::string folder = DumpFolder(chosen->name);
    std::string path;
    if (!fileName.empty()) {
        CheckFileName(fileName);
        path = folder + "/" + fileName + (fileName.ends_with(kSuffix) ? "" : kSuffix);
    } else {
        const auto existing = DumpFilesIn(store, chosen->name);
        for (int n = 1; path.empty(); ++n) {
            const std::string candidate = folder + "/coredump-" + std::to_string(n) + kSuffix;
            if (std::find(existing.begin(), existing.end(), candidate) == existing.end() &&
                FileSize(store, candidate) < 0) {
                path = candidate;
            }
        }
    }
    WriteDumpFile(store, path, sizeMb * kMiB);
    created = path;
    // A new file holds no dump yet: its read count is known and zero.
    store.Prepare("INSERT OR REPLACE INTO coredump_file_reads VALUES (?, 0)").Bind(1, path).Run();
    return path;
}

// Runs `work` in one write transaction; a dump file it created goes again when the transaction
// does not commit, so that a failed call leaves the datastores as they were.
void WriteWithFile(Store& store, const std::function<void(std::string& created)>& work) {
    std::string created;
    try {
        store.Write([&] { work(created); });
    } catch (...) {
        if (!created.empty()) {
            if (const auto resolved = store.Resolve(created)) ::unlink(resolved->c_str());
        }
        throw;
    }
}

const bool registered = [] {
    return BrixSim::RegisterTables({
        "coredump.files",
        "CREATE TABLE IF NOT EXISTS coredump_datastores ("
        " name TEXT PRIMARY KEY,"  // folder name under /datastores
        " ord INTEGER NOT NULL,"   // order in which datastores are considered
        " capacity_mb INTEGER NOT NULL,"
        " used_mb INTEGER NOT NULL);"  // taken by content other than dump files
        "CREATE TABLE IF NOT EXISTS coredump_file_reads ("
        " path TEXT PRIMARY KEY,"          // host path of a dump file
        " read_count INTEGER NOT NULL);",  // times its dump was read; no row = unknown
        [](Store& store) {
            store.SetInt(BrixSim::Coredump::kMemoryKey, 131072);
            store.SetInt(kAutoCreateOption, 1);
            struct Seed {
                const char* name;
                int64_t capacityMb;
                int64_t usedMb;
            };
            const Seed datastores[] = {
                {"ds-archive", 511744, 511200},
                {"ds-local-01", 1830400, 1214730},
                {"ds-shared-02", 4190208, 3302115},
            };
            auto insert = store.Prepare("INSERT INTO coredump_datastores VALUES (?, ?, ?, ?)");
            int ord = 0;
            for (const auto& d : datastores) {
                insert.Bind(1, d.name).Bind(2, ord++).Bind(3, d.capacityMb).Bind(4, d.usedMb).Run();
                insert.Reset();
                if (auto folder = store.Resolve(DumpFolder(d.name))) {
                    std::error_code ec;
                    fs::create_directories(*folder, ec);
                }
            }
            const std::string first = DumpFolder("ds-local-01") + "/coredump-1" + kSuffix;
            const std::string second = DumpFolder("ds-shared-02") + "/coredump-1" + kSuffix;
            const uint64_t bytes =
                BrixSim::Coredump::DefaultDumpSizeMb(131072) * BrixSim::Coredump::kMiB;
            WriteDumpFile(store, first, bytes);
            WriteDumpFile(store, second, bytes);
            // The first file's dump was collected once; nothing is known of the second.
            store.Prepare("INSERT INTO coredump_file_reads VALUES (?, 1)").Bind(1, first).Run();
            store.SetValue(kFileKeys.active, first);
            store.SetValue(kFileKeys.configured, first);
        },
    });
}();

}  // namespace

namespace KernCtl::Storage {

DiagnosticFileImpl::DiagnosticFileImpl(std::string path) : path_(std::move(path)) {}

std::string DiagnosticFileImpl::GetPath() const {
    Store::Get().Check(kGetPath);
    return path_;
}

int64_t DiagnosticFileImpl::GetSize() const {
    auto& store = Store::Get();
    store.Check(kGetSize);
    const int64_t size = FileSize(store, path_);
    if (size < 0) throw HostCtlException("Unable to read the size of dump file " + path_ + ".");
    return size;
}

bool DiagnosticFileImpl::IsValid(bool checkHeader) const {
    auto& store = Store::Get();
    store.Check(kIsValid);
    return IsValidFile(store, path_, checkHeader);
}

void StorageInfoImpl::CreateDiagnosticFile(uint64_t sizeMb, const std::string& datastore,
                                           const std::string& file, bool enable) {
    auto& store = Store::Get();
    store.Check(kCreate);
    WriteWithFile(store, [&](std::string& created) {
        const std::string path = CreateFile(store, sizeMb, datastore, file, created);
        if (enable) {
            store.SetValue(kFileKeys.configured, path);
            store.SetValue(kFileKeys.active, path);
        }
        store.JournalCall(kCreate, {static_cast<int64_t>(sizeMb), datastore, file, enable, path});
    });
}

void StorageInfoImpl::AutoAddDiagnosticFile(uint64_t sizeMb, const std::string& datastore,
                                            const std::string& file, bool enable) {
    auto& store = Store::Get();
    store.Check(kAutoAdd);
    WriteWithFile(store, [&](std::string& created) {
        if (store.GetInt(kAutoCreateOption, 1) == 0) return;
        for (const auto& d : Datastores(store)) {
            if (!DumpFilesIn(store, d.name).empty()) return;
        }
        const std::string path = CreateFile(store, sizeMb, datastore, file, created);
        if (enable) {
            store.SetValue(kFileKeys.configured, path);
            store.SetValue(kFileKeys.active, path);
        }
        store.JournalCall(kAutoAdd, {static_cast<int64_t>(sizeMb), datastore, file, enable, path});
    });
}

std::unique_ptr<DiagnosticFile> StorageInfoImpl::GetActiveDiagnosticFile() {
    auto& store = Store::Get();
    store.Check(kGetActive);
    return FromSetting(store, kFileKeys.active);
}

std::unique_ptr<DiagnosticFile> StorageInfoImpl::GetConfiguredDiagnosticFile() {
    auto& store = Store::Get();
    store.Check(kGetConfigured);
    return FromSetting(store, kFileKeys.configured);
}

std::vector<std::unique_ptr<DiagnosticFile>> StorageInfoImpl::GetPotentialDiagnosticFiles() {
    auto& store = Store::Get();
    store.Check(kGetPotential);
    std::vector<std::unique_ptr<DiagnosticFile>> result;
    for (const auto& d : Datastores(store)) {
        for (const auto& path : DumpFilesIn(store, d.name)) {
            result.push_back(std::make_unique<DiagnosticFileImpl>(path));
        }
    }
    return result;
}

void StorageInfoImpl::SetDiagnosticFile(const std::string& path, bool activate) {
    auto& store = Store::Get();
    store.Check(kSet);
    BrixSim::Coredump::Mutate(kSet, {path, activate}, [&](Store& s) {
        const std::string normal = RequireValid(s, path);
        s.SetValue(kFileKeys.configured, normal);
        if (activate) s.SetValue(kFileKeys.active, normal);
    });
}

void StorageInfoImpl::ActivateDiagnosticFile() {
    auto& store = Store::Get();
    store.Check(kActivate);
    BrixSim::Coredump::Mutate(kActivate, {}, [&](Store& s) {
        const std::string configured = s.GetValue(kFileKeys.configured, "");
        if (configured.empty()) throw HostCtlException("No dump file is configured.");
        s.SetValue(kFileKeys.active, RequireValid(s, configured));
    });
}

void StorageInfoImpl::DeactivateDiagnosticFile() {
    auto& store = Store::Get();
    store.Check(kDeactivate);
    BrixSim::Coredump::Mutate(kDeactivate, {}, [&](Store& s) { s.SetValue(kFileKeys.active, ""); });
}

namespace {

// The configured file when it is usable, otherwise the first usable file found; "" when none.
std::string ChooseFile(Store& store) {
    const std::string configured = store.GetValue(kFileKeys.configured, "");
    if (!configured.empty() && IsValidFile(store, configured, true)) return configured;
    for (const auto& d : Datastores(store)) {
        for (const auto& path : DumpFilesIn(store, d.name)) {
            if (IsValidFile(store, path, true)) return path;
        }
    }
    return "";
}

// At boot the host activates its dump file by the same choice.
const bool restarts = BrixSim::RegisterBootStep(
    [](Store& store) { store.SetValue(kFileKeys.active, ChooseFile(store)); });

}  // namespace

std::unique_ptr<DiagnosticFile> StorageInfoImpl::SmartActivateDiagnosticFile() {
    auto& store = Store::Get();
    store.Check(kSmart);
    std::string chosen;
    store.Write([&] {
        chosen = ChooseFile(store);
        if (chosen.empty()) throw HostCtlException("No suitable dump file found.");
        store.SetValue(kFileKeys.active, chosen);
        store.JournalCall(kSmart, {chosen});
    });
    return std::make_unique<DiagnosticFileImpl>(chosen);
}

void StorageInfoImpl::UnconfigureDiagnosticFile() {
    auto& store = Store::Get();
    store.Check(kUnconfigure);
    BrixSim::Coredump::Mutate(kUnconfigure, {},
                              [&](Store& s) { s.SetValue(kFileKeys.configured, ""); });
}

bool StorageInfoImpl::GetDumpFileReadCount(const std::string& path, uint32_t& count) {
    auto& store = Store::Get();
    store.Check(kReadCount);
    if (path.empty() || path.front() != '/') return false;
    auto row = store.Prepare("SELECT read_count FROM coredump_file_reads WHERE path = ?");
    row.Bind(1, NormalPath(path));
    if (!row.Step() || FileSize(store, NormalPath(path)) < 0) return false;
    count = static_cast<uint32_t>(std::clamp<int64_t>(row.Int(0), 0, UINT32_MAX));
    return true;
}

}  // namespace KernCtl::Storage

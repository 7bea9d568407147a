// The simulated host's store: one SQLite database (WAL, durable commits) under the host root.
#include "hostsim/core/Store.h"

#include <fcntl.h>
#include <sqlite3.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <memory>
#include <mutex>
#include <nlohmann/json.hpp>
#include <stdexcept>
#include <system_error>
#include <thread>
#include <utility>

#include "hostctl/HostCtlException.h"
#include "hostsim/core/DurableWrite.h"
#include "hostsim/core/Fd.h"
#include "hostsim/core/Registry.h"

namespace BrixSim {

namespace fs = std::filesystem;

namespace {

// How long a process waits for another one's write transaction before giving up.
constexpr int kBusyTimeoutMs = 10000;

constexpr const char* kCoreSchema =
    "CREATE TABLE IF NOT EXISTS host (key TEXT PRIMARY KEY, value TEXT NOT NULL);"
    "CREATE TABLE IF NOT EXISTS faults (op TEXT PRIMARY KEY, message TEXT NOT NULL,"
    " detail TEXT, remaining INTEGER);"
    "CREATE TABLE IF NOT EXISTS journal (seq INTEGER PRIMARY KEY AUTOINCREMENT,"
    " record TEXT NOT NULL);"
    "CREATE TABLE IF NOT EXISTS features (entry INTEGER PRIMARY KEY"
    " CHECK (entry BETWEEN 0 AND 255), state INTEGER NOT NULL);"
    "CREATE TABLE IF NOT EXISTS meta (key TEXT PRIMARY KEY, value TEXT NOT NULL);";

constexpr const char* kSchemaVersion = "1";

// The store's own files: the database, its write-ahead log and the log's index.
constexpr const char* kStoreFiles[] = {"host.db", "host.db-wal", "host.db-shm", "host.db-journal"};
constexpr const char* kMarkerFormat = "brixhost 1";

// SQLite's last error on `db`, as a StoreError naming the database file; `context` (a statement)
// is added when given.
[[noreturn]] void ThrowStoreError(sqlite3* db, std::string_view context = {}) {
    const int code = db ? sqlite3_extended_errcode(db) : SQLITE_NOMEM;
    const char* file = db ? sqlite3_db_filename(db, "main") : nullptr;
    std::string message = "host store";
    if (file && *file) message += std::string(" ") + file;
    message += ": ";
    message += db ? sqlite3_errmsg(db) : "out of memory";
    const int primary = code & 0xff;
    if (db &&
        (primary == SQLITE_IOERR || primary == SQLITE_CANTOPEN || primary == SQLITE_FULL ||
         primary == SQLITE_READONLY) &&
        sqlite3_system_errno(db) != 0) {
        message += std::string(" (") + std::strerror(sqlite3_system_errno(db)) + ")";
    }
    if (!context.empty()) message += " in \"" + std::string(context) + "\"";
    throw StoreError(message, code, db ? sqlite3_errmsg(db) : "out of memory");
}

std::unique_ptr<Store>& Instance() {
    static std::unique_ptr<Store> instance;
    return instance;
}

// Recursive: a seed run while the store opens may itself ask for the store.
std::recursive_mutex& InstanceMutex() {
    static std::recursive_mutex mutex;
    return mutex;
}

// Counted faults that fired inside a transaction. A fault usually aborts the transaction it
// fired in; the firing still counts, so rolled-back decrements are applied again.
std::vector<std::string>& PendingHits() {
    static std::vector<std::string> hits;
    return hits;
}

// A stable digest of every schema, so an up-to-date host skips the schema transaction.
std::string SchemaFingerprint() {
    uint64_t hash = 1469598103934665603ULL;
    auto mix = [&hash](std::string_view text) {
        for (unsigned char c : text) {
            hash ^= c;
            hash *= 1099511628211ULL;
        }
        hash ^= 0xff;
        hash *= 1099511628211ULL;
    };
    mix(kSchemaVersion);
    mix(kCoreSchema);
    for (const auto& tables : RegisteredTables()) {
        mix(tables.name);
        mix(tables.schema);
    }
    char text[17];
    snprintf(text, sizeof text, "%016llx", static_cast<unsigned long long>(hash));
    return text;
}

nlohmann::ordered_json ToJson(const Value& value) {
    return std::visit(
        [](const auto& v) -> nlohmann::ordered_json {
            using T = std::decay_t<decltype(v)>;
            if constexpr (std::is_same_v<T, std::nullptr_t>) {
                return nullptr;
            } else {
                return v;
            }
        },
        value);
}

void ExecRaw(sqlite3* db, std::string_view sql) {
    char* error = nullptr;
    const std::string text(sql);
    if (sqlite3_exec(db, text.c_str(), nullptr, nullptr, &error) != SQLITE_OK) {
        sqlite3_free(error);
        ThrowStoreError(db);
    }
}

// With BRIXSIM_TRACE_OPS naming a file, every checked operation is appended to it, one name a
// line; tests learn from it which operations a command reaches.
void TraceOperation(std::string_view operation) {
    const char* trace = getenv("BRIXSIM_TRACE_OPS");
    if (!trace || !*trace) return;
    const Fd fd(open(trace, O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC, 0644));
    if (!fd) return;
    const std::string line = std::string(operation) + "\n";
    [[maybe_unused]] const ssize_t wrote = write(fd.Get(), line.data(), line.size());
}

void DecrementFault(Store& store, const std::string& operation) {
    store.Prepare("UPDATE faults SET remaining = remaining - 1 WHERE op = ? AND remaining > 0")
        .Bind(1, operation)
        .Run();
    store.Prepare("DELETE FROM faults WHERE op = ? AND remaining <= 0").Bind(1, operation).Run();
}

}  // namespace

// ---------------------------------------------------------------------------------------------
// Stmt

Stmt::Stmt(sqlite3* db, std::string_view sql) : db_(db) {
    if (!db_) throw StoreError("host store: not open", 0);
    if (sqlite3_prepare_v2(db_, sql.data(), static_cast<int>(sql.size()), &stmt_, nullptr) !=
        SQLITE_OK) {
        ThrowStoreError(db_, sql);
    }
    if (!stmt_) throw StoreError("host store: empty statement", 0);
}

Stmt::~Stmt() {
    if (inUse_) {
        sqlite3_reset(stmt_);
        sqlite3_clear_bindings(stmt_);
        *inUse_ = false;
    } else {
        sqlite3_finalize(stmt_);
    }
}

Stmt::Stmt(Stmt&& other) noexcept : db_(other.db_), stmt_(other.stmt_), inUse_(other.inUse_) {
    other.stmt_ = nullptr;
    other.inUse_ = nullptr;
}

Stmt& Stmt::Bind(int index, std::string_view text) {
    const char* data = text.data() ? text.data() : "";
    if (sqlite3_bind_text(stmt_, index, data, static_cast<int>(text.size()), SQLITE_TRANSIENT) !=
        SQLITE_OK) {
        ThrowStoreError(db_);
    }
    return *this;
}

Stmt& Stmt::Bind(int index, int64_t value) {
    if (sqlite3_bind_int64(stmt_, index, value) != SQLITE_OK) {
        ThrowStoreError(db_);
    }
    return *this;
}

Stmt& Stmt::Bind(int index, double value) {
    if (sqlite3_bind_double(stmt_, index, value) != SQLITE_OK) ThrowStoreError(db_);
    return *this;
}

Stmt& Stmt::BindNull(int index) {
    if (sqlite3_bind_null(stmt_, index) != SQLITE_OK) {
        ThrowStoreError(db_);
    }
    return *this;
}

bool Stmt::Step() {
    const int rc = sqlite3_step(stmt_);
    if (rc == SQLITE_ROW) return true;
    if (rc == SQLITE_DONE) return false;
    // The step's own error; reset reports it again and keeps it as the connection's.
    sqlite3_reset(stmt_);
    ThrowStoreError(db_);
}

void Stmt::Run() {
    while (Step()) {
    }
    sqlite3_reset(stmt_);
}

void Stmt::Reset() {
    sqlite3_reset(stmt_);
    sqlite3_clear_bindings(stmt_);
}

std::string Stmt::Text(int column) const {
    const auto* text = sqlite3_column_text(stmt_, column);
    if (!text) return {};
    return std::string(reinterpret_cast<const char*>(text),
                       static_cast<size_t>(sqlite3_column_bytes(stmt_, column)));
}

int64_t Stmt::Int(int column) const {
    return sqlite3_column_int64(stmt_, column);
}

double Stmt::Float(int column) const {
    return sqlite3_column_double(stmt_, column);
}

int Stmt::ColumnCount() const {
    return sqlite3_column_count(stmt_);
}

std::string Stmt::ColumnName(int column) const {
    const char* name = sqlite3_column_name(stmt_, column);
    return name ? name : "";
}

Stmt::Kind Stmt::ColumnKind(int column) const {
    switch (sqlite3_column_type(stmt_, column)) {
        case SQLITE_INTEGER:
            return Kind::Integer;
        case SQLITE_FLOAT:
            return Kind::Float;
        case SQLITE_NULL:
            return Kind::Null;
        default:
            return Kind::Text;
    }
}

bool Stmt::IsNull(int column) const {
    return sqlite3_column_type(stmt_, column) == SQLITE_NULL;
}

// ---------------------------------------------------------------------------------------------
// Store

Store& Store::Get() {
    std::lock_guard lock(InstanceMutex());
    auto& instance = Instance();
    if (!instance) {
        instance.reset(new Store(DefaultRoot()));
        try {
            instance->Open();
        } catch (...) {
            instance.reset();
            throw;
        }
    }
    return *instance;
}

void Store::Close() {
    std::lock_guard lock(InstanceMutex());
    Instance().reset();
    PendingHits().clear();
}

bool Store::PeekFeatures(unsigned char* states, int count) {
    std::fill(states, states + count, 0);
    {
        std::lock_guard lock(InstanceMutex());
        if (Instance()) {
            auto rows = Instance()->Prepare("SELECT entry, state FROM features");
            while (rows.Step()) {
                const int64_t entry = rows.Int(0);
                if (entry >= 0 && entry < count) states[entry] = rows.Int(1) != 0;
            }
            return true;
        }
    }
    const fs::path file = DefaultRoot() / "host.db";
    std::error_code ec;
    if (!fs::exists(file, ec)) return true;
    sqlite3* db = nullptr;
    const std::string uri = "file:" + file.string() + "?mode=ro";
    bool read = sqlite3_open_v2(uri.c_str(), &db, SQLITE_OPEN_READONLY | SQLITE_OPEN_URI,
                                nullptr) == SQLITE_OK;
    sqlite3_stmt* rows = nullptr;
    read = read && sqlite3_prepare_v2(db, "SELECT entry, state FROM features", -1, &rows,
                                      nullptr) == SQLITE_OK;
    int rc = SQLITE_DONE;
    while (read && (rc = sqlite3_step(rows)) == SQLITE_ROW) {
        const int64_t entry = sqlite3_column_int64(rows, 0);
        if (entry >= 0 && entry < count) states[entry] = sqlite3_column_int64(rows, 1) != 0;
    }
    sqlite3_finalize(rows);
    sqlite3_close_v2(db);
    return read && rc == SQLITE_DONE;
}

fs::path Store::DefaultRoot() {
    if (const char* root = getenv("BRIX_HOST_ROOT"); root && *root) {
        return fs::absolute(root).lexically_normal();
    }
    fs::path state;
    if (const char* xdg = getenv("XDG_STATE_HOME"); xdg && *xdg) {
        state = xdg;
    } else if (const char* home = getenv("HOME"); home && *home) {
        state = fs::path(home) / ".local" / "state";
    } else {
        throw StoreError("host store: neither BRIX_HOST_ROOT nor HOME is set", 0);
    }
    return (fs::absolute(state) / "brixsim" / "default").lexically_normal();
}

Store::Store(fs::path root) : root_(std::move(root)) {}

Store::~Store() {
    for (auto& [sql, cached] : statements_) sqlite3_finalize(cached.stmt);
    // Only a process that wrote folds the log back into the database as it leaves: one that
    // only read leaves the store's files as it found them.
    if (db_ && wrote_) sqlite3_db_config(db_, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 0, nullptr);
    if (db_) sqlite3_close_v2(db_);
}

Stmt Store::Prepare(std::string_view sql) {
    // Enough for every fixed statement of the simulator; statements built from data beyond it
    // are not kept.
    constexpr size_t kMaxCached = 512;
    if (!db_) throw StoreError("host store: not open", 0);
    auto found = statements_.find(std::string(sql));
    if (found == statements_.end()) {
        if (statements_.size() >= kMaxCached) return Stmt(db_, sql);
        sqlite3_stmt* stmt = nullptr;
        if (sqlite3_prepare_v3(db_, sql.data(), static_cast<int>(sql.size()),
                               SQLITE_PREPARE_PERSISTENT, &stmt, nullptr) != SQLITE_OK) {
            ThrowStoreError(db_, sql);
        }
        if (!stmt) throw StoreError("host store: empty statement", 0);
        found = statements_.emplace(std::string(sql), CachedStmt{stmt, false}).first;
    }
    if (found->second.inUse) return Stmt(db_, sql);
    found->second.inUse = true;
    return Stmt(db_, found->second.stmt, &found->second.inUse);
}

namespace {
// Every read transaction of the process gets its own number, whichever store it is on.
uint64_t NextReadSnapshot() {
    static uint64_t last = 0;
    return ++last;
}
}  // namespace

void Store::Read(const std::function<void()>& work) {
    if (writeDepth_ > 0 || readDepth_ > 0) {
        work();
        return;
    }
    Exec("BEGIN");
    readDepth_ = 1;
    readSnapshot_ = NextReadSnapshot();
    try {
        work();
    } catch (...) {
        EndRead(false);
        throw;
    }
    EndRead(true);
}

void Store::EndRead(bool checked) {
    if (readDepth_ == 0 || --readDepth_ > 0) return;
    readSnapshot_ = 0;
    if (checked) {
        Exec("COMMIT");
    } else {
        sqlite3_exec(db_, "COMMIT", nullptr, nullptr, nullptr);
    }
}

Store::ReadHold::ReadHold(Store& store) : store_(store) {
    if (store.writeDepth_ > 0) return;
    if (store.readDepth_ == 0) {
        store.Exec("BEGIN");
        store.readSnapshot_ = NextReadSnapshot();
    }
    ++store.readDepth_;
    holds_ = true;
}

Store::ReadHold::~ReadHold() {
    if (holds_ && store_.writeDepth_ == 0) store_.EndRead(false);
}

namespace {
bool& AdoptingFolderFlag() {
    static bool adopting = false;
    return adopting;
}
}  // namespace

bool Store::AdoptingFolder() {
    return AdoptingFolderFlag();
}

void Store::AdoptFolder() {
    AdoptingFolderFlag() = true;
}

std::optional<std::vector<std::string>> Store::HostEntries(const fs::path& root) {
    std::ifstream marker(root / kMarkerName);
    std::string line;
    std::vector<std::string> entries(std::begin(kStoreFiles), std::end(kStoreFiles));
    entries.emplace_back(kMarkerName);
    if (marker && std::getline(marker, line) && line == kMarkerFormat) {
        while (std::getline(marker, line)) {
            if (!line.empty() && line.find('/') == std::string::npos && line != "." && line != "..")
                entries.push_back(line);
        }
        return entries;
    }
    std::error_code ec;
    if (fs::exists(root / "host.db", ec)) return entries;
    return std::nullopt;
}

void Store::Open() {
    if (root_.empty() || root_ == root_.root_path()) {
        throw StoreError(
            "host store: " + root_.string() + " cannot be a host root: name a folder of its own",
            0);
    }
    const fs::path file = root_ / "host.db";
    std::error_code ec;
    const bool marked = fs::exists(root_ / kMarkerName, ec);
    if (marked) {
        // A complete host was here: its store must hold it. Nothing but brixsim init makes a
        // host over a lost one.
        const auto size = fs::file_size(file, ec);
        if (ec || size == 0) {
            throw StoreError("host store " + file.string() + ": " +
                                 (ec ? "the store is missing" : "the store is empty") +
                                 "; the host's state is lost (brixsim init --force makes a new "
                                 "host)",
                             0);
        }
    } else if (fs::exists(root_, ec) && !AdoptingFolder()) {
        // A new host is made only in an empty folder. An unmarked store that holds something is
        // a host being made by another process, or one of an earlier version: taken as it is.
        bool foreign = false;
        for (fs::directory_iterator it(root_, ec), end; !ec && it != end; it.increment(ec)) {
            const std::string name = it->path().filename().string();
            foreign |= std::find(std::begin(kStoreFiles), std::end(kStoreFiles), name) ==
                       std::end(kStoreFiles);
        }
        if (ec) {
            throw StoreError("host store: cannot read " + root_.string() + ": " + ec.message(), 0);
        }
        std::error_code sizeError;
        const bool storeHoldsSomething = fs::file_size(file, sizeError) > 0 && !sizeError;
        if (foreign && !storeHoldsSomething) {
            throw StoreError("host store: " + root_.string() +
                                 " holds files but no host; a host is made only in an empty or "
                                 "new folder",
                             0);
        }
    }
    // What a folder adopted by `init --force` holds before the host is made is not the host's.
    // Otherwise the folder was empty, or holds a host another process is making right now,
    // whose entries are the host's too.
    std::set<std::string> before;
    if (!marked && AdoptingFolder()) {
        for (fs::directory_iterator it(root_, ec), end; !ec && it != end; it.increment(ec)) {
            before.insert(it->path().filename().string());
        }
        ec.clear();
    }
    fs::create_directories(root_, ec);
    if (ec) {
        throw StoreError(
            "host store: cannot create host root " + root_.string() + ": " + ec.message(), 0);
    }
    root_ = fs::canonical(root_, ec);
    if (ec) throw StoreError("host store: " + root_.string() + ": " + ec.message(), 0);

    // One thread uses the connection: SQLite need not lock it around every call.
    const int flags =
        SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX | (marked ? 0 : SQLITE_OPEN_CREATE);
    if (sqlite3_open_v2((root_ / "host.db").c_str(), &db_, flags, nullptr) != SQLITE_OK) {
        if (!db_) throw StoreError("host store " + file.string() + ": out of memory", SQLITE_NOMEM);
        try {
            ThrowStoreError(db_);
        } catch (...) {
            sqlite3_close_v2(db_);
            db_ = nullptr;
            throw;
        }
    }
    sqlite3_extended_result_codes(db_, 1);
    sqlite3_busy_timeout(db_, kBusyTimeoutMs);
    sqlite3_db_config(db_, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 1, nullptr);
    try {
        SwitchToWal();
    } catch (const StoreError& error) {
        // A host on a folder this process cannot write: read it as it stands, when its log
        // holds nothing that only a writer could apply. Any change is then refused by SQLite.
        const int primary = error.Code() & 0xff;
        std::error_code walError;
        const auto walSize = fs::file_size(root_ / "host.db-wal", walError);
        if (!marked || (primary != SQLITE_READONLY && primary != SQLITE_CANTOPEN) ||
            (!walError && walSize > 0)) {
            throw;
        }
        sqlite3_close_v2(db_);
        db_ = nullptr;
        const std::string uri = "file:" + (root_ / "host.db").string() + "?immutable=1";
        if (sqlite3_open_v2(uri.c_str(), &db_,
                            SQLITE_OPEN_READONLY | SQLITE_OPEN_NOMUTEX | SQLITE_OPEN_URI,
                            nullptr) != SQLITE_OK) {
            ThrowStoreError(db_);
        }
        readOnly_ = true;
    }
    if (marked) {
        Stmt meta(db_, "SELECT 1 FROM sqlite_master WHERE type = 'table' AND name = 'meta'");
        if (!meta.Step()) {
            throw StoreError("host store " + file.string() +
                                 ": the store holds no host; the host's state is lost (brixsim "
                                 "init --force makes a new host)",
                             0);
        }
    }
    // The WAL and its index stay when the last connection closes: the next process opens them
    // instead of creating, sizing and deleting them again. The size limit makes that close
    // truncate the checkpointed WAL to nothing; otherwise its old frames stay valid and every
    // later process would read and copy all of them back again, a cost growing with the host.
    if (readOnly_) return;
    int persistWal = 1;
    sqlite3_file_control(db_, "main", SQLITE_FCNTL_PERSIST_WAL, &persistWal);
    Exec("PRAGMA journal_size_limit=1048576");
    // Every acknowledged change survives a crash or power loss.
    Exec("PRAGMA synchronous=FULL");
    Exec("PRAGMA foreign_keys=ON");
    CreateSchema(true);
    if (!marked) WriteMarker(before);
}

// Switching a new database to WAL needs a moment alone with it: another process creating the
// same root at once makes it busy for a while, which is waited out. Any other failure (not a
// database, read-only, disk full) is final and reported at once.
void Store::SwitchToWal() {
    constexpr int kAttempts = 200;
    for (int attempt = 0;; ++attempt) {
        sqlite3_stmt* mode = nullptr;
        int rc = sqlite3_prepare_v2(db_, "PRAGMA journal_mode=WAL", -1, &mode, nullptr);
        if (rc == SQLITE_OK) {
            rc = sqlite3_step(mode);
            const bool wal = rc == SQLITE_ROW && std::string_view(reinterpret_cast<const char*>(
                                                     sqlite3_column_text(mode, 0))) == "wal";
            sqlite3_finalize(mode);
            if (wal) return;
            rc = sqlite3_extended_errcode(db_);
        }
        const int primary = rc & 0xff;
        if ((primary != SQLITE_BUSY && primary != SQLITE_LOCKED) || attempt >= kAttempts) {
            if (primary == SQLITE_OK || primary == SQLITE_ROW || primary == SQLITE_DONE) {
                throw StoreError("host store " + (root_ / "host.db").string() +
                                     ": cannot switch to write-ahead logging",
                                 rc);
            }
            ThrowStoreError(db_);
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
    }
}

// The marker names the top-level entries the new host made, so that `brixsim init --force`
// removes those and nothing else. Written whole or not at all.
void Store::WriteMarker(const std::set<std::string>& foreign) {
    std::string text = std::string(kMarkerFormat) + "\n";
    std::vector<std::string> names;
    std::error_code ec;
    for (fs::directory_iterator it(root_, ec), end; !ec && it != end; it.increment(ec)) {
        const std::string name = it->path().filename().string();
        if (name == kMarkerName || name.rfind(std::string(kMarkerName) + ".", 0) == 0) continue;
        if (foreign.count(name) != 0 && std::find(std::begin(kStoreFiles), std::end(kStoreFiles),
                                                  name) == std::end(kStoreFiles))
            continue;
        if (std::find(std::begin(kStoreFiles), std::end(kStoreFiles), name) !=
            std::end(kStoreFiles))
            continue;
        names.push_back(name);
    }
    std::sort(names.begin(), names.end());
    for (const auto& name : names) text += name + "\n";
    WriteDurably(root_ / kMarkerName, text, 0644);
}

void Store::CreateSchema(bool seed) {
    const std::string fingerprint = SchemaFingerprint();
    auto upToDate = [&] {
        Stmt hasMeta(db_, "SELECT 1 FROM sqlite_master WHERE type = 'table' AND name = 'meta'");
        if (!hasMeta.Step()) return false;
        Stmt schema(db_, "SELECT value FROM meta WHERE key = 'schema'");
        return schema.Step() && schema.Text(0) == fingerprint;
    };
    if (upToDate()) return;

    Write([&] {
        Exec(kCoreSchema);
        for (const auto& tables : RegisteredTables()) Exec(tables.schema);
        auto isSeeded = [&](const std::string& name) {
            return Prepare("SELECT 1 FROM meta WHERE key = ?").Bind(1, "seeded:" + name).Step();
        };
        auto markSeeded = [&](const std::string& name) {
            Prepare("INSERT OR REPLACE INTO meta VALUES (?, '1')").Bind(1, "seeded:" + name).Run();
        };
        if (seed) {
            if (!isSeeded("core")) {
                // Every feature entry off; the clock runs with the machine's.
                auto feature = Prepare("INSERT OR REPLACE INTO features VALUES (?, 0)");
                for (int entry = 0; entry < 256; ++entry) {
                    feature.Bind(1, entry).Run();
                    feature.Reset();
                }
                SetInt("clock.offset", 0);
                markSeeded("core");
            }
            // An area registered after the host was made is seeded on the next open.
            for (const auto& tables : RegisteredTables()) {
                if (isSeeded(tables.name)) continue;
                if (tables.seed) tables.seed(*this);
                markSeeded(tables.name);
            }
        }
        Prepare("INSERT OR REPLACE INTO meta VALUES ('version', ?)").Bind(1, kSchemaVersion).Run();
        if (seed) {
            Prepare("INSERT OR REPLACE INTO meta VALUES ('schema', ?)").Bind(1, fingerprint).Run();
        }
    });
}

std::optional<fs::path> Store::Resolve(std::string_view hostPath) const {
    if (hostPath.find('\0') != std::string_view::npos) return std::nullopt;
    std::vector<std::string> parts;
    size_t start = 0;
    while (start <= hostPath.size()) {
        size_t end = hostPath.find('/', start);
        if (end == std::string_view::npos) end = hostPath.size();
        const std::string_view part = hostPath.substr(start, end - start);
        if (part == "..") {
            if (parts.empty()) return std::nullopt;
            parts.pop_back();
        } else if (!part.empty() && part != ".") {
            parts.emplace_back(part);
        }
        start = end + 1;
    }
    if (parts.empty()) return root_;

    auto within = [this](const fs::path& path) {
        auto [rootEnd, pathAt] =
            std::mismatch(root_.begin(), root_.end(), path.begin(), path.end());
        (void)pathAt;
        return rootEnd == root_.end();
    };
    fs::path lexical = root_;
    for (const auto& part : parts) lexical /= part;
    std::error_code ec;
    // The folder holding the path, with every symbolic link followed, must be inside the root;
    // so must the path itself when it is a link (its target is what a read would reach).
    const fs::path parent = fs::weakly_canonical(lexical.parent_path(), ec);
    if (ec || !within(parent)) return std::nullopt;
    const fs::path real = fs::weakly_canonical(lexical, ec);
    if (ec || !within(real)) return std::nullopt;
    return parent / parts.back();
}

void Store::Check(const Operation& checked) {
    const std::string_view operation = checked.Name();
    TraceOperation(operation);
    // Inside a read transaction the armed faults cannot change (a fault that fires writes, and
    // that ends the transaction): read them once, not once a call.
    if (const uint64_t snapshot = ReadSnapshot(); snapshot != 0) {
        if (faultsSnapshot_ != snapshot) {
            faultsSnapshot_ = snapshot;
            armedFaults_.clear();
            auto armed = Prepare("SELECT op FROM faults");
            while (armed.Step()) armedFaults_.insert(armed.Text(0));
        }
        if (armedFaults_.empty() || armedFaults_.find(operation) == armedFaults_.end()) return;
    }
    {
        auto fault = Prepare("SELECT message, detail, remaining FROM faults WHERE op = ?");
        fault.Bind(1, operation);
        if (!fault.Step()) return;
        if (fault.IsNull(2)) {
            if (fault.IsNull(1)) throw HostCtl::Lib::HostCtlException(fault.Text(0));
            throw HostCtl::Lib::HostCtlException(fault.Text(0), fault.Text(1));
        }
    }
    // A fault armed for N calls: take one call off it, with the row re-read under the write
    // lock so that concurrent processes never fire it more than N times.
    std::optional<HostCtl::Lib::HostCtlException> exception;
    const std::string op(operation);
    Write([&] {
        auto fault = Prepare("SELECT message, detail, remaining FROM faults WHERE op = ?");
        fault.Bind(1, op);
        if (!fault.Step()) return;
        if (fault.IsNull(1)) {
            exception.emplace(fault.Text(0));
        } else {
            exception.emplace(fault.Text(0), fault.Text(1));
        }
        if (!fault.IsNull(2)) {
            DecrementFault(*this, op);
            if (writeDepth_ > 1) PendingHits().push_back(op);
        }
    });
    if (exception) throw *exception;
}

void Store::Write(const std::function<void()>& work) {
    auto& pending = PendingHits();
    if (writeDepth_ == 0 && readDepth_ > 0) {
        // A read transaction cannot become a write one once another process has written; end
        // it, write, and read on in a new one.
        Exec("COMMIT");
        readSnapshot_ = 0;
        const int depth = std::exchange(readDepth_, 0);
        struct Resume {
            Store& store;
            int depth;
            ~Resume() {
                sqlite3_exec(store.db_, "BEGIN", nullptr, nullptr, nullptr);
                store.readDepth_ = depth;
                store.readSnapshot_ = NextReadSnapshot();
            }
        } resume{*this, depth};
        Write(work);
        return;
    }
    if (writeDepth_ == 0) {
        Exec("BEGIN IMMEDIATE");
        writeDepth_ = 1;
        try {
            work();
            Exec("COMMIT");
            wrote_ = true;
        } catch (...) {
            writeDepth_ = 0;
            sqlite3_exec(db_, "ROLLBACK", nullptr, nullptr, nullptr);
            if (!pending.empty()) {
                const auto hits = std::move(pending);
                pending.clear();
                try {
                    Write([&] {
                        for (const auto& op : hits) DecrementFault(*this, op);
                    });
                } catch (...) {
                    // The original failure is the one to report.
                }
            }
            throw;
        }
        writeDepth_ = 0;
        pending.clear();
        return;
    }
    const std::string savepoint = "nested" + std::to_string(writeDepth_);
    const size_t mark = pending.size();
    Exec("SAVEPOINT " + savepoint);
    ++writeDepth_;
    try {
        work();
        --writeDepth_;
        Exec("RELEASE " + savepoint);
    } catch (...) {
        writeDepth_ = std::max(1, writeDepth_ - 1);
        sqlite3_exec(db_, ("ROLLBACK TO " + savepoint).c_str(), nullptr, nullptr, nullptr);
        sqlite3_exec(db_, ("RELEASE " + savepoint).c_str(), nullptr, nullptr, nullptr);
        for (size_t i = mark; i < pending.size(); ++i) {
            try {
                DecrementFault(*this, pending[i]);
            } catch (...) {
            }
        }
        throw;
    }
}

void Store::Exec(std::string_view sql) {
    ExecRaw(db_, sql);
}

std::optional<std::string> Store::GetValue(std::string_view key) {
    auto row = Prepare("SELECT value FROM host WHERE key = ?");
    row.Bind(1, key);
    if (!row.Step()) return std::nullopt;
    return row.Text(0);
}

std::string Store::GetValue(std::string_view key, std::string_view fallback) {
    auto value = GetValue(key);
    return value ? *value : std::string(fallback);
}

int64_t Store::GetInt(std::string_view key, int64_t fallback) {
    auto value = GetValue(key);
    if (!value || value->empty()) return fallback;
    char* end = nullptr;
    errno = 0;
    const long long number = strtoll(value->c_str(), &end, 10);
    if (errno != 0 || *end != '\0') return fallback;
    return number;
}

void Store::SetValue(std::string_view key, std::string_view value) {
    Prepare(
        "INSERT INTO host (key, value) VALUES (?, ?)"
        " ON CONFLICT (key) DO UPDATE SET value = excluded.value")
        .Bind(1, key)
        .Bind(2, value)
        .Run();
}

void Store::SetInt(std::string_view key, int64_t value) {
    SetValue(key, std::to_string(value));
}

void Store::Journal(std::string_view kind, const Fields& fields) {
    nlohmann::ordered_json record;
    record["kind"] = kind;
    for (const auto& [name, value] : fields) record[name] = ToJson(value);
    const std::string text =
        record.dump(-1, ' ', false, nlohmann::ordered_json::error_handler_t::replace);
    Prepare("INSERT INTO journal (record) VALUES (?)").Bind(1, text).Run();
}

void Store::JournalCall(const Operation& operation, const std::vector<Value>& args) {
    nlohmann::ordered_json record;
    record["kind"] = "call";
    record["op"] = operation.Name();
    record["args"] = nlohmann::ordered_json::array();
    for (const auto& arg : args) record["args"].push_back(ToJson(arg));
    const std::string text =
        record.dump(-1, ' ', false, nlohmann::ordered_json::error_handler_t::replace);
    Prepare("INSERT INTO journal (record) VALUES (?)").Bind(1, text).Run();
}

void Store::ReadExclusive(const std::function<void()>& work) {
    if (writeDepth_ > 0 || readDepth_ > 0) {
        // Inside a write the lock is held already; a read cannot take it.
        if (writeDepth_ == 0) throw StoreError("host store: an exclusive read inside a read", 0);
        work();
        return;
    }
    Exec(readOnly_ ? "BEGIN" : "BEGIN IMMEDIATE");
    readDepth_ = 1;
    readSnapshot_ = NextReadSnapshot();
    try {
        work();
    } catch (...) {
        readDepth_ = 0;
        readSnapshot_ = 0;
        sqlite3_exec(db_, "ROLLBACK", nullptr, nullptr, nullptr);
        throw;
    }
    readDepth_ = 0;
    readSnapshot_ = 0;
    Exec("COMMIT");
}

}  // namespace BrixSim

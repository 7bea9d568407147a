// The simulated host's state: one SQLite database under the host root, plus the files the host
// keeps at their host paths below that root. Every platform adapter is a thin layer over this.
#pragma once

#include <cstdint>
#include <filesystem>
#include <functional>
#include <initializer_list>
#include <optional>
#include <set>
#include <stdexcept>
#include <string>
#include <string_view>
#include <type_traits>
#include <unordered_map>
#include <utility>
#include <variant>
#include <vector>

#include "hostsim/core/Operation.h"

struct sqlite3;
struct sqlite3_stmt;

namespace BrixSim {

// A journal or call argument.
using Value = std::variant<std::nullptr_t, bool, int64_t, std::string, std::vector<std::string>>;
using Fields = std::vector<std::pair<std::string, Value>>;

// A failure of the store itself. The message names the store's file and what is wrong with it;
// `Code()` is SQLite's extended result code (0 when the failure is not SQLite's).
class StoreError : public std::runtime_error {
  public:
    StoreError(const std::string& message, int code, std::string reason = {})
        : std::runtime_error(message), code_(code), reason_(std::move(reason)) {}
    int Code() const { return code_; }
    // What is wrong, without the file: SQLite's own text.
    const std::string& Reason() const { return reason_; }

  private:
    int code_;
    std::string reason_;
};

// A prepared statement; bind with 1-based indexes, step, read columns.
class Stmt {
  public:
    Stmt(sqlite3* db, std::string_view sql);
    ~Stmt();
    Stmt(Stmt&& other) noexcept;
    Stmt(const Stmt&) = delete;
    Stmt& operator=(const Stmt&) = delete;

    Stmt& Bind(int index, std::string_view text);
    Stmt& Bind(int index, const char* text) { return Bind(index, std::string_view(text)); }
    Stmt& Bind(int index, int64_t value);
    Stmt& Bind(int index, int value) { return Bind(index, static_cast<int64_t>(value)); }
    Stmt& Bind(int index, bool value) { return Bind(index, static_cast<int64_t>(value)); }
    // Any other integer type (long long, unsigned, size_t, ...), stored as a signed 64-bit value.
    template <class T, class = std::enable_if_t<std::is_integral_v<T>>>
    Stmt& Bind(int index, T value) {
        return Bind(index, static_cast<int64_t>(value));
    }
    Stmt& Bind(int index, double value);
    Stmt& BindNull(int index);

    // True while a row is available.
    bool Step();
    // Runs a statement that returns no rows.
    void Run();
    void Reset();

    std::string Text(int column) const;
    int64_t Int(int column) const;
    double Float(int column) const;
    bool IsNull(int column) const;

    // The shape of a row, for statements built at run time.
    enum class Kind { Integer, Float, Text, Null };
    int ColumnCount() const;
    std::string ColumnName(int column) const;
    Kind ColumnKind(int column) const;

  private:
    friend class Store;
    // A statement of the store's cache: reset instead of finalised, and marked free again.
    Stmt(sqlite3* db, sqlite3_stmt* cached, bool* inUse) : db_(db), stmt_(cached), inUse_(inUse) {}

    sqlite3* db_;
    sqlite3_stmt* stmt_ = nullptr;
    bool* inUse_ = nullptr;
};

// One area's tables: created in every host, seeded in a new one. Register at static
// initialisation with `static const bool registered = BrixSim::RegisterTables({...});`.
struct TableSet {
    std::string name;                        // the area, e.g. "coredump"
    std::string schema;                      // CREATE TABLE IF NOT EXISTS statements
    std::function<void(class Store&)> seed;  // fills a new host deterministically; may be empty
};
bool RegisterTables(TableSet tables);

class Store {
  public:
    // The store of the current host root ($BRIX_HOST_ROOT, or the default root), opened on
    // first use. A missing or empty root is made a host: created, seeded and marked. A marked
    // root whose store is missing, empty or damaged, and a folder that holds anything but a
    // host, are refused with a StoreError that says so.
    static Store& Get();
    // Closes the process-wide store so the next Get() opens the root named by the environment.
    static void Close();
    // The feature switches of the current root, read without opening the store: no host is
    // made, nothing is checked or written. A root without a host has every switch off. False
    // when a host is there but its switches cannot be read.
    static bool PeekFeatures(unsigned char* states, int count);
    // The host root as the environment names it (without opening anything).
    static std::filesystem::path DefaultRoot();
    // The file that marks a folder as a complete host, and the top-level entries the host made.
    static constexpr const char* kMarkerName = ".brixhost";
    // The entries of `root` the host made (the store's files, the marker and what the marker
    // lists), or nullopt when `root` holds no host.
    static std::optional<std::vector<std::string>> HostEntries(const std::filesystem::path& root);
    // Lets this process make a host in a folder that also holds files the host did not make:
    // what `brixsim init --force` leaves of a former host.
    static void AdoptFolder();
    static bool AdoptingFolder();

    const std::filesystem::path& Root() const { return root_; }
    sqlite3* Db() const { return db_; }

    // Maps a host path ("/etc/ostrel/snmp.xml") to its place under the root. Relative paths are
    // taken from the host's "/". Returns nullopt for a path that would leave the root ("..", or
    // a symbolic link pointing outside); callers answer such paths with EACCES.
    std::optional<std::filesystem::path> Resolve(std::string_view hostPath) const;

    // Throws HostCtl::Lib::HostCtlException when a fault is armed for `operation`.
    void Check(const Operation& operation);

    // Runs `work` in one write transaction (BEGIN IMMEDIATE ... COMMIT), rolled back if it
    // throws. Nested calls join the outer transaction.
    void Write(const std::function<void()>& work);

    // Runs `work` in one read transaction, so that the reads in it see one state of the host
    // and take the database's locks once. Nested in a read or write transaction it just runs.
    // A write inside ends the read transaction and starts a new one after it.
    void Read(const std::function<void()>& work);
    // Non-zero, and different for every read transaction, while Read runs outside any write:
    // what an area may key a cache of rows on, as the rows cannot change until it changes.
    uint64_t ReadSnapshot() const { return writeDepth_ == 0 ? readSnapshot_ : 0; }

    // Holds one read transaction, as Read does, for as long as it lives: for rows read after the
    // call that asked for them returns (a listing printed as it is read). Taken inside a Read it
    // keeps that transaction open after the Read returns; inside a write it holds nothing.
    class ReadHold {
      public:
        explicit ReadHold(Store& store);
        ~ReadHold();
        ReadHold(const ReadHold&) = delete;
        ReadHold& operator=(const ReadHold&) = delete;

      private:
        Store& store_;
        bool holds_ = false;
    };

    // The statements are prepared once per store and kept (SQLite's parser costs more than
    // most of the queries); a statement in use when asked for again is prepared afresh.
    Stmt Prepare(std::string_view sql);
    void Exec(std::string_view sql);

    // The "host" key-value table, for the host's scalar settings.
    std::optional<std::string> GetValue(std::string_view key);
    std::string GetValue(std::string_view key, std::string_view fallback);
    int64_t GetInt(std::string_view key, int64_t fallback);
    void SetValue(std::string_view key, std::string_view value);
    void SetInt(std::string_view key, int64_t value);

    // Appends a record {"kind": kind, fields...} to the journal.
    void Journal(std::string_view kind, const Fields& fields);
    // Appends {"kind":"call","op":operation,"args":[...]}.
    void JournalCall(const Operation& operation, const std::vector<Value>& args);

    ~Store();

  private:
    explicit Store(std::filesystem::path root);
    void Open();
    void SwitchToWal();
    void CreateSchema(bool seed);
    void WriteMarker(const std::set<std::string>& foreign);

    struct CachedStmt {
        sqlite3_stmt* stmt = nullptr;
        bool inUse = false;
    };

    std::filesystem::path root_;
    sqlite3* db_ = nullptr;
    bool readOnly_ = false;  // a host on a folder this process cannot write
    bool wrote_ = false;     // this process committed a write
    int writeDepth_ = 0;
    int readDepth_ = 0;
    uint64_t readSnapshot_ = 0;
    std::unordered_map<std::string, CachedStmt> statements_;
    // The operations with a fault armed, as read in the read transaction `faultsSnapshot_`.
    uint64_t faultsSnapshot_ = 0;
    std::set<std::string, std::less<>> armedFaults_;

  public:
    // Runs `work` in a read transaction that also holds the write lock, so no other process
    // commits, nor publishes a file it writes under that lock, until it ends: what a reader of
    // the tables and the files at once needs. Writes nothing. On a host this process cannot
    // write, nobody can change anything, and a plain read transaction serves.
    void ReadExclusive(const std::function<void()>& work);

  private:
    // Ends one part in the read transaction; the last part ends it (`checked`: a failure to end
    // it is reported).
    void EndRead(bool checked);
};

}  // namespace BrixSim

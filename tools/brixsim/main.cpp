// brixsim: makes and seeds a simulated host, arms faults, reads the journal, exports and imports
// the host's state, and switches feature entries.
#include <sqlite3.h>
#include <stdlib.h>

#include <algorithm>
#include <cstdio>
#include <fstream>
#include <iostream>
#include <iterator>
#include <map>
#include <nlohmann/json.hpp>
#include <optional>
#include <set>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include "core/Registry.h"
#include "core/Store.h"

namespace {

namespace fs = std::filesystem;
using Args = std::vector<std::string>;

constexpr const char* kUsage =
    "Usage: brixsim [--root DIR] COMMAND [ARGUMENTS]\n"
    "\n"
    "The host root is DIR, else $BRIX_HOST_ROOT, else\n"
    "${XDG_STATE_HOME:-$HOME/.local/state}/brixsim/default.\n"
    "\n"
    "Commands:\n"
    "  init [--force]                      create and seed the host (--force: start afresh)\n"
    "  fault set OPERATION MESSAGE [--detail TEXT] [--times N]\n"
    "                                      make OPERATION fail with MESSAGE (N times, or until\n"
    "                                      cleared)\n"
    "  fault clear [OPERATION]             disarm one fault, or all\n"
    "  fault list                          the armed faults, as JSON lines\n"
    "  fault ops                           every operation that can be made to fail\n"
    "  journal [--clear]                   print the journal as JSON lines (--clear: empty it)\n"
    "  export                              print the host's state as one JSON document\n"
    "  import FILE                         replace the tables FILE holds (- for standard input)\n"
    "  feature set ENTRY on|off            switch a feature entry (0-255)\n"
    "  feature get ENTRY                   print on or off\n";

// A wrong invocation: the message and the usage go to standard error, exit status 2.
struct UsageError : std::runtime_error {
    using std::runtime_error::runtime_error;
};

std::string Quote(const std::string& identifier) {
    std::string quoted = "\"";
    for (char c : identifier) {
        quoted += c;
        if (c == '"') quoted += '"';
    }
    return quoted + "\"";
}

int64_t ParseInt(const std::string& text, const std::string& what) {
    size_t used = 0;
    int64_t value = 0;
    try {
        value = std::stoll(text, &used, 10);
    } catch (const std::exception&) {
        used = 0;
    }
    if (used == 0 || used != text.size()) throw UsageError(what + " must be an integer: " + text);
    return value;
}

int FeatureEntry(const std::string& text) {
    const int64_t entry = ParseInt(text, "ENTRY");
    if (entry < 0 || entry > 255) throw UsageError("ENTRY must be between 0 and 255: " + text);
    return static_cast<int>(entry);
}

// ---------------------------------------------------------------------------------------------

int Init(const Args& args) {
    bool force = false;
    for (size_t i = 0; i < args.size(); ++i) {
        if (args[i] == "--force") {
            force = true;
        } else if (args[i] == "--root" && i + 1 < args.size()) {
            setenv("BRIX_HOST_ROOT", args[++i].c_str(), 1);
        } else {
            throw UsageError("init: unexpected argument " + args[i]);
        }
    }
    BrixSim::Store::Close();
    const fs::path root = BrixSim::Store::DefaultRoot();
    if (fs::exists(root / "host.db")) {
        if (!force) {
            std::cerr << "brixsim: a host already exists at " << root.string()
                      << "; use init --force to recreate it\n";
            return 1;
        }
        for (const auto& entry : fs::directory_iterator(root)) fs::remove_all(entry.path());
    }
    BrixSim::Store::Get();
    std::cout << "Seeded host at " << BrixSim::Store::Get().Root().string() << "\n";
    return 0;
}

int FaultSet(const Args& args) {
    std::vector<std::string> positional;
    std::optional<std::string> detail;
    std::optional<int64_t> times;
    bool optionsDone = false;
    for (size_t i = 0; i < args.size(); ++i) {
        const std::string& arg = args[i];
        if (!optionsDone && arg == "--") {
            optionsDone = true;
        } else if (!optionsDone && (arg == "--detail" || arg == "--times")) {
            if (i + 1 >= args.size()) throw UsageError("fault set: " + arg + " needs a value");
            if (arg == "--detail") {
                detail = args[++i];
            } else {
                times = ParseInt(args[++i], "--times");
                if (*times < 1) throw UsageError("fault set: --times must be at least 1");
            }
        } else if (!optionsDone && arg.size() > 2 && arg.rfind("--", 0) == 0) {
            throw UsageError("fault set: unknown option " + arg);
        } else {
            positional.push_back(arg);
        }
    }
    if (positional.size() != 2) throw UsageError("fault set: needs OPERATION and MESSAGE");
    const auto operations = BrixSim::RegisteredOperations();
    if (!std::binary_search(operations.begin(), operations.end(), positional[0])) {
        std::cerr << "brixsim: unknown operation " << positional[0]
                  << " (brixsim fault ops lists them)\n";
        return 1;
    }
    auto& store = BrixSim::Store::Get();
    store.Write([&] {
        auto insert = store.Prepare("INSERT OR REPLACE INTO faults VALUES (?, ?, ?, ?)");
        insert.Bind(1, positional[0]).Bind(2, positional[1]);
        if (detail) {
            insert.Bind(3, *detail);
        } else {
            insert.BindNull(3);
        }
        if (times) {
            insert.Bind(4, *times);
        } else {
            insert.BindNull(4);
        }
        insert.Run();
    });
    return 0;
}

int Fault(const Args& args) {
    if (args.empty()) throw UsageError("fault: needs set, clear, list or ops");
    const Args rest(args.begin() + 1, args.end());
    if (args[0] == "set") return FaultSet(rest);
    if (args[0] == "clear") {
        if (rest.size() > 1) throw UsageError("fault clear: takes at most one OPERATION");
        auto& store = BrixSim::Store::Get();
        if (rest.empty()) {
            store.Exec("DELETE FROM faults");
        } else {
            store.Prepare("DELETE FROM faults WHERE op = ?").Bind(1, rest[0]).Run();
        }
        return 0;
    }
    if (args[0] == "list") {
        if (!rest.empty()) throw UsageError("fault list: takes no arguments");
        auto rows = BrixSim::Store::Get().Prepare(
            "SELECT op, message, detail, remaining FROM faults ORDER BY op");
        while (rows.Step()) {
            nlohmann::ordered_json fault;
            fault["op"] = rows.Text(0);
            fault["message"] = rows.Text(1);
            fault["detail"] =
                rows.IsNull(2) ? nlohmann::ordered_json() : nlohmann::ordered_json(rows.Text(2));
            fault["remaining"] =
                rows.IsNull(3) ? nlohmann::ordered_json() : nlohmann::ordered_json(rows.Int(3));
            std::cout << fault.dump() << "\n";
        }
        return 0;
    }
    if (args[0] == "ops") {
        if (!rest.empty()) throw UsageError("fault ops: takes no arguments");
        for (const auto& operation : BrixSim::RegisteredOperations()) {
            std::cout << operation << "\n";
        }
        return 0;
    }
    throw UsageError("fault: unknown subcommand " + args[0]);
}

int Journal(const Args& args) {
    auto& store = BrixSim::Store::Get();
    if (args.size() == 1 && args[0] == "--clear") {
        store.Exec("DELETE FROM journal");
        return 0;
    }
    if (!args.empty()) throw UsageError("journal: unexpected argument " + args[0]);
    auto rows = store.Prepare("SELECT record FROM journal ORDER BY seq");
    while (rows.Step()) std::cout << rows.Text(0) << "\n";
    return 0;
}

// Tables that export and import carry: all but SQLite's own and the store's bookkeeping.
std::vector<std::string> StateTables(BrixSim::Store& store) {
    std::vector<std::string> names;
    auto rows = store.Prepare(
        "SELECT name FROM sqlite_master WHERE type = 'table' AND name NOT LIKE 'sqlite\\_%' "
        "ESCAPE '\\' AND name <> 'meta' ORDER BY name");
    while (rows.Step()) names.push_back(rows.Text(0));
    return names;
}

std::vector<std::string> Columns(BrixSim::Store& store, const std::string& table) {
    std::vector<std::string> columns;
    auto rows = store.Prepare("SELECT name FROM pragma_table_info(?) ORDER BY cid");
    rows.Bind(1, table);
    while (rows.Step()) columns.push_back(rows.Text(0));
    return columns;
}

int Export(const Args& args) {
    if (!args.empty()) throw UsageError("export: unexpected argument " + args[0]);
    auto& store = BrixSim::Store::Get();
    nlohmann::ordered_json document;
    document["version"] = 1;
    auto& tables = document["tables"] = nlohmann::ordered_json::object();
    // One read transaction, so the document is a consistent snapshot.
    store.Exec("BEGIN");
    try {
        for (const auto& table : StateTables(store)) {
            auto& rows = tables[table] = nlohmann::ordered_json::array();
            sqlite3_stmt* stmt = nullptr;
            const std::string sql = "SELECT * FROM " + Quote(table);
            if (sqlite3_prepare_v2(store.Db(), sql.c_str(), -1, &stmt, nullptr) != SQLITE_OK) {
                throw std::runtime_error(sqlite3_errmsg(store.Db()));
            }
            int rc;
            while ((rc = sqlite3_step(stmt)) == SQLITE_ROW) {
                nlohmann::ordered_json row = nlohmann::ordered_json::object();
                for (int column = 0; column < sqlite3_column_count(stmt); ++column) {
                    const std::string name = sqlite3_column_name(stmt, column);
                    switch (sqlite3_column_type(stmt, column)) {
                        case SQLITE_INTEGER:
                            row[name] = static_cast<int64_t>(sqlite3_column_int64(stmt, column));
                            break;
                        case SQLITE_FLOAT:
                            row[name] = sqlite3_column_double(stmt, column);
                            break;
                        case SQLITE_NULL:
                            row[name] = nullptr;
                            break;
                        default:
                            row[name] = std::string(
                                reinterpret_cast<const char*>(sqlite3_column_text(stmt, column)),
                                static_cast<size_t>(sqlite3_column_bytes(stmt, column)));
                    }
                }
                rows.push_back(std::move(row));
            }
            sqlite3_finalize(stmt);
            if (rc != SQLITE_DONE) throw std::runtime_error(sqlite3_errmsg(store.Db()));
        }
    } catch (...) {
        store.Exec("ROLLBACK");
        throw;
    }
    store.Exec("COMMIT");
    std::cout << document.dump(2, ' ', false, nlohmann::ordered_json::error_handler_t::replace)
              << "\n";
    return 0;
}

void BindJson(sqlite3* db, sqlite3_stmt* stmt, int index, const nlohmann::json& value) {
    int rc = SQLITE_OK;
    if (value.is_null()) {
        rc = sqlite3_bind_null(stmt, index);
    } else if (value.is_boolean()) {
        rc = sqlite3_bind_int64(stmt, index, value.get<bool>() ? 1 : 0);
    } else if (value.is_number_integer()) {
        rc = sqlite3_bind_int64(stmt, index, value.get<int64_t>());
    } else if (value.is_number_float()) {
        rc = sqlite3_bind_double(stmt, index, value.get<double>());
    } else {
        const auto& text = value.get_ref<const std::string&>();
        rc = sqlite3_bind_text(stmt, index, text.data(), static_cast<int>(text.size()),
                               SQLITE_TRANSIENT);
    }
    if (rc != SQLITE_OK) throw std::runtime_error(sqlite3_errmsg(db));
}

int Import(const Args& args) {
    if (args.size() != 1) throw UsageError("import: needs FILE (or - for standard input)");
    std::string text;
    if (args[0] == "-") {
        text.assign(std::istreambuf_iterator<char>(std::cin), std::istreambuf_iterator<char>());
    } else {
        std::ifstream in(args[0], std::ios::binary);
        if (!in) {
            std::cerr << "brixsim: cannot read " << args[0] << "\n";
            return 1;
        }
        text.assign(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
    nlohmann::json document;
    try {
        document = nlohmann::json::parse(text);
    } catch (const nlohmann::json::exception& e) {
        std::cerr << "brixsim: " << args[0] << " is not JSON: " << e.what() << "\n";
        return 1;
    }

    auto invalid = [](const std::string& message) {
        std::cerr << "brixsim: import refused, nothing changed: " << message << "\n";
        return 1;
    };
    if (!document.is_object()) return invalid("the document is not a JSON object");
    if (!document.contains("version") || document["version"] != 1) {
        return invalid("\"version\" must be 1");
    }
    if (!document.contains("tables") || !document["tables"].is_object()) {
        return invalid("\"tables\" must be an object");
    }
    auto& store = BrixSim::Store::Get();
    const auto known = StateTables(store);
    std::map<std::string, std::set<std::string>> columns;
    for (const auto& [table, rows] : document["tables"].items()) {
        if (!std::binary_search(known.begin(), known.end(), table)) {
            return invalid("unknown table \"" + table + "\"");
        }
        const auto names = Columns(store, table);
        columns[table] = {names.begin(), names.end()};
        if (!rows.is_array()) return invalid("table \"" + table + "\" is not an array of rows");
        size_t index = 0;
        for (const auto& row : rows) {
            const std::string where = "table \"" + table + "\" row " + std::to_string(index++);
            if (!row.is_object()) return invalid(where + " is not an object");
            for (const auto& [column, value] : row.items()) {
                if (!columns[table].count(column)) {
                    return invalid(where + ": unknown column \"" + column + "\"");
                }
                if (value.is_object() || value.is_array() || value.is_binary()) {
                    return invalid(where + " column \"" + column + "\": not a scalar value");
                }
                if (value.is_number_unsigned() &&
                    value.get<uint64_t>() > static_cast<uint64_t>(INT64_MAX)) {
                    return invalid(where + " column \"" + column + "\": integer out of range");
                }
            }
        }
    }
    try {
        store.Write([&] {
            for (const auto& [table, rows] : document["tables"].items()) {
                store.Exec("DELETE FROM " + Quote(table));
                for (const auto& row : rows) {
                    std::string names, marks;
                    for (const auto& [column, value] : row.items()) {
                        (void)value;
                        names += (names.empty() ? "" : ", ") + Quote(column);
                        marks += marks.empty() ? "?" : ", ?";
                    }
                    const std::string sql = row.empty()
                                                ? "INSERT INTO " + Quote(table) + " DEFAULT VALUES"
                                                : "INSERT INTO " + Quote(table) + " (" + names +
                                                      ") VALUES (" + marks + ")";
                    sqlite3_stmt* stmt = nullptr;
                    if (sqlite3_prepare_v2(store.Db(), sql.c_str(), -1, &stmt, nullptr) !=
                        SQLITE_OK) {
                        throw std::runtime_error(sqlite3_errmsg(store.Db()));
                    }
                    int index = 1;
                    try {
                        for (const auto& [column, value] : row.items()) {
                            (void)column;
                            BindJson(store.Db(), stmt, index++, value);
                        }
                    } catch (...) {
                        sqlite3_finalize(stmt);
                        throw;
                    }
                    const int rc = sqlite3_step(stmt);
                    sqlite3_finalize(stmt);
                    if (rc != SQLITE_DONE) {
                        throw std::runtime_error("table \"" + table +
                                                 "\": " + sqlite3_errmsg(store.Db()));
                    }
                }
            }
        });
    } catch (const std::runtime_error& e) {
        return invalid(e.what());
    }
    return 0;
}

int Feature(const Args& args) {
    if (args.empty()) throw UsageError("feature: needs set or get");
    auto& store = BrixSim::Store::Get();
    if (args[0] == "set") {
        if (args.size() != 3) throw UsageError("feature set: needs ENTRY and on|off");
        const int entry = FeatureEntry(args[1]);
        if (args[2] != "on" && args[2] != "off") {
            throw UsageError("feature set: state must be on or off: " + args[2]);
        }
        store.Prepare("INSERT OR REPLACE INTO features VALUES (?, ?)")
            .Bind(1, entry)
            .Bind(2, args[2] == "on")
            .Run();
        return 0;
    }
    if (args[0] == "get") {
        if (args.size() != 2) throw UsageError("feature get: needs ENTRY");
        auto row = store.Prepare("SELECT state FROM features WHERE entry = ?");
        row.Bind(1, FeatureEntry(args[1]));
        std::cout << (row.Step() && row.Int(0) != 0 ? "on" : "off") << "\n";
        return 0;
    }
    throw UsageError("feature: unknown subcommand " + args[0]);
}

int Main(Args args) {
    while (!args.empty() && args[0] == "--root") {
        if (args.size() < 2) throw UsageError("--root needs a folder");
        setenv("BRIX_HOST_ROOT", args[1].c_str(), 1);
        args.erase(args.begin(), args.begin() + 2);
    }
    if (args.empty()) throw UsageError("no command given");
    const std::string command = args[0];
    const Args rest(args.begin() + 1, args.end());
    if (command == "help" || command == "--help" || command == "-h") {
        std::cout << kUsage;
        return 0;
    }
    if (command == "init") return Init(rest);
    if (command == "fault") return Fault(rest);
    if (command == "journal") return Journal(rest);
    if (command == "export") return Export(rest);
    if (command == "import") return Import(rest);
    if (command == "feature") return Feature(rest);
    throw UsageError("unknown command " + command);
}

}  // namespace

int main(int argc, char** argv) {
    try {
        return Main(Args(argv + 1, argv + argc));
    } catch (const UsageError& e) {
        std::cerr << "brixsim: " << e.what() << "\n\n" << kUsage;
        return 2;
    } catch (const std::exception& e) {
        std::cerr << "brixsim: " << e.what() << "\n";
        return 1;
    }
}

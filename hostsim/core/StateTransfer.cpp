#include "core/StateTransfer.h"

#include <sqlite3.h>

#include <algorithm>
#include <map>
#include <nlohmann/json.hpp>
#include <set>
#include <stdexcept>
#include <vector>

#include "core/FileTransfer.h"
#include "core/Store.h"

namespace BrixSim {

namespace {

// 1: the tables only; 2: the tables and the files kept under the root.
constexpr int kFormatVersion = 2;

std::string Quote(const std::string& identifier) {
    std::string quoted = "\"";
    for (char c : identifier) {
        quoted += c;
        if (c == '"') quoted += '"';
    }
    return quoted + "\"";
}

// Tables that export and import carry: all but SQLite's own and the store's bookkeeping.
std::vector<std::string> StateTables(Store& store) {
    std::vector<std::string> names;
    auto rows = store.Prepare(
        "SELECT name FROM sqlite_master WHERE type = 'table' AND name NOT LIKE 'sqlite\\_%' "
        "ESCAPE '\\' AND name <> 'meta' ORDER BY name");
    while (rows.Step()) names.push_back(rows.Text(0));
    return names;
}

std::vector<std::string> Columns(Store& store, const std::string& table) {
    std::vector<std::string> columns;
    auto rows = store.Prepare("SELECT name FROM pragma_table_info(?) ORDER BY cid");
    rows.Bind(1, table);
    while (rows.Step()) columns.push_back(rows.Text(0));
    return columns;
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

}  // namespace

std::string ExportState(Store& store) {
    nlohmann::ordered_json document;
    document["version"] = kFormatVersion;
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
    // The files, inside the same read transaction: no writer changes them meanwhile, as every
    // writer holds the store's write lock while it publishes.
    try {
        document["files"] = ExportFiles(store.Root());
    } catch (...) {
        store.Exec("ROLLBACK");
        throw;
    }
    store.Exec("COMMIT");
    return document.dump(2, ' ', false, nlohmann::ordered_json::error_handler_t::replace);
}

ImportResult ImportState(std::string_view text, const std::function<Store&()>& openStore) {
    nlohmann::json document;
    try {
        document = nlohmann::json::parse(text);
    } catch (const nlohmann::json::exception& e) {
        return {ImportResult::Status::NotJson, e.what()};
    }

    auto invalid = [](const std::string& message) {
        return ImportResult{ImportResult::Status::Refused, message};
    };
    if (!document.is_object()) return invalid("the document is not a JSON object");
    if (!document.contains("version") || !document["version"].is_number_integer() ||
        (document["version"] != 1 && document["version"] != kFormatVersion)) {
        return invalid("\"version\" must be 1 (tables only) or " + std::to_string(kFormatVersion) +
                       " (the whole host)");
    }
    if (!document.contains("tables") || !document["tables"].is_object()) {
        return invalid("\"tables\" must be an object");
    }
    const bool withFiles = document["version"] == kFormatVersion;
    if (withFiles) {
        if (!document.contains("files")) return invalid("\"files\" is missing");
        if (const std::string problem = CheckFiles(document["files"]); !problem.empty()) {
            return invalid(problem);
        }
    }
    Store& store = openStore();
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
            // Tables are replaced one after another; references between them are checked
            // once all are in place.
            store.Exec("PRAGMA defer_foreign_keys=ON");
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
                    const std::string error = sqlite3_errmsg(store.Db());
                    sqlite3_finalize(stmt);
                    if (rc != SQLITE_DONE) {
                        throw std::runtime_error("table \"" + table + "\": " + error);
                    }
                }
            }
            // Last, so that a table the store refuses leaves the files untouched too.
            if (withFiles) ImportFiles(store.Root(), document["files"]);
        });
    } catch (const std::runtime_error& e) {
        return invalid(e.what());
    }
    return {};
}

}  // namespace BrixSim

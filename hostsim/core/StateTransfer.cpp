#include "hostsim/core/StateTransfer.h"

#include <algorithm>
#include <map>
#include <nlohmann/json.hpp>
#include <optional>
#include <set>
#include <stdexcept>
#include <vector>

#include "hostsim/core/FileTransfer.h"
#include "hostsim/core/StagedTree.h"
#include "hostsim/core/Store.h"

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

void BindJson(Stmt& stmt, int index, const nlohmann::json& value) {
    if (value.is_null()) {
        stmt.BindNull(index);
    } else if (value.is_boolean()) {
        stmt.Bind(index, value.get<bool>());
    } else if (value.is_number_integer()) {
        stmt.Bind(index, value.get<int64_t>());
    } else if (value.is_number_float()) {
        stmt.Bind(index, value.get<double>());
    } else {
        stmt.Bind(index, value.get_ref<const std::string&>());
    }
}

// Where in `value` the first text that is not UTF-8 lies, as a JSON pointer ("/files/3/path").
std::string NonUtf8Text(const nlohmann::ordered_json& value, const std::string& at) {
    if (value.is_string()) {
        try {
            (void)value.dump();
        } catch (const nlohmann::json::type_error&) {
            return at;
        }
    } else if (value.is_object()) {
        // Keys are the store's own table and column names.
        for (const auto& [key, member] : value.items()) {
            if (auto found = NonUtf8Text(member, at + "/" + key); !found.empty()) return found;
        }
    } else if (value.is_array()) {
        for (size_t index = 0; index < value.size(); ++index) {
            if (auto found = NonUtf8Text(value[index], at + "/" + std::to_string(index));
                !found.empty()) {
                return found;
            }
        }
    }
    return {};
}

}  // namespace

std::string ExportState(Store& store) {
    nlohmann::ordered_json document;
    document["version"] = kFormatVersion;
    auto& tables = document["tables"] = nlohmann::ordered_json::object();
    // The tables and the files as of one moment: every writer publishes its files while it
    // holds the write lock, which this read holds too.
    store.ReadExclusive([&] {
        for (const auto& table : StateTables(store)) {
            auto& rows = tables[table] = nlohmann::ordered_json::array();
            auto stmt = store.Prepare("SELECT * FROM " + Quote(table));
            while (stmt.Step()) {
                nlohmann::ordered_json row = nlohmann::ordered_json::object();
                for (int column = 0; column < stmt.ColumnCount(); ++column) {
                    const std::string name = stmt.ColumnName(column);
                    switch (stmt.ColumnKind(column)) {
                        case Stmt::Kind::Integer:
                            row[name] = stmt.Int(column);
                            break;
                        case Stmt::Kind::Float:
                            row[name] = stmt.Float(column);
                            break;
                        case Stmt::Kind::Null:
                            row[name] = nullptr;
                            break;
                        case Stmt::Kind::Text:
                            row[name] = stmt.Text(column);
                    }
                }
                rows.push_back(std::move(row));
            }
        }
        document["files"] = ExportFiles(store.Root());
    });
    try {
        return document.dump(2);
    } catch (const nlohmann::json::type_error&) {
        // A name or a value a JSON text cannot hold as it is: refused rather than altered.
        throw std::runtime_error("cannot export: the text at " + NonUtf8Text(document, "") +
                                 " is not UTF-8");
    }
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
    std::vector<FileEntry> files;
    if (withFiles) {
        if (!document.contains("files")) return invalid("\"files\" is missing");
        if (const std::string problem = ParseFiles(document["files"], files); !problem.empty()) {
            return invalid(problem);
        }
    }
    for (const auto& [key, value] : document.items()) {
        (void)value;
        if (key != "version" && key != "tables" && (key != "files" || !withFiles)) {
            return invalid("the document has no \"" + key + "\"");
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
    bool replacingFiles = false;
    try {
        store.Write([&] {
            // Every file is written out before anything changes, so a full disk changes nothing.
            std::optional<StagedTree> staged;
            if (withFiles) staged.emplace(store.Root(), files);
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
                    auto stmt = store.Prepare(sql);
                    int index = 1;
                    for (const auto& [column, value] : row.items()) {
                        (void)column;
                        BindJson(stmt, index++, value);
                    }
                    try {
                        stmt.Run();
                    } catch (const StoreError& error) {
                        throw std::runtime_error("table \"" + table + "\": " + error.Reason());
                    }
                }
            }
            // Last, so that a table the store refuses leaves the files untouched too.
            replacingFiles = withFiles;
            if (staged) staged->Apply();
        });
    } catch (const std::runtime_error& e) {
        if (replacingFiles) return {ImportResult::Status::Failed, e.what()};
        return invalid(e.what());
    }
    return {};
}

}  // namespace BrixSim

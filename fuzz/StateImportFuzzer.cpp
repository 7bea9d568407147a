// `brixsim import`: a state document applied to a host in a temporary root, reused for the whole
// run. An import either applies fully or leaves every table as it was and gives a reason. A host
// changed by an import still opens; the import is then undone by importing the tables it
// replaced from the first export.
#include <sqlite3.h>

#include <map>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "FuzzSupport.h"
#include "hostsim/core/StateTransfer.h"
#include "hostsim/core/Store.h"

namespace {

using BrixSim::ImportResult;
using BrixSim::Store;

struct Table {
    std::string selectQuery;  // every row, in storage order
    std::string countQuery;
    uint64_t content = 0;  // digest of the seeded host's rows
    std::string document;  // "name":[rows] of the seeded host's export
};
std::map<std::string, Table> tables;

Store& OpenStore() {
    return Store::Get();
}

std::string Quote(const std::string& identifier) {
    std::string quoted = "\"";
    for (char c : identifier) quoted += c == '"' ? std::string("\"\"") : std::string(1, c);
    return quoted + "\"";
}

// A digest of every value of every row (FNV-1a), read straight from SQLite: a full export per
// input would be slow.
uint64_t Content(const Table& table) {
    uint64_t digest = 14695981039346656037ull;
    auto mix = [&digest](const void* bytes, size_t size) {
        const auto* byte = static_cast<const unsigned char*>(bytes);
        for (size_t i = 0; i < size; ++i) digest = (digest ^ byte[i]) * 1099511628211ull;
    };
    sqlite3* db = Store::Get().Db();
    sqlite3_stmt* stmt = nullptr;
    if (sqlite3_prepare_v2(db, table.selectQuery.c_str(), -1, &stmt, nullptr) != SQLITE_OK) {
        BrixFuzz::Fail("cannot read a table", sqlite3_errmsg(db));
    }
    int rc;
    while ((rc = sqlite3_step(stmt)) == SQLITE_ROW) {
        for (int column = 0; column < sqlite3_column_count(stmt); ++column) {
            const int type = sqlite3_column_type(stmt, column);
            mix(&type, sizeof type);
            if (type == SQLITE_INTEGER) {
                const sqlite3_int64 value = sqlite3_column_int64(stmt, column);
                mix(&value, sizeof value);
            } else if (type == SQLITE_FLOAT) {
                const double value = sqlite3_column_double(stmt, column);
                mix(&value, sizeof value);
            } else if (type != SQLITE_NULL) {
                const void* bytes = sqlite3_column_blob(stmt, column);
                mix(bytes, static_cast<size_t>(sqlite3_column_bytes(stmt, column)));
            }
        }
        mix("\n", 1);
    }
    sqlite3_finalize(stmt);
    if (rc != SQLITE_DONE) BrixFuzz::Fail("cannot read a table", sqlite3_errmsg(db));
    return digest;
}

int64_t RowCount(const Table& table) {
    auto count = Store::Get().Prepare(table.countQuery);
    count.Step();
    return count.Int(0);
}

void Setup() {
    const auto exported = nlohmann::ordered_json::parse(BrixSim::ExportState(Store::Get()));
    for (const auto& [name, rows] : exported["tables"].items()) {
        Table table;
        table.selectQuery = "SELECT * FROM " + Quote(name);
        table.countQuery = "SELECT count(*) FROM " + Quote(name);
        table.content = Content(table);
        table.document = nlohmann::ordered_json(name).dump() + ":" + rows.dump();
        tables.emplace(name, std::move(table));
    }
}

void CheckUnchanged(const std::string& reason) {
    for (const auto& [name, table] : tables) {
        BRIX_FUZZ_CHECK(Content(table) == table.content, "table " + name + " changed: " + reason);
    }
}

// Every table the document names holds as many rows as it gave; the others are untouched.
// Returns the names of the replaced tables.
std::vector<std::string> CheckApplied(std::string_view text) {
    const auto document = nlohmann::json::parse(text);
    std::vector<std::string> replaced;
    for (const auto& [name, table] : tables) {
        if (document["tables"].contains(name)) {
            const auto given = document["tables"][name].size();
            BRIX_FUZZ_CHECK(
                RowCount(table) == static_cast<int64_t>(given),
                "table " + name + " does not hold the " + std::to_string(given) + " rows given");
            replaced.push_back(name);
        } else {
            BRIX_FUZZ_CHECK(Content(table) == table.content, "table " + name + " changed");
        }
    }
    return replaced;
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
    BrixFuzz::TemporaryHostRoot();
    Setup();
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string_view text = BrixFuzz::Text(data, size);
    const ImportResult result = BrixSim::ImportState(text, OpenStore);
    std::vector<std::string> replaced;
    if (result.status == ImportResult::Status::Applied) {
        BRIX_FUZZ_CHECK(result.message.empty(), result.message);
        replaced = CheckApplied(text);
    } else {
        BRIX_FUZZ_CHECK(!result.message.empty(), "a refusal without a reason");
        CheckUnchanged("though the import was refused: " + result.message);
    }
    if (!replaced.empty()) {
        // The changed host still opens; then it goes back to where it started.
        Store::Close();
        Store::Get();
        std::string undo = "{\"version\":1,\"tables\":{";
        for (size_t i = 0; i < replaced.size(); ++i) {
            undo += (i ? "," : "") + tables.at(replaced[i]).document;
        }
        undo += "}}";
        const ImportResult undone = BrixSim::ImportState(undo, OpenStore);
        BRIX_FUZZ_CHECK(undone.status == ImportResult::Status::Applied, undone.message);
        CheckUnchanged("the undo differs from the first export");
    }
    return 0;
}

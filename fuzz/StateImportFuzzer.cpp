// `brixsim import`: a state document applied to a host in a temporary root, reused for the whole
// run. An import either applies fully or leaves the store as it was with a reason, and the host
// opens afterwards either way; an applied import is undone by importing the first export again.
#include <nlohmann/json.hpp>
#include <string>

#include "FuzzSupport.h"
#include "core/StateTransfer.h"
#include "core/Store.h"

namespace {

using BrixSim::ImportResult;
using BrixSim::Store;

// The seeded host's export: the state every input starts from.
std::string baseline;

Store& OpenStore() {
    return Store::Get();
}

int64_t RowCount(const std::string& table) {
    std::string quoted = "\"";
    for (char c : table) quoted += c == '"' ? std::string("\"\"") : std::string(1, c);
    auto count = Store::Get().Prepare("SELECT count(*) FROM " + quoted + "\"");
    count.Step();
    return count.Int(0);
}

// Every table the document names holds as many rows as it gave; the others are untouched.
void CheckApplied(std::string_view text) {
    const auto document = nlohmann::json::parse(text);
    const auto now = nlohmann::json::parse(BrixSim::ExportState(Store::Get()));
    const auto before = nlohmann::json::parse(baseline);
    for (const auto& [table, rows] : before["tables"].items()) {
        if (document["tables"].contains(table)) {
            const auto given = document["tables"][table].size();
            BRIX_FUZZ_CHECK(RowCount(table) == static_cast<int64_t>(given),
                            "table " + table + " does not hold the rows given");
        } else {
            BRIX_FUZZ_CHECK(now["tables"][table] == rows, "table " + table + " changed");
        }
    }
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
    BrixFuzz::TemporaryHostRoot();
    baseline = BrixSim::ExportState(Store::Get());
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string_view text = BrixFuzz::Text(data, size);
    const ImportResult result = BrixSim::ImportState(text, OpenStore);
    if (result.status == ImportResult::Status::Applied) {
        BRIX_FUZZ_CHECK(result.message.empty(), result.message);
        CheckApplied(text);
    } else {
        BRIX_FUZZ_CHECK(!result.message.empty(), "a refusal without a reason");
        BRIX_FUZZ_CHECK(BrixSim::ExportState(Store::Get()) == baseline,
                        "refused, but the store changed: " + result.message);
    }
    // The host still opens, and goes back to where it started.
    Store::Close();
    Store::Get();
    if (result.status == ImportResult::Status::Applied) {
        const ImportResult undo = BrixSim::ImportState(baseline, OpenStore);
        BRIX_FUZZ_CHECK(undo.status == ImportResult::Status::Applied, undo.message);
        BRIX_FUZZ_CHECK(BrixSim::ExportState(Store::Get()) == baseline, "the undo differs");
    }
    return 0;
}

// The host's state as one JSON document (`brixsim export` / `brixsim import`): every table of
// the store but SQLite's own and the store's bookkeeping, and every file kept under the root,
// as {"version": 2, "tables": {...}, "files": [...]}.
#pragma once

#include <functional>
#include <string>
#include <string_view>

namespace BrixSim {

class Store;

// The document of the store's current state, indented by two spaces, in one read transaction.
std::string ExportState(Store& store);

struct ImportResult {
    enum class Status {
        Applied,  // every table the document holds was replaced
        NotJson,  // the text is not JSON; `message` is the parser's reason
        Refused,  // nothing changed; `message` says why
        Failed,   // the files could not all be put in place: the tables are as they were, the
                  // files partly the document's; `message` says why
    };
    Status status = Status::Applied;
    std::string message;
};

// Replaces the tables the document holds with its rows, in one transaction: either all of them
// or none; a version 2 document then makes the host's files its own (core/StagedTree.h), every
// file written out before the first change. A document that cannot be applied whole is refused
// before anything changes. `store` is asked for
// only once the document's overall shape is right, so a malformed document never opens (or creates)
// a host.
ImportResult ImportState(std::string_view text, const std::function<Store&()>& store);

}  // namespace BrixSim

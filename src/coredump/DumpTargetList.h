// The listing shared by the dump-file and Dorna dump-object commands: the candidates the storage
// service finds, plus the configured and active target when the scan missed them, each marked
// active or configured by its identifying string.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "frame/CommandKit.h"

namespace OstrelCli::System {

// The identifying string of a target that may be absent; a failed read leaves it empty.
template <class Read, class Id>
std::string ReadTargetIdQuietly(Read&& read, Id&& id) {
    try {
        const auto target = read();
        return target ? id(*target) : std::string();
    } catch (const HostCtl::Lib::HostCtlException&) {
        return std::string();
    }
}

// Appends rows to `list` for the valid targets among `candidates` and the configured and
// active targets they lack (made with `Impl`). `row` makes an empty row structure; rows are
// filled in the order idField, "Active", "Configured", "Size".
template <class Impl, class Target, class Id, class Row>
void ListDumpTargets(std::vector<std::unique_ptr<Target>> candidates, const std::string& configured,
                     const std::string& active, Id&& id, const char* idField, Row&& row,
                     MetaObj::MetaList& list) {
    bool configuredMissing = true;
    bool activeMissing = active != configured;
    for (const auto& candidate : candidates) {
        const std::string candidateId = id(*candidate);
        if (candidateId == configured) {
            configuredMissing = false;
        } else if (candidateId == active) {
            activeMissing = false;
        }
    }
    if (!configured.empty() && configuredMissing) {
        candidates.push_back(std::make_unique<Impl>(configured));
    }
    if (!active.empty() && activeMissing) candidates.push_back(std::make_unique<Impl>(active));

    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    for (const auto& candidate : candidates) {
        if (!candidate->IsValid(false)) continue;
        const std::string targetId = id(*candidate);
        auto entry = row();
        entry->SetField(idField, targetId, doc);
        entry->SetField("Active", targetId == active, doc);
        entry->SetField("Configured", targetId == configured, doc);
        entry->SetField("Size", static_cast<long>(candidate->GetSize()), doc);
        list.Add(entry);
    }
}

}  // namespace OstrelCli::System

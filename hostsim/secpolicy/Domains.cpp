// The kernel's access-control security domains: numbered slots (with gaps), each holding a named
// domain and its enforcement level. Shared by the domain commands and the process labels.
#include "hostsim/core/Hooks.h"
#include "hostsim/core/Store.h"

namespace {

const bool registered = BrixSim::RegisterTables({
    "secpolicy",
    "CREATE TABLE IF NOT EXISTS secpolicy_domains ("
    " id INTEGER PRIMARY KEY,"  // the domain's slot number
    " name TEXT NOT NULL UNIQUE,"
    " level TEXT NOT NULL);",
    [](BrixSim::Store& store) {
        store.SetInt("secpolicy.max_domains", 16);
        const std::pair<int, const char*> domains[] = {
            {0, "kernelCore"},   {1, "hostDaemons"}, {2, "mgmtAgents"},   {3, "shellTools"},
            {5, "guestRuntime"}, {6, "netServices"}, {8, "storageTools"}, {11, "pluginSandbox"},
        };
        auto insert = store.Prepare("INSERT INTO secpolicy_domains VALUES (?, ?, 'enforcing')");
        for (const auto& [id, name] : domains) {
            insert.Bind(1, id).Bind(2, name).Run();
            insert.Reset();
        }
    },
});

// Levels set by hand hold for the running boot only; every domain boots enforcing.
const bool restarts = BrixSim::RegisterBootStep(
    [](BrixSim::Store& store) { store.Exec("UPDATE secpolicy_domains SET level = 'enforcing'"); });

}  // namespace

// The kernel's user-level worlds: the table they live in, a realistic seeded host, and the two
// system-information nodes through which the kernel publishes them.
#include <charconv>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "cmdkit/Text.h"
#include "hostsim/core/Hooks.h"
#include "hostsim/core/KsiRecord.h"
#include "hostsim/core/Store.h"
#include "kernctl/Sysinfo.h"
#include "kernctl/SysinfoRecords.h"

namespace {

using BrixSim::Store;

// World state and type codes as the kernel stores them (named by the resource library).
enum State : int { kReady = 0, kRunning = 1, kWaiting = 2, kSleeping = 3 };
enum Type : int { kUser = 2, kVcpu = 3 };

// Flag words: user world, cartel leader, guest virtual CPU.
constexpr int64_t kFlagUser = 0x0401;
constexpr int64_t kFlagLeader = 0x0008;
constexpr int64_t kFlagVcpu = 0x2000;

// Security domain slots of the seeded access-control policy.
enum Domain : int {
    kHostDaemons = 1,
    kMgmtAgents = 2,
    kShellTools = 3,
    kGuestRuntime = 5,
    kNetServices = 6,
    kStorageTools = 8,
    kPluginSandbox = 11,
};

struct ThreadSeed {
    const char* name;
    int state;
    int type;
};

struct CartelSeed {
    const char* commandLine;
    int parent;       // index of the parent cartel, -1 for none
    bool newSession;  // the cartel leads its own session (a login)
    int domain;
    std::vector<ThreadSeed> worlds;  // the first is the cartel's leader
};

// Daemons started by init, a guest with its virtual CPUs, and one login session that is
// running the management tool.
const std::vector<CartelSeed>& Cartels() {
    static const std::vector<CartelSeed> cartels = {
        {"/sbin/init", -1, true, kHostDaemons, {{"init", kSleeping, kUser}}},
        {"/sbin/kmsgd --foreground",
         0,
         false,
         kHostDaemons,
         {{"kmsgd", kWaiting, kUser}, {"kmsgd-writer", kWaiting, kUser}}},
        {"/sbin/clockd -c /etc/clockd.conf -g",
         0,
         false,
         kNetServices,
         {{"clockd", kSleeping, kUser}}},
        {"/usr/lib/brix/bin/devwatchd", 0, false, kStorageTools, {{"devwatchd", kWaiting, kUser}}},
        {"/usr/lib/brix/bin/netcfgd --persist /etc/ostrel/netcfg.db",
         0,
         false,
         kNetServices,
         {{"netcfgd", kWaiting, kUser}}},
        {"/usr/lib/brix/bin/storsvcd",
         0,
         false,
         kStorageTools,
         {{"storsvcd", kWaiting, kUser}, {"storsvcd-scan", kSleeping, kUser}}},
        {"/usr/lib/brix/hostagent/bin/hostagentd -f /etc/ostrel/hostagent.cfg",
         0,
         false,
         kMgmtAgents,
         {{"hostagentd", kWaiting, kUser},
          {"hostagentd-rpc", kWaiting, kUser},
          {"hostagentd-io", kWaiting, kUser},
          {"hostagentd-poll", kSleeping, kUser}}},
        {"/usr/lib/brix/bin/snmpd", 0, false, kMgmtAgents, {{"snmpd", kWaiting, kUser}}},
        {"/usr/lib/brix/bin/slpd -p /var/run/slpd.pid",
         0,
         false,
         kNetServices,
         {{"slpd", kWaiting, kUser}}},
        {"/usr/lib/brix/wbem/bin/wbemd -c /etc/ostrel/wbem.conf",
         0,
         false,
         kMgmtAgents,
         {{"wbemd", kWaiting, kUser}, {"wbemd-provider", kWaiting, kUser}}},
        {"/usr/lib/brix/bin/guestmond --interval 20",
         0,
         false,
         kGuestRuntime,
         {{"guestmond", kSleeping, kUser}}},
        {"/usr/lib/brix/bin/plugind --sandbox /var/run/plugind",
         0,
         false,
         kPluginSandbox,
         {{"plugind", kWaiting, kUser}}},
        {"/bin/brixvm -c /volumes/datastore1/web01/web01.bvm",
         0,
         false,
         kGuestRuntime,
         {{"brixvm-web01", kWaiting, kUser},
          {"brixvm-web01-vcpu-0", kRunning, kVcpu},
          {"brixvm-web01-vcpu-1", kReady, kVcpu},
          {"brixvm-web01-console", kWaiting, kUser}}},
        {"/usr/lib/brix/bin/kconsole tty2", 0, true, kShellTools, {{"kconsole", kWaiting, kUser}}},
        {"/usr/sbin/sshd -f /etc/ssh/sshd_config",
         0,
         false,
         kNetServices,
         {{"sshd", kWaiting, kUser}}},
        {"sshd: admin@pts/0", 14, true, kNetServices, {{"sshd", kWaiting, kUser}}},
        {"-sh", 15, false, kShellTools, {{"sh", kWaiting, kUser}}},
        {"brixcli system process list", 16, false, kShellTools, {{"brixcli", kRunning, kUser}}},
    };
    return cartels;
}

void Seed(Store& store) {
    auto insert =
        store.Prepare("INSERT INTO process_worlds VALUES (?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?)");
    struct Placed {
        int64_t cartel, group, session;
    };
    std::vector<Placed> placed;
    int64_t nextWorld = 2098190;
    for (const auto& cartel : Cartels()) {
        // Each cartel id is taken just before its leader's world id; ids of later cartels
        // skip the ones used by short-lived start-up helpers.
        const int64_t cartelId = nextWorld - 1;
        const int64_t leader = nextWorld;
        Placed self{cartelId, cartelId, cartelId};
        int64_t parentCartel = 0;
        if (cartel.parent >= 0) {
            const Placed& parent = placed[static_cast<size_t>(cartel.parent)];
            parentCartel = parent.cartel;
            // Daemons started by init lead their own cartel groups; children of a login
            // share their parent's group and session.
            if (cartel.parent != 0 && !cartel.newSession) self.group = parent.group;
            if (!cartel.newSession) self.session = parent.session;
        }
        for (size_t i = 0; i < cartel.worlds.size(); ++i) {
            const ThreadSeed& world = cartel.worlds[i];
            int64_t flags = kFlagUser;
            if (i == 0) flags |= kFlagLeader;
            if (world.type == kVcpu) flags |= kFlagVcpu;
            insert.Bind(1, nextWorld)
                .Bind(2, world.name)
                .Bind(3, cartel.commandLine)
                .Bind(4, cartelId)
                .Bind(5, parentCartel)
                .Bind(6, leader)
                .Bind(7, self.group)
                .Bind(8, self.session)
                .Bind(9, flags)
                .Bind(10, world.state)
                .Bind(11, world.type)
                .Bind(12, cartel.domain)
                .Run();
            insert.Reset();
            ++nextWorld;
        }
        placed.push_back(self);
        nextWorld += 3 + static_cast<int64_t>(placed.size() % 4) * 7;
    }
}

// Load-test worlds: one-world cartels of a job runner started by init, numbered on from the
// highest world id.
void GrowWorlds(Store& store, int64_t count) {
    auto existing = store.Prepare(
        "SELECT COUNT(*), MAX(id), (SELECT cartel_id FROM process_worlds ORDER BY id LIMIT 1),"
        " (SELECT session_id FROM process_worlds ORDER BY id LIMIT 1) FROM process_worlds");
    existing.Step();
    const int64_t initCartel = existing.Int(2);
    const int64_t initSession = existing.Int(3);
    int64_t nextId = existing.Int(1) + 1;
    auto insert =
        store.Prepare("INSERT INTO process_worlds VALUES (?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?)");
    for (int64_t slot = existing.Int(0); slot < count; ++slot) {
        const int64_t cartelId = nextId;
        const int64_t worldId = nextId + 1;
        const std::string number = std::to_string(slot);
        insert.Bind(1, worldId)
            .Bind(2, "jobrunner-" + number)
            .Bind(3, "/usr/lib/brix/bin/jobrunner --slot " + number)
            .Bind(4, cartelId)
            .Bind(5, initCartel)
            .Bind(6, worldId)
            .Bind(7, cartelId)
            .Bind(8, initSession)
            .Bind(9, kFlagUser | kFlagLeader)
            .Bind(10, slot % 7 == 0 ? kRunning : kWaiting)
            .Bind(11, kUser)
            .Bind(12, kShellTools)
            .Run();
        insert.Reset();
        nextId += 2;
    }
}

// The columns of a world's record, in the order GetWorld writes them.
constexpr const char* kWorldColumns =
    "id, cartel_id, parent_cartel_id, world_group_id, cartel_group_id, session_id, flags, state,"
    " type, domain, name, command_line";

struct WorldRow {
    uint32_t id, cartel, parentCartel, worldGroup, cartelGroup, session, flags;
    uint8_t state, type;
    uint32_t domain;
    std::string name, commandLine;
};

WorldRow ReadRow(const BrixSim::Stmt& row) {
    auto u32 = [&](int column) { return static_cast<uint32_t>(row.Int(column)); };
    return {u32(0),
            u32(1),
            u32(2),
            u32(3),
            u32(4),
            u32(5),
            u32(6),
            static_cast<uint8_t>(row.Int(7)),
            static_cast<uint8_t>(row.Int(8)),
            u32(9),
            row.Text(10),
            row.Text(11)};
}

// Inside one read transaction the listing reads every record in the same pass, and the record
// asked for while its name is being handed out comes from it: a listing of many worlds then
// costs one query, not one a world, and holds one record at a time.
struct ListedWorld {
    uint64_t snapshot = 0;
    std::string name;
    std::optional<WorldRow> row;
};
ListedWorld& Listed() {
    static ListedWorld listed;
    return listed;
}

void EachWorld(const std::vector<std::string>& instancePath,
               const std::function<void(const std::string&)>& name) {
    if (!instancePath.empty()) return;
    Store& store = Store::Get();
    ListedWorld& listed = Listed();
    const uint64_t snapshot = store.ReadSnapshot();
    if (snapshot == 0) {
        auto rows = store.Prepare("SELECT id FROM process_worlds ORDER BY id");
        while (rows.Step()) name(std::to_string(rows.Int(0)));
        return;
    }
    struct Forget {
        ListedWorld& listed;
        ~Forget() { listed.row.reset(); }
    } forget{listed};
    auto rows =
        store.Prepare(std::string("SELECT ") + kWorldColumns + " FROM process_worlds ORDER BY id");
    while (rows.Step()) {
        listed.snapshot = snapshot;
        listed.row = ReadRow(rows);
        listed.name = std::to_string(listed.row->id);
        name(listed.name);
    }
}

void GetWorld(const std::vector<std::string>& instancePath, void* buffer, size_t size) {
    namespace R = KernCtl::Ksi::WorldRecord;
    BrixSim::Ksi::RequireSize("system.worlds.info", size, R::kSize);
    if (instancePath.size() != 1) {
        throw HostCtl::Lib::HostCtlException("Sysinfo node system.worlds.info: no world selected");
    }
    const std::string& name = instancePath[0];
    ListedWorld& listed = Listed();
    std::optional<WorldRow> world;
    if (listed.row && listed.snapshot == Store::Get().ReadSnapshot() && listed.name == name) {
        world = std::move(listed.row);
        listed.row.reset();
    }
    if (!world) {
        int64_t id = 0;
        const auto parsed = std::from_chars(name.data(), name.data() + name.size(), id);
        const bool wellFormed = parsed.ec == std::errc() && parsed.ptr == name.data() + name.size();
        auto row = Store::Get().Prepare(std::string("SELECT ") + kWorldColumns +
                                        " FROM process_worlds WHERE id = ?");
        row.Bind(1, id);
        if (wellFormed && row.Step()) world = ReadRow(row);
    }
    if (!world)
        throw HostCtl::Lib::HostCtlException("World " + CmdKit::MessageExcerpt(instancePath[0]) +
                                             " not found");
    BrixSim::Ksi::RecordWriter record(buffer, size);
    record.U32(R::kId, world->id);
    record.U32(R::kCartelId, world->cartel);
    record.U32(R::kParentCartelId, world->parentCartel);
    record.U32(R::kWorldGroupId, world->worldGroup);
    record.U32(R::kCartelGroupId, world->cartelGroup);
    record.U32(R::kSessionId, world->session);
    record.U32(R::kFlags, world->flags);
    record.U8(R::kState, world->state);
    record.U8(R::kType, world->type);
    record.U32(R::kDomain, world->domain);
    record.Text(R::kName, R::kNameWidth, world->name);
    record.Text(R::kCommandLine, R::kCommandLineWidth, world->commandLine);
}

const bool registered = [] {
    BrixSim::RegisterSysinfoNode(
        KSI_NODE_system_worlds,
        {[](const std::vector<std::string>&, void*, size_t) {
             throw HostCtl::Lib::HostCtlException("Sysinfo node system.worlds has no record");
         },
         EachWorld});
    BrixSim::RegisterScaleKey("worlds", {"user-level worlds", GrowWorlds});
    BrixSim::RegisterSysinfoNode(KSI_NODE_system_worlds_info,
                                 {GetWorld, [](const std::vector<std::string>&,
                                               const std::function<void(const std::string&)>&) {}});
    return BrixSim::RegisterTables({
        "process",
        "CREATE TABLE IF NOT EXISTS process_worlds ("
        " id INTEGER PRIMARY KEY CHECK (id BETWEEN 1 AND 4294967295),"
        " name TEXT NOT NULL,"
        " command_line TEXT NOT NULL,"
        " cartel_id INTEGER NOT NULL CHECK (cartel_id BETWEEN 0 AND 4294967295),"
        " parent_cartel_id INTEGER NOT NULL CHECK (parent_cartel_id BETWEEN 0 AND 4294967295),"
        " world_group_id INTEGER NOT NULL CHECK (world_group_id BETWEEN 0 AND 4294967295),"
        " cartel_group_id INTEGER NOT NULL CHECK (cartel_group_id BETWEEN 0 AND 4294967295),"
        " session_id INTEGER NOT NULL CHECK (session_id BETWEEN 0 AND 4294967295),"
        " flags INTEGER NOT NULL CHECK (flags BETWEEN 0 AND 4294967295),"
        " state INTEGER NOT NULL CHECK (state BETWEEN 0 AND 255),"  // kernel state code
        " type INTEGER NOT NULL CHECK (type BETWEEN 0 AND 255),"    // kernel world type code
        " domain INTEGER NOT NULL CHECK (domain BETWEEN 0 AND 4294967295));",  // secpolicy slot
        Seed,
    });
}();

}  // namespace

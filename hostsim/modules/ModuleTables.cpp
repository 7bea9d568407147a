// The kernel's loadable modules: drivers and kernel extensions with their metadata, aliases,
// declared parameters, configured parameter strings and log levels.
#include <cstdint>
#include <initializer_list>
#include <string>

#include "hostsim/core/Hooks.h"
#include "hostsim/core/Store.h"

namespace {

struct Requirement {
    const char* name;
    const char* versions;  // comma-separated
};

struct ModuleSeed {
    const char* name;
    const char* license;
    const char* version;
    const char* buildType;
    const char* fileVersion;
    const char* provides;
    const char* providesVersions;
    const char* package;
    const char* acceptance;
    bool loaded;
    bool enabled;
    std::initializer_list<Requirement> needs;
};

constexpr char kBase[] = "brix-base";
constexpr char kInbox[] = "brix-inbox-drivers";
constexpr char kCertified[] = "BrixCertified";

// In the order the kernel reports them.
const ModuleSeed kModules[] = {
    {"kapi_base",
     "Ostrel",
     "2.1.0",
     "release",
     "2.1.0-8.0.412",
     "ostrel.kapi.base",
     "2.0,2.1",
     kBase,
     kCertified,
     true,
     true,
     {}},
    {"kapi_storage",
     "Ostrel",
     "1.5.2",
     "release",
     "1.5.2-8.0.412",
     "ostrel.kapi.storage",
     "1.4,1.5",
     kBase,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.base", "2.0"}}},
    {"kapi_net",
     "Ostrel",
     "3.0.4",
     "release",
     "3.0.4-8.0.412",
     "ostrel.kapi.net",
     "3.0",
     kBase,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.base", "2.1"}}},
    {"kapi_usb",
     "Ostrel",
     "1.0.9",
     "release",
     "1.0.9-8.0.412",
     "ostrel.kapi.usb",
     "1.0",
     kBase,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.base", "2.0"}}},
    {"heapmon",
     "Ostrel",
     "1.2.0",
     "release",
     "1.2.0-8.0.412",
     "ostrel.heapmon",
     "",
     kBase,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.base", "2.0"}}},
    {"quillfs_drv",
     "Ostrel",
     "1.0.7",
     "release",
     "1.0.7-8.0.412",
     "ostrel.fs.quill",
     "1.0",
     kBase,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.base", "2.1"}, {"ostrel.kapi.storage", "1.4,1.5"}}},
    {"dsfs3",
     "Ostrel",
     "3.4.1",
     "release",
     "3.4.1-8.0.412",
     "ostrel.fs.dsfs",
     "3.0",
     kBase,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.base", "2.1"}, {"ostrel.kapi.storage", "1.5"}}},
    {"netdump_client",
     "Ostrel",
     "1.1.3",
     "release",
     "1.1.3-8.0.412",
     "ostrel.netdump",
     "1.1",
     kBase,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.net", "3.0"}}},
    {"agentlink",
     "Ostrel",
     "1.0.2",
     "release",
     "1.0.2-8.0.412",
     "ostrel.agentlink",
     "1.0",
     kBase,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.base", "2.0"}}},
    {"iofilter_core",
     "Ostrel",
     "1.2.5",
     "release",
     "1.2.5-8.0.412",
     "ostrel.iofilter",
     "1.2",
     kBase,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.storage", "1.5"}}},
    {"crypto_fips",
     "Ostrel",
     "4.0.1",
     "release",
     "4.0.1-8.0.412",
     "ostrel.crypto",
     "4.0",
     kBase,
     kCertified,
     true,
     false,
     {{"ostrel.kapi.base", "2.1"}}},
    {"cpu_hotplug",
     "Ostrel",
     "1.0.0",
     "release",
     "1.0.0-8.0.412",
     "ostrel.cpu.hotplug",
     "1.0",
     kBase,
     kCertified,
     false,
     true,
     {{"ostrel.kapi.base", "2.1"}}},
    {"watchdog_hw",
     "Ostrel",
     "1.0.3",
     "release",
     "1.0.3-8.0.412",
     "ostrel.watchdog",
     "1.0",
     kBase,
     kCertified,
     false,
     true,
     {{"ostrel.kapi.base", "2.0"}}},
    {"trace_buffer",
     "Ostrel",
     "2.2.0",
     "debug",
     "2.2.0-8.0.412dbg",
     "ostrel.trace",
     "2.2",
     "brix-debug-tools",
     kCertified,
     false,
     false,
     {{"ostrel.kapi.base", "2.1"}}},
    {"fault_inject",
     "Ostrel",
     "0.9.1",
     "beta",
     "0.9.1-8.0.400beta",
     "ostrel.faultinj",
     "0.9",
     "brix-debug-tools",
     kCertified,
     false,
     false,
     {{"ostrel.kapi.base", "2.1"}}},
    {"ahci_lite",
     "Ostrel",
     "1.0.14",
     "release",
     "1.0.14-3brix.800.0.412",
     "brix.ahci",
     "1.0",
     kInbox,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.storage", "1.4"}}},
    {"nvme_core",
     "Ostrel",
     "1.4.2",
     "release",
     "1.4.2-5brix.800.0.412",
     "brix.nvme",
     "1.3,1.4",
     kInbox,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.storage", "1.5"}}},
    {"usb_xhci",
     "Ostrel",
     "1.0.6",
     "release",
     "1.0.6-2brix.800.0.412",
     "brix.xhci",
     "1.0",
     kInbox,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.usb", "1.0"}}},
    {"usb_storage",
     "Ostrel",
     "1.1.0",
     "release",
     "1.1.0-2brix.800.0.412",
     "brix.usbstor",
     "1.1",
     kInbox,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.usb", "1.0"}, {"ostrel.kapi.storage", "1.4"}}},
    {"pvnet",
     "Ostrel",
     "2.3.1",
     "release",
     "2.3.1-1brix.800.0.412",
     "brix.pvnet",
     "2.3",
     kInbox,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.net", "3.0"}}},
    {"pvscsi_lite",
     "Ostrel",
     "1.6.0",
     "release",
     "1.6.0-1brix.800.0.412",
     "brix.pvscsi",
     "1.6",
     kInbox,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.storage", "1.5"}}},
    {"e1k_compat",
     "GPLv2",
     "8.0.3",
     "release",
     "8.0.3-4brix.800.0.412",
     "brix.e1k",
     "",
     kInbox,
     kCertified,
     false,
     true,
     {{"ostrel.kapi.net", "3.0"}}},
    {"ipmi_si",
     "GPLv2",
     "2.0.11",
     "release",
     "2.0.11-1brix.800.0.412",
     "brix.ipmi",
     "2.0",
     kInbox,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.base", "2.0"}}},
    {"serial_8250",
     "GPLv2",
     "1.9.2",
     "release",
     "1.9.2-1brix.800.0.412",
     "brix.serial",
     "1.9",
     kInbox,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.base", "2.0"}}},
    {"kbd_console",
     "Ostrel",
     "1.0.4",
     "release",
     "1.0.4-1brix.800.0.412",
     "brix.kbd",
     "1.0",
     kInbox,
     kCertified,
     true,
     true,
     {{"ostrel.kapi.usb", "1.0"}}},
    {"ps2_input",
     "GPLv2",
     "1.0.1",
     "release",
     "1.0.1-1brix.800.0.412",
     "brix.ps2",
     "1.0",
     kInbox,
     kCertified,
     false,
     true,
     {{"ostrel.kapi.base", "2.0"}}},
    {"tpm2_drv",
     "Ostrel",
     "2.0.5",
     "release",
     "2.0.5-1brix.800.0.412",
     "brix.tpm",
     "2.0",
     kInbox,
     kCertified,
     false,
     false,
     {{"ostrel.kapi.base", "2.1"}}},
    {"qln_nic10g",
     "BSD",
     "1.3.22",
     "release",
     "1.3.22.0-1qln.800.0.300",
     "qln.nic10g",
     "1.3",
     "qln-net-drivers",
     "PartnerSupported",
     true,
     true,
     {{"ostrel.kapi.net", "3.0"}, {"ostrel.kapi.base", "2.0"}}},
    {"qln_nic25g",
     "BSD",
     "2.0.8",
     "release",
     "2.0.8.0-1qln.800.0.300",
     "qln.nic25g",
     "2.0",
     "qln-net-drivers",
     "PartnerSupported",
     false,
     true,
     {{"ostrel.kapi.net", "3.0"}}},
    {"qln_rdma",
     "BSD",
     "2.0.8",
     "release",
     "2.0.8.0-1qln.800.0.300",
     "qln.rdma",
     "2.0",
     "qln-net-drivers",
     "PartnerSupported",
     false,
     false,
     {{"ostrel.kapi.net", "3.0"}, {"qln.nic25g", "2.0"}}},
    {"hvs_sas12",
     "GPLv2",
     "12.1.4",
     "release",
     "12.1.4.0-2hvs.800.0.280",
     "hvs.sas",
     "12.1",
     "halvorsen-hba",
     "PartnerAccepted",
     true,
     true,
     {{"ostrel.kapi.storage", "1.4"}}},
    {"hvs_fcoe",
     "GPLv2",
     "5.2.0",
     "release",
     "5.2.0.0-2hvs.800.0.280",
     "hvs.fcoe",
     "5.2",
     "halvorsen-hba",
     "PartnerAccepted",
     false,
     true,
     {{"ostrel.kapi.storage", "1.5"}, {"ostrel.kapi.net", "3.0"}}},
    {"hvs_nvme_tcp",
     "GPLv2",
     "1.0.2",
     "release",
     "1.0.2.0-2hvs.800.0.280",
     "hvs.nvmetcp",
     "1.0",
     "halvorsen-hba",
     "PartnerAccepted",
     false,
     false,
     {{"ostrel.kapi.storage", "1.5"}, {"ostrel.kapi.net", "3.0"}}},
    {"klv_multipath",
     "BSD",
     "4.1.0",
     "release",
     "4.1.0-1klv.800.0.150",
     "klv.mpath",
     "4.1",
     "kelvra-storage",
     "PartnerSupported",
     true,
     true,
     {{"ostrel.kapi.storage", "1.5"}}},
    {"klv_nvmeof",
     "BSD",
     "4.1.0",
     "release",
     "4.1.0-1klv.800.0.150",
     "klv.nvmeof",
     "4.1",
     "kelvra-storage",
     "PartnerSupported",
     false,
     true,
     {{"brix.nvme", "1.4"}, {"ostrel.kapi.net", "3.0"}}},
    {"mrw_fan_ctl",
     "MIT",
     "0.4.2",
     "release",
     "0.4.2-1mrw.800",
     "mrw.fanctl",
     "0.4",
     "marrow-hwmon",
     "CommunitySupported",
     true,
     true,
     {{"brix.ipmi", "2.0"}}},
    {"mrw_gpu_passthru",
     "MIT",
     "0.7.0",
     "beta",
     "0.7.0-0mrw.800beta",
     "mrw.gpu",
     "0.7",
     "marrow-hwmon",
     "CommunitySupported",
     false,
     false,
     {{"ostrel.kapi.base", "2.1"}}},
};

struct Alias {
    const char* alias;
    const char* module;
};
const Alias kAliases[] = {
    {"qlnic", "qln_nic10g"},  {"ahci", "ahci_lite"}, {"nvme", "nvme_core"},
    {"hvs_sas", "hvs_sas12"}, {"xhci", "usb_xhci"},  {"fips", "crypto_fips"},
};

struct Param {
    const char* module;
    const char* name;
    const char* type;
    const char* description;
};
const Param kParams[] = {
    {"qln_nic10g", "rss_queues", "int", "Number of receive-side scaling queues per port (1-16)"},
    {"qln_nic10g", "mtu_max", "uint", "Largest MTU the ports accept"},
    {"qln_nic10g", "link_flap_guard", "bool", "Hold a flapping link down for 30 seconds"},
    {"qln_nic10g", "debug_mask", "uint", "Bit mask of debug message classes"},
    {"qln_nic25g", "rss_queues", "int", "Number of receive-side scaling queues per port (1-32)"},
    {"qln_nic25g", "debug_mask", "uint", "Bit mask of debug message classes"},
    {"nvme_core", "io_queues", "int", "I/O queue pairs per controller"},
    {"nvme_core", "poll_mode", "bool", "Poll completion queues instead of using interrupts"},
    {"nvme_core", "admin_timeout_ms", "uint", "Timeout of admin commands in milliseconds"},
    {"hvs_sas12", "queue_depth", "int", "Commands outstanding per device"},
    {"hvs_sas12", "log_verbosity", "int", "Driver log verbosity (0-5)"},
    {"hvs_sas12", "fw_check", "bool", "Refuse adapters with firmware older than 12.0"},
    {"hvs_fcoe", "queue_depth", "int", "Commands outstanding per device"},
    {"usb_storage", "quirks", "charp", "Device quirks as vendor:product:flags, comma-separated"},
    {"ipmi_si", "kcs_port", "uint", "I/O port of the KCS interface"},
    {"ipmi_si", "trydefaults", "bool", "Probe the default interface addresses"},
    {"serial_8250", "baud", "uint", "Line speed of the console port"},
    {"serial_8250", "ports", "charp", "Ports to claim, blank-separated"},
    {"heapmon", "sample_rate", "int", "Allocations between two heap samples"},
    {"dsfs3", "lock_timeout", "int", "Seconds to wait for an on-disk lock"},
    {"dsfs3", "journal_mb", "int", "Journal size in megabytes for new volumes"},
    {"klv_multipath", "path_policy", "charp", "Default path selection policy"},
    {"klv_multipath", "failover_ms", "uint", "Delay before a path failover in milliseconds"},
};

struct Options {
    const char* module;
    const char* options;
};
const Options kOptions[] = {
    {"qln_nic10g", "rss_queues=8 debug_mask=0x0"},
    {"hvs_sas12", "queue_depth=128 legacy_irq=1"},
    {"nvme_core", "poll_mode=1"},
    {"serial_8250", "ports=\"com1 com2\" baud=115200"},
    {"klv_multipath", "path_policy=round_robin"},
};

struct Level {
    const char* owner;  // "" for the kernel core
    const char* name;
    int defaultLevel;
    int currentLevel;
};
const Level kLevels[] = {
    {"", "Init", 1, 1},
    {"", "Timer", 0, 0},
    {"", "Sched", 0, 0},
    {"", "Heap", 0, 0},
    {"", "Mem", 0, 0},
    {"", "Irq", 0, 0},
    {"", "Acpi", 0, 0},
    {"", "Storage", 0, 0},
    {"", "ScsiPath", 1, 2},
    {"", "Net", 0, 0},
    {"", "TcpIp", 0, 0},
    {"", "Dump", 0, 0},
    {"", "Usb", 0, 0},
    {"", "Wdog", 0, 0},
    {"qln_nic10g", "qln_nic10g", 0, 0},
    {"qln_nic10g", "qln_nic10gDbg", 0, 0},
    {"nvme_core", "nvme", 0, 0},
    {"hvs_sas12", "hvs_sas", 1, 1},
    {"dsfs3", "dsfs", 0, 0},
    {"dsfs3", "dsfsLock", 0, 0},
    {"quillfs_drv", "quillfs", 0, 0},
};

void Seed(BrixSim::Store& store) {
    store.Write([&] {
        auto module = store.Prepare(
            "INSERT INTO modules (name, seq, file, license, version, build_type, file_version,"
            " provides, provides_versions, package, acceptance, loaded, enabled)"
            " VALUES (?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?)");
        auto requirement = store.Prepare(
            "INSERT INTO module_requires (module, seq, namespace, versions) VALUES (?, ?, ?, ?)");
        int64_t seq = 0;
        for (const auto& m : kModules) {
            const std::string file = std::string("/usr/lib/brix/kmod/") + m.name;
            module.Bind(1, m.name).Bind(2, ++seq).Bind(3, file);
            module.Bind(4, m.license)
                .Bind(5, m.version)
                .Bind(6, m.buildType)
                .Bind(7, m.fileVersion);
            module.Bind(8, m.provides).Bind(9, m.providesVersions).Bind(10, m.package);
            module.Bind(11, m.acceptance).Bind(12, m.loaded).Bind(13, m.enabled).Run();
            module.Reset();
            int64_t index = 0;
            for (const auto& r : m.needs) {
                requirement.Bind(1, m.name)
                    .Bind(2, ++index)
                    .Bind(3, r.name)
                    .Bind(4, r.versions)
                    .Run();
                requirement.Reset();
            }
        }

        auto alias = store.Prepare("INSERT INTO module_aliases (alias, module) VALUES (?, ?)");
        for (const auto& a : kAliases) {
            alias.Bind(1, a.alias).Bind(2, a.module).Run();
            alias.Reset();
        }

        auto param = store.Prepare(
            "INSERT INTO module_params (module, seq, name, type, description)"
            " VALUES (?, ?, ?, ?, ?)");
        seq = 0;
        for (const auto& p : kParams) {
            param.Bind(1, p.module).Bind(2, ++seq).Bind(3, p.name).Bind(4, p.type);
            param.Bind(5, p.description).Run();
            param.Reset();
        }

        auto options = store.Prepare("INSERT INTO module_options (name, options) VALUES (?, ?)");
        for (const auto& o : kOptions) {
            options.Bind(1, o.module).Bind(2, o.options).Run();
            options.Reset();
        }

        auto level = store.Prepare(
            "INSERT INTO log_levels (owner, seq, name, default_level, current_level, boot)"
            " VALUES (?, ?, ?, ?, ?, 0)");
        seq = 0;
        for (const auto& l : kLevels) {
            level.Bind(1, l.owner).Bind(2, ++seq).Bind(3, l.name).Bind(4, l.defaultLevel);
            level.Bind(5, l.currentLevel).Run();
            level.Reset();
        }
    });
}

// Load-test modules: inbox drivers without requirements after the seeded ones; every other one
// is loaded.
void GrowModules(BrixSim::Store& store, int64_t count) {
    auto existing = store.Prepare("SELECT COUNT(*), MAX(seq) FROM modules");
    existing.Step();
    int64_t seq = existing.Int(1);
    auto module = store.Prepare(
        "INSERT INTO modules (name, seq, file, license, version, build_type, file_version,"
        " provides, provides_versions, package, acceptance, loaded, enabled)"
        " VALUES (?, ?, ?, 'Ostrel', '1.0.0', 'release', '1.0.0-8.0.412', '', '', ?, ?, ?, 1)");
    for (int64_t index = 0, have = existing.Int(0); have < count; ++index, ++have) {
        const std::string name = "loadtest_" + std::to_string(index);
        module.Bind(1, name).Bind(2, ++seq).Bind(3, "/usr/lib/brix/kmod/" + name);
        module.Bind(4, kInbox).Bind(5, kCertified).Bind(6, index % 2 == 0).Run();
        module.Reset();
    }
}

const bool scalable = BrixSim::RegisterScaleKey("modules", {"kernel modules", GrowModules});

const bool registered = BrixSim::RegisterTables({
    "modules",
    "CREATE TABLE IF NOT EXISTS modules ("
    " name TEXT PRIMARY KEY,"
    " seq INTEGER NOT NULL UNIQUE,"  // the kernel's order
    " file TEXT NOT NULL, license TEXT NOT NULL, version TEXT NOT NULL,"
    " build_type TEXT NOT NULL, file_version TEXT NOT NULL,"
    " provides TEXT NOT NULL,"           // the provided namespace
    " provides_versions TEXT NOT NULL,"  // its versions, comma-separated
    " package TEXT NOT NULL, acceptance TEXT NOT NULL,"
    " loaded INTEGER NOT NULL, enabled INTEGER NOT NULL);"
    "CREATE TABLE IF NOT EXISTS module_requires ("
    " module TEXT NOT NULL, seq INTEGER NOT NULL, namespace TEXT NOT NULL,"
    " versions TEXT NOT NULL,"  // comma-separated
    " PRIMARY KEY (module, seq));"
    "CREATE TABLE IF NOT EXISTS module_aliases ("
    " alias TEXT PRIMARY KEY, module TEXT NOT NULL);"
    "CREATE TABLE IF NOT EXISTS module_params ("
    " module TEXT NOT NULL, seq INTEGER NOT NULL, name TEXT NOT NULL, type TEXT NOT NULL,"
    " description TEXT NOT NULL, PRIMARY KEY (module, seq));"
    // Configured parameter strings by module name; a forced name need not be a module.
    "CREATE TABLE IF NOT EXISTS module_options ("
    " name TEXT PRIMARY KEY, options TEXT NOT NULL);"
    // Log levels of the core (owner '') and of modules. The current level holds for the boot
    // it was set in; in a later boot the default holds.
    "CREATE TABLE IF NOT EXISTS log_levels ("
    " owner TEXT NOT NULL, seq INTEGER NOT NULL, name TEXT NOT NULL,"
    " default_level INTEGER NOT NULL, current_level INTEGER NOT NULL, boot INTEGER NOT NULL,"
    " PRIMARY KEY (owner, name));",
    Seed,
});

}  // namespace

// Builds the `system` branch of the command tree.
#include <memory>
#include <string>

#include "brixcli/SystemPlugin.h"
#include "cmdkit/AutoCli.h"
#include "hostbase/HostBase.h"
// --- identity ---
#include "identity/BootDeviceGet.h"
#include "identity/InstallTimeGet.h"
#include "identity/UuidGet.h"
#include "identity/VersionGet.h"
#include "identity/WelcomeMessageGet.h"
#include "identity/WelcomeMessageSet.h"
// --- identity: host name, clock, maintenance, shutdown, secpolicy ---

// --- coredump ---

// --- modules ---

// --- settings ---

// --- process ---

// --- memfs ---

// --- agents: snmp ---

// --- agents: slp, wbem ---
#include "agents/SlpAgentSearch.h"
#include "agents/SlpAgentStats.h"
#include "agents/WbemAgentGet.h"
#include "agents/WbemAgentList.h"
#include "agents/WbemAgentProviderSet.h"
#include "agents/WbemAgentSet.h"

using CmdKit::AutoCli::Namespace;
using CmdKit::AutoCli::NamespaceNode;
using namespace OstrelCli::System;

namespace {

constexpr int kDornaFeature = 120;

std::shared_ptr<Namespace> MakeNamespace(const char* description) {
    auto node = Namespace::New();
    if (description != nullptr) node->SetDescription(description);
    return node;
}

}  // namespace

extern "C" __attribute__((visibility("default"))) void AutoCli_RegisterNamespaces(
    const std::shared_ptr<NamespaceNode>& root) {
    FeatureState_Init();

    auto system = root->SubNamespace("system");
    system->SetDescription(
        "BrixKernel system properties and commands for configuring properties of the kernel "
        "core system and related system services.");

    {
        auto boot = MakeNamespace(
            "Operations relating to host boot that allow manipulation of Brixkernel boot time "
            "configuration.");
        auto device = MakeNamespace("Display the system boot device");
        device->RegisterNamespaceNode(BootDeviceGet::New(), "get");
        boot->RegisterNamespaceNode(device, "device");
        system->RegisterNamespaceNode(boot, "boot");
    }
    {
        auto settings =
            MakeNamespace("Operations that allow viewing and manipulation of system settings.");
        auto kernel = MakeNamespace(
            "Operations that allow viewing and manipulation of system kernel settings.");
        // --- settings kernel commands ---
        settings->RegisterNamespaceNode(kernel, "kernel");
        auto advanced = MakeNamespace(
            "The advanced settings are a set of Brixkernel options that specific configuration "
            "settings to be modified. These options are typically in place for specific "
            "workarounds or debugging.");
        // --- settings advanced commands ---
        settings->RegisterNamespaceNode(advanced, "advanced");
        auto keyboard = MakeNamespace("Operations that relate to the keyboard");
        auto layout = MakeNamespace("Operations that relate to keyboard layout");
        // --- settings keyboard layout commands ---
        keyboard->RegisterNamespaceNode(layout, "layout");
        settings->RegisterNamespaceNode(keyboard, "keyboard");
        system->RegisterNamespaceNode(settings, "settings");
    }
    {
        auto module = MakeNamespace(
            "Operations that allow manipulation of the Brixkernel loadable modules and device "
            "drivers. Operations include load, list and setting options.");
        // --- module get ---
        auto parameters = MakeNamespace(
            "Operations that allow manipulation of parameters of Brixkernel loadable modules "
            "and device drivers. Operations include list and set options.");
        // --- module parameters commands ---
        module->RegisterNamespaceNode(parameters, "parameters");
        // --- module list, load, set ---
        system->RegisterNamespaceNode(module, "module");
    }
    {
        auto coredump =
            MakeNamespace("Operations pertaining to the Brixkernel Core dump configuration.");
        auto partition = MakeNamespace(
            "Operations pertaining to the Brixkernel Core dump configuration on Brixkernel "
            "Diagnostic partitions.");
        // --- coredump partition commands ---
        coredump->RegisterNamespaceNode(partition, "partition");
        auto network = MakeNamespace(
            "Operations pertaining to the Brixkernel Core dump configuration on network dump "
            "servers.");
        // --- coredump network commands ---
        coredump->RegisterNamespaceNode(network, "network");
        auto file = MakeNamespace(
            "Operations pertaining to the Brixkernel Core dump configuration on DSFS Files.");
        // --- coredump file commands ---
        coredump->RegisterNamespaceNode(file, "file");
        if (*FeatureList[kDornaFeature] != 0) {
            auto dorna = MakeNamespace(
                "Operations pertaining to the Brixkernel Core dump configuration on DORNA "
                "Objects.");
            // --- coredump dorna commands ---
            coredump->RegisterNamespaceNode(dorna, "dorna");
        }
        system->RegisterNamespaceNode(coredump, "coredump");
    }
    {
        auto secpolicy = MakeNamespace(
            "Options related to Brixkernel access control subsystem. These options are typically "
            "in place for specific workarounds or debugging. These commands should be used at "
            "the direction of Ostrel Support Engineers.");
        auto domain = MakeNamespace("Options related to Brixkernel access control security domains.");
        // --- secpolicy domain commands ---
        secpolicy->RegisterNamespaceNode(domain, "domain");
        system->RegisterNamespaceNode(secpolicy, "secpolicy");
    }
    {
        auto process = MakeNamespace("Commands relating to running processes.");
        // --- process list ---
        auto stats = MakeNamespace("Process related statistics");
        auto load = MakeNamespace("System load averages");
        // --- process stats load get ---
        stats->RegisterNamespaceNode(load, "load");
        auto running = MakeNamespace("Number of currently running worlds");
        // --- process stats running get ---
        stats->RegisterNamespaceNode(running, "running");
        process->RegisterNamespaceNode(stats, "stats");
        system->RegisterNamespaceNode(process, "process");
    }
    {
        auto welcome = MakeNamespace("Commands to get and set the welcome banner for KCON.");
        welcome->RegisterNamespaceNode(WelcomeMessageSet::New(), "set");
        welcome->RegisterNamespaceNode(WelcomeMessageGet::New(), "get");
        system->RegisterNamespaceNode(welcome, "welcomemsg");
    }
    {
        auto quillfs = MakeNamespace("Operations pertaining to the quillfs memory filesytem.");
        // --- quillfs get ---
        auto ramdisk = MakeNamespace("Operations pertaining to quillfs ramdisks.");
        // --- quillfs ramdisk commands ---
        quillfs->RegisterNamespaceNode(ramdisk, "ramdisk");
        auto tardisk = MakeNamespace("Operations pertaining to quillfs tardisks.");
        // --- quillfs tardisk commands ---
        quillfs->RegisterNamespaceNode(tardisk, "tardisk");
        system->RegisterNamespaceNode(quillfs, "quillfs");
    }
    {
        auto version = MakeNamespace("Commands to get version information.");
        version->RegisterNamespaceNode(VersionGet::New(), "get");
        system->RegisterNamespaceNode(version, "version");
    }
    {
        auto time = MakeNamespace("Commands to get and set system time.");
        // --- time commands ---
        system->RegisterNamespaceNode(time, "time");
    }
    {
        auto stats = MakeNamespace("Access to various system statistics");
        auto uptime = MakeNamespace("System uptime, in microseconds");
        // --- stats uptime get ---
        stats->RegisterNamespaceNode(uptime, "uptime");
        auto installtime =
            MakeNamespace("Commands to get information about software installation.");
        installtime->RegisterNamespaceNode(InstallTimeGet::New(), "get");
        stats->RegisterNamespaceNode(installtime, "installtime");
        system->RegisterNamespaceNode(stats, "stats");
    }
    {
        auto uuid = MakeNamespace("Get the system UUID");
        uuid->RegisterNamespaceNode(UuidGet::New(), "get");
        system->RegisterNamespaceNode(uuid, "uuid");
    }
    {
        auto hostname = MakeNamespace("Operations pertaining the network name of the Brix host.");
        // --- hostname commands ---
        system->RegisterNamespaceNode(hostname, "hostname");
    }
    {
        auto snmp =
            MakeNamespace("Commands pertaining to SNMPv1/v2c/v3 Agent configuration.");
        // --- snmp commands ---
        system->RegisterNamespaceNode(snmp, "snmp");
    }
    {
        auto slp = MakeNamespace("Commands pertaining to Service Location Protocol (SLP).");
        // --- slp search ---
        slp->RegisterNamespaceNode(SlpAgentSearch::New(), "search");
        auto stats = MakeNamespace("Get statistics for slpd.");
        // --- slp stats get ---
        stats->RegisterNamespaceNode(SlpAgentStats::New(), "get");
        slp->RegisterNamespaceNode(stats, "stats");
        system->RegisterNamespaceNode(slp, "slp");
    }
    {
        auto wbem = MakeNamespace(
            "Commands pertaining to WEB Based Enterprise Management (WBEM) Agent configuration.");
        // --- wbem set, get ---
        wbem->RegisterNamespaceNode(WbemAgentSet::New(), "set");
        wbem->RegisterNamespaceNode(WbemAgentGet::New(), "get");
        auto provider = MakeNamespace(nullptr);  // deliberately without a description
        // --- wbem provider commands ---
        provider->RegisterNamespaceNode(WbemAgentList::New(), "list");
        provider->RegisterNamespaceNode(WbemAgentProviderSet::New(), "set");
        wbem->RegisterNamespaceNode(provider, "provider");
        system->RegisterNamespaceNode(wbem, "wbem");
    }
    {
        auto shutdown = MakeNamespace("Command to shutdown the system.");
        // --- shutdown commands ---
        system->RegisterNamespaceNode(shutdown, "shutdown");
    }
    {
        auto maintenance = MakeNamespace("Command to manage the system's maintenance mode.");
        // --- maintenanceMode commands ---
        system->RegisterNamespaceNode(maintenance, "maintenanceMode");
    }
}

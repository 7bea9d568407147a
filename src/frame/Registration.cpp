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
#include "identity/HostnameGet.h"
#include "identity/HostnameSet.h"
#include "identity/MaintenanceModeGet.h"
#include "identity/MaintenanceModeSet.h"
#include "identity/SecpolicyDomainList.h"
#include "identity/SecpolicyDomainSet.h"
#include "identity/Shutdown.h"
#include "identity/TimeGetSystem.h"
#include "identity/TimeGetUptime.h"
#include "identity/TimeSetSystem.h"

// --- coredump ---
#include "coredump/KernelDumpDornaAdd.h"
#include "coredump/KernelDumpDornaGet.h"
#include "coredump/KernelDumpDornaList.h"
#include "coredump/KernelDumpDornaRemove.h"
#include "coredump/KernelDumpDornaSet.h"
#include "coredump/KernelDumpFileAdd.h"
#include "coredump/KernelDumpFileGet.h"
#include "coredump/KernelDumpFileList.h"
#include "coredump/KernelDumpFileRemove.h"
#include "coredump/KernelDumpFileSet.h"
#include "coredump/KernelDumpNetworkCheck.h"
#include "coredump/KernelDumpNetworkGet.h"
#include "coredump/KernelDumpNetworkSet.h"
#include "coredump/KernelDumpPartitionGet.h"
#include "coredump/KernelDumpPartitionList.h"
#include "coredump/KernelDumpPartitionSet.h"

// --- modules ---
#include "modules/ModuleGet.h"
#include "modules/ModuleList.h"
#include "modules/ModuleLoad.h"
#include "modules/ModuleParametersCopy.h"
#include "modules/ModuleParametersList.h"
#include "modules/ModuleParametersSet.h"
#include "modules/ModuleSet.h"

// --- settings ---
#include "settings/SettingsAdvancedList.h"
#include "settings/SettingsAdvancedSet.h"
#include "settings/SettingsKernelList.h"
#include "settings/SettingsKernelSet.h"
#include "settings/SettingsKeyboardLayoutGet.h"
#include "settings/SettingsKeyboardLayoutList.h"
#include "settings/SettingsKeyboardLayoutSet.h"

// --- process ---
#include "process/ProcessList.h"
#include "process/ProcessStatsLoadGet.h"
#include "process/ProcessStatsRunningGet.h"

// --- memfs ---
#include "memfs/QuillfsGet.h"
#include "memfs/QuillfsRamdiskAdd.h"
#include "memfs/QuillfsRamdiskList.h"
#include "memfs/QuillfsRamdiskRemove.h"
#include "memfs/QuillfsTardiskList.h"

// --- agents: snmp ---
#include "agents/SnmpAgentGet.h"
#include "agents/SnmpAgentHash.h"
#include "agents/SnmpAgentSet.h"
#include "agents/SnmpAgentTest.h"

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
        kernel->RegisterNamespaceNode(SettingsKernelList::New(), "list");
        kernel->RegisterNamespaceNode(SettingsKernelSet::New(), "set");
        settings->RegisterNamespaceNode(kernel, "kernel");
        auto advanced = MakeNamespace(
            "The advanced settings are a set of Brixkernel options that specific configuration "
            "settings to be modified. These options are typically in place for specific "
            "workarounds or debugging.");
        // --- settings advanced commands ---
        advanced->RegisterNamespaceNode(SettingsAdvancedList::New(), "list");
        advanced->RegisterNamespaceNode(SettingsAdvancedSet::New(), "set");
        settings->RegisterNamespaceNode(advanced, "advanced");
        auto keyboard = MakeNamespace("Operations that relate to the keyboard");
        auto layout = MakeNamespace("Operations that relate to keyboard layout");
        // --- settings keyboard layout commands ---
        layout->RegisterNamespaceNode(SettingsKeyboardLayoutGet::New(), "get");
        layout->RegisterNamespaceNode(SettingsKeyboardLayoutSet::New(), "set");
        layout->RegisterNamespaceNode(SettingsKeyboardLayoutList::New(), "list");
        keyboard->RegisterNamespaceNode(layout, "layout");
        settings->RegisterNamespaceNode(keyboard, "keyboard");
        system->RegisterNamespaceNode(settings, "settings");
    }
    {
        auto module = MakeNamespace(
            "Operations that allow manipulation of the Brixkernel loadable modules and device "
            "drivers. Operations include load, list and setting options.");
        // --- module get ---
        module->RegisterNamespaceNode(ModuleGet::New(), "get");
        auto parameters = MakeNamespace(
            "Operations that allow manipulation of parameters of Brixkernel loadable modules "
            "and device drivers. Operations include list and set options.");
        // --- module parameters commands ---
        parameters->RegisterNamespaceNode(ModuleParametersList::New(), "list");
        parameters->RegisterNamespaceNode(ModuleParametersSet::New(), "set");
        parameters->RegisterNamespaceNode(ModuleParametersCopy::New(), "copy");
        module->RegisterNamespaceNode(parameters, "parameters");
        // --- module list, load, set ---
        module->RegisterNamespaceNode(ModuleList::New(), "list");
        module->RegisterNamespaceNode(ModuleLoad::New(), "load");
        module->RegisterNamespaceNode(ModuleSet::New(), "set");
        system->RegisterNamespaceNode(module, "module");
    }
    {
        auto coredump =
            MakeNamespace("Operations pertaining to the Brixkernel Core dump configuration.");
        auto partition = MakeNamespace(
            "Operations pertaining to the Brixkernel Core dump configuration on Brixkernel "
            "Diagnostic partitions.");
        // --- coredump partition commands ---
        partition->RegisterNamespaceNode(KernelDumpPartitionGet::New(), "get");
        partition->RegisterNamespaceNode(KernelDumpPartitionList::New(), "list");
        partition->RegisterNamespaceNode(KernelDumpPartitionSet::New(), "set");
        coredump->RegisterNamespaceNode(partition, "partition");
        auto network = MakeNamespace(
            "Operations pertaining to the Brixkernel Core dump configuration on network dump "
            "servers.");
        // --- coredump network commands ---
        network->RegisterNamespaceNode(KernelDumpNetworkSet::New(), "set");
        network->RegisterNamespaceNode(KernelDumpNetworkGet::New(), "get");
        network->RegisterNamespaceNode(KernelDumpNetworkCheck::New(), "check");
        coredump->RegisterNamespaceNode(network, "network");
        auto file = MakeNamespace(
            "Operations pertaining to the Brixkernel Core dump configuration on DSFS Files.");
        // --- coredump file commands ---
        file->RegisterNamespaceNode(KernelDumpFileGet::New(), "get");
        file->RegisterNamespaceNode(KernelDumpFileSet::New(), "set");
        file->RegisterNamespaceNode(KernelDumpFileAdd::New(), "add");
        file->RegisterNamespaceNode(KernelDumpFileRemove::New(), "remove");
        file->RegisterNamespaceNode(KernelDumpFileList::New(), "list");
        coredump->RegisterNamespaceNode(file, "file");
        if (*FeatureList[kDornaFeature] != 0) {
            auto dorna = MakeNamespace(
                "Operations pertaining to the Brixkernel Core dump configuration on DORNA "
                "Objects.");
            // --- coredump dorna commands ---
            dorna->RegisterNamespaceNode(KernelDumpDornaGet::New(), "get");
            dorna->RegisterNamespaceNode(KernelDumpDornaSet::New(), "set");
            dorna->RegisterNamespaceNode(KernelDumpDornaAdd::New(), "add");
            dorna->RegisterNamespaceNode(KernelDumpDornaRemove::New(), "remove");
            dorna->RegisterNamespaceNode(KernelDumpDornaList::New(), "list");
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
        domain->RegisterNamespaceNode(SecpolicyDomainList::New(), "list");
        domain->RegisterNamespaceNode(SecpolicyDomainSet::New(), "set");
        secpolicy->RegisterNamespaceNode(domain, "domain");
        system->RegisterNamespaceNode(secpolicy, "secpolicy");
    }
    {
        auto process = MakeNamespace("Commands relating to running processes.");
        // --- process list ---
        process->RegisterNamespaceNode(ProcessList::New(), "list");
        auto stats = MakeNamespace("Process related statistics");
        auto load = MakeNamespace("System load averages");
        // --- process stats load get ---
        load->RegisterNamespaceNode(ProcessStatsLoadGet::New(), "get");
        stats->RegisterNamespaceNode(load, "load");
        auto running = MakeNamespace("Number of currently running worlds");
        // --- process stats running get ---
        running->RegisterNamespaceNode(ProcessStatsRunningGet::New(), "get");
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
        quillfs->RegisterNamespaceNode(QuillfsGet::New(), "get");
        auto ramdisk = MakeNamespace("Operations pertaining to quillfs ramdisks.");
        // --- quillfs ramdisk commands ---
        ramdisk->RegisterNamespaceNode(QuillfsRamdiskAdd::New(false), "add");
        ramdisk->RegisterNamespaceNode(QuillfsRamdiskList::New(), "list");
        ramdisk->RegisterNamespaceNode(QuillfsRamdiskRemove::New(), "remove");
        quillfs->RegisterNamespaceNode(ramdisk, "ramdisk");
        auto tardisk = MakeNamespace("Operations pertaining to quillfs tardisks.");
        // --- quillfs tardisk commands ---
        tardisk->RegisterNamespaceNode(QuillfsTardiskList::New(), "list");
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
        time->RegisterNamespaceNode(TimeGetSystem::New(), "get");
        time->RegisterNamespaceNode(TimeSetSystem::New(), "set");
        system->RegisterNamespaceNode(time, "time");
    }
    {
        auto stats = MakeNamespace("Access to various system statistics");
        auto uptime = MakeNamespace("System uptime, in microseconds");
        // --- stats uptime get ---
        uptime->RegisterNamespaceNode(TimeGetUptime::New(), "get");
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
        hostname->RegisterNamespaceNode(HostnameSet::New(), "set");
        hostname->RegisterNamespaceNode(HostnameGet::New(), "get");
        system->RegisterNamespaceNode(hostname, "hostname");
    }
    {
        auto snmp =
            MakeNamespace("Commands pertaining to SNMPv1/v2c/v3 Agent configuration.");
        // --- snmp commands ---
        snmp->RegisterNamespaceNode(SnmpAgentSet::New(), "set");
        snmp->RegisterNamespaceNode(SnmpAgentGet::New(), "get");
        snmp->RegisterNamespaceNode(SnmpAgentTest::New(), "test");
        snmp->RegisterNamespaceNode(SnmpAgentHash::New(), "hash");
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
        shutdown->RegisterNamespaceNode(Shutdown::New(SHUTDOWN_POWEROFF), "poweroff");
        shutdown->RegisterNamespaceNode(Shutdown::New(SHUTDOWN_REBOOT), "reboot");
        system->RegisterNamespaceNode(shutdown, "shutdown");
    }
    {
        auto maintenance = MakeNamespace("Command to manage the system's maintenance mode.");
        // --- maintenanceMode commands ---
        maintenance->RegisterNamespaceNode(MaintenanceModeSet::New(), "set");
        maintenance->RegisterNamespaceNode(MaintenanceModeGet::New(), "get");
        system->RegisterNamespaceNode(maintenance, "maintenanceMode");
    }
}

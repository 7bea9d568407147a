// Builds the `system` branch of the command tree from one table: every namespace with its
// description and every command with its class, depth-first, in the order the tool lists them.
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "agents/SlpAgentSearch.h"
#include "agents/SlpAgentStats.h"
#include "agents/SnmpAgentGet.h"
#include "agents/SnmpAgentHash.h"
#include "agents/SnmpAgentSet.h"
#include "agents/SnmpAgentTest.h"
#include "agents/WbemAgentGet.h"
#include "agents/WbemAgentList.h"
#include "agents/WbemAgentProviderSet.h"
#include "agents/WbemAgentSet.h"
#include "brixcli/SystemPlugin.h"
#include "cmdkit/AutoCli.h"
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
#include "hostbase/HostBase.h"
#include "identity/BootDeviceGet.h"
#include "identity/HostnameGet.h"
#include "identity/HostnameSet.h"
#include "identity/InstallTimeGet.h"
#include "identity/MaintenanceModeGet.h"
#include "identity/MaintenanceModeSet.h"
#include "identity/SecpolicyDomainList.h"
#include "identity/SecpolicyDomainSet.h"
#include "identity/Shutdown.h"
#include "identity/TimeGetSystem.h"
#include "identity/TimeGetUptime.h"
#include "identity/TimeSetSystem.h"
#include "identity/UuidGet.h"
#include "identity/VersionGet.h"
#include "identity/WelcomeMessageGet.h"
#include "identity/WelcomeMessageSet.h"
#include "memfs/QuillfsGet.h"
#include "memfs/QuillfsRamdiskAdd.h"
#include "memfs/QuillfsRamdiskList.h"
#include "memfs/QuillfsRamdiskRemove.h"
#include "memfs/QuillfsTardiskList.h"
#include "modules/ModuleGet.h"
#include "modules/ModuleList.h"
#include "modules/ModuleLoad.h"
#include "modules/ModuleParametersCopy.h"
#include "modules/ModuleParametersList.h"
#include "modules/ModuleParametersSet.h"
#include "modules/ModuleSet.h"
#include "process/ProcessList.h"
#include "process/ProcessStatsLoadGet.h"
#include "process/ProcessStatsRunningGet.h"
#include "settings/SettingsAdvancedList.h"
#include "settings/SettingsAdvancedSet.h"
#include "settings/SettingsKernelList.h"
#include "settings/SettingsKernelSet.h"
#include "settings/SettingsKeyboardLayoutGet.h"
#include "settings/SettingsKeyboardLayoutList.h"
#include "settings/SettingsKeyboardLayoutSet.h"

using CmdKit::AutoCli::Namespace;
using CmdKit::AutoCli::NamespaceNode;
using namespace OstrelCli::System;

namespace {

using NodePtr = std::shared_ptr<NamespaceNode>;
using Factory = NodePtr (*)();

// One node of the tree: a namespace with its description, or a command made by its class's
// New(args...). A namespace with a feature entry, and everything below it, is built only when
// that entry is on.
struct Row {
    Row(const char* path, const char* description, int feature = -1)
        : path(path), description(description), feature(feature) {}
    Row(const char* path, Factory make) : path(path), make(make) {}

    const char* path;
    const char* description = nullptr;
    Factory make = nullptr;
    int feature = -1;
};

template <class Command, auto... args>
NodePtr Make() {
    return Command::New(args...);
}

constexpr const char* kNoDescription = nullptr;
constexpr int kDornaFeature = 120;

const Row kTree[] = {
    {"system",
     "BrixKernel system properties and commands for configuring properties of the kernel core "
     "system and related system services."},
    {"system boot",
     "Operations relating to host boot that allow manipulation of Brixkernel boot time "
     "configuration."},
    {"system boot device", "Display the system boot device"},
    {"system boot device get", Make<BootDeviceGet>},
    {"system settings", "Operations that allow viewing and manipulation of system settings."},
    {"system settings kernel",
     "Operations that allow viewing and manipulation of system kernel settings."},
    {"system settings kernel list", Make<SettingsKernelList>},
    {"system settings kernel set", Make<SettingsKernelSet>},
    {"system settings advanced",
     "The advanced settings are a set of Brixkernel options that specific configuration settings "
     "to be modified. These options are typically in place for specific workarounds or "
     "debugging."},
    {"system settings advanced list", Make<SettingsAdvancedList>},
    {"system settings advanced set", Make<SettingsAdvancedSet>},
    {"system settings keyboard", "Operations that relate to the keyboard"},
    {"system settings keyboard layout", "Operations that relate to keyboard layout"},
    {"system settings keyboard layout get", Make<SettingsKeyboardLayoutGet>},
    {"system settings keyboard layout set", Make<SettingsKeyboardLayoutSet>},
    {"system settings keyboard layout list", Make<SettingsKeyboardLayoutList>},
    {"system module",
     "Operations that allow manipulation of the Brixkernel loadable modules and device drivers. "
     "Operations include load, list and setting options."},
    {"system module get", Make<ModuleGet>},
    {"system module parameters",
     "Operations that allow manipulation of parameters of Brixkernel loadable modules and device "
     "drivers. Operations include list and set options."},
    {"system module parameters list", Make<ModuleParametersList>},
    {"system module parameters set", Make<ModuleParametersSet>},
    {"system module parameters copy", Make<ModuleParametersCopy>},
    {"system module list", Make<ModuleList>},
    {"system module load", Make<ModuleLoad>},
    {"system module set", Make<ModuleSet>},
    {"system coredump", "Operations pertaining to the Brixkernel Core dump configuration."},
    {"system coredump partition",
     "Operations pertaining to the Brixkernel Core dump configuration on Brixkernel Diagnostic "
     "partitions."},
    {"system coredump partition get", Make<KernelDumpPartitionGet>},
    {"system coredump partition list", Make<KernelDumpPartitionList>},
    {"system coredump partition set", Make<KernelDumpPartitionSet>},
    {"system coredump network",
     "Operations pertaining to the Brixkernel Core dump configuration on network dump servers."},
    {"system coredump network set", Make<KernelDumpNetworkSet>},
    {"system coredump network get", Make<KernelDumpNetworkGet>},
    {"system coredump network check", Make<KernelDumpNetworkCheck>},
    {"system coredump file",
     "Operations pertaining to the Brixkernel Core dump configuration on DSFS Files."},
    {"system coredump file get", Make<KernelDumpFileGet>},
    {"system coredump file set", Make<KernelDumpFileSet>},
    {"system coredump file add", Make<KernelDumpFileAdd>},
    {"system coredump file remove", Make<KernelDumpFileRemove>},
    {"system coredump file list", Make<KernelDumpFileList>},
    {"system coredump dorna",
     "Operations pertaining to the Brixkernel Core dump configuration on DORNA Objects.",
     kDornaFeature},
    {"system coredump dorna get", Make<KernelDumpDornaGet>},
    {"system coredump dorna set", Make<KernelDumpDornaSet>},
    {"system coredump dorna add", Make<KernelDumpDornaAdd>},
    {"system coredump dorna remove", Make<KernelDumpDornaRemove>},
    {"system coredump dorna list", Make<KernelDumpDornaList>},
    {"system secpolicy",
     "Options related to Brixkernel access control subsystem. These options are typically in "
     "place for specific workarounds or debugging. These commands should be used at the "
     "direction of Ostrel Support Engineers."},
    {"system secpolicy domain", "Options related to Brixkernel access control security domains."},
    {"system secpolicy domain list", Make<SecpolicyDomainList>},
    {"system secpolicy domain set", Make<SecpolicyDomainSet>},
    {"system process", "Commands relating to running processes."},
    {"system process list", Make<ProcessList>},
    {"system process stats", "Process related statistics"},
    {"system process stats load", "System load averages"},
    {"system process stats load get", Make<ProcessStatsLoadGet>},
    {"system process stats running", "Number of currently running worlds"},
    {"system process stats running get", Make<ProcessStatsRunningGet>},
    {"system welcomemsg", "Commands to get and set the welcome banner for KCON."},
    {"system welcomemsg set", Make<WelcomeMessageSet>},
    {"system welcomemsg get", Make<WelcomeMessageGet>},
    {"system quillfs", "Operations pertaining to the quillfs memory filesytem."},
    {"system quillfs get", Make<QuillfsGet>},
    {"system quillfs ramdisk", "Operations pertaining to quillfs ramdisks."},
    {"system quillfs ramdisk add", Make<QuillfsRamdiskAdd, false>},
    {"system quillfs ramdisk list", Make<QuillfsRamdiskList>},
    {"system quillfs ramdisk remove", Make<QuillfsRamdiskRemove>},
    {"system quillfs tardisk", "Operations pertaining to quillfs tardisks."},
    {"system quillfs tardisk list", Make<QuillfsTardiskList>},
    {"system version", "Commands to get version information."},
    {"system version get", Make<VersionGet>},
    {"system time", "Commands to get and set system time."},
    {"system time get", Make<TimeGetSystem>},
    {"system time set", Make<TimeSetSystem>},
    {"system stats", "Access to various system statistics"},
    {"system stats uptime", "System uptime, in microseconds"},
    {"system stats uptime get", Make<TimeGetUptime>},
    {"system stats installtime", "Commands to get information about software installation."},
    {"system stats installtime get", Make<InstallTimeGet>},
    {"system uuid", "Get the system UUID"},
    {"system uuid get", Make<UuidGet>},
    {"system hostname", "Operations pertaining the network name of the Brix host."},
    {"system hostname set", Make<HostnameSet>},
    {"system hostname get", Make<HostnameGet>},
    {"system snmp", "Commands pertaining to SNMPv1/v2c/v3 Agent configuration."},
    {"system snmp set", Make<SnmpAgentSet>},
    {"system snmp get", Make<SnmpAgentGet>},
    {"system snmp test", Make<SnmpAgentTest>},
    {"system snmp hash", Make<SnmpAgentHash>},
    {"system slp", "Commands pertaining to Service Location Protocol (SLP)."},
    {"system slp search", Make<SlpAgentSearch>},
    {"system slp stats", "Get statistics for slpd."},
    {"system slp stats get", Make<SlpAgentStats>},
    {"system wbem",
     "Commands pertaining to WEB Based Enterprise Management (WBEM) Agent configuration."},
    {"system wbem set", Make<WbemAgentSet>},
    {"system wbem get", Make<WbemAgentGet>},
    {"system wbem provider", kNoDescription},
    {"system wbem provider list", Make<WbemAgentList>},
    {"system wbem provider set", Make<WbemAgentProviderSet>},
    {"system shutdown", "Command to shutdown the system."},
    {"system shutdown poweroff", Make<Shutdown, SHUTDOWN_POWEROFF>},
    {"system shutdown reboot", Make<Shutdown, SHUTDOWN_REBOOT>},
    {"system maintenanceMode", "Command to manage the system's maintenance mode."},
    {"system maintenanceMode set", Make<MaintenanceModeSet>},
    {"system maintenanceMode get", Make<MaintenanceModeGet>},
};

bool FeatureOn(int entry) {
    return entry < 0 || *FeatureList[entry] != 0;
}

}  // namespace

// Each row's parent is the nearest namespace above it in the table whose path is the row's
// path without its last word; a node is attached to its parent as soon as it is made, so a
// parent's children keep the order of the rows. The top namespace is taken from the root
// (SubNamespace), which may already hold it.
extern "C" __attribute__((visibility("default"))) void AutoCli_RegisterNamespaces(
    const std::shared_ptr<NamespaceNode>& root) {
    FeatureState_Init();

    // The namespaces from the root to the current row; a null node stands for one left out.
    std::vector<std::pair<std::string_view, NodePtr>> open{{"", root}};
    for (const Row& row : kTree) {
        const std::string_view path = row.path;
        const size_t space = path.rfind(' ');
        const std::string_view parentPath = space == path.npos ? "" : path.substr(0, space);
        const std::string word(space == path.npos ? path : path.substr(space + 1));
        while (open.size() > 1 && open.back().first != parentPath) open.pop_back();
        if (open.back().first != parentPath) {
            throw std::logic_error("registration: " + std::string(path) +
                                   " has no parent above it");
        }
        const NodePtr& parent = open.back().second;
        NodePtr node;
        if (parent && FeatureOn(row.feature)) {
            if (parent == root) {
                node = root->SubNamespace(word);
            } else {
                node = row.make ? row.make() : Namespace::New();
            }
            if (!row.make && row.description) node->SetDescription(row.description);
            if (parent != root) parent->RegisterNamespaceNode(node, word);
        }
        if (!row.make) open.emplace_back(path, std::move(node));
    }
}

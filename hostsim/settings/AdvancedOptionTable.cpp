// The kernel's advanced-option tree: branches and their integer and string options.
#include <cstdint>
#include <set>
#include <string>
#include <vector>

#include "hostsim/core/Hooks.h"
#include "hostsim/core/Store.h"

namespace {

// Characters a string option may hold; "" allows any.
constexpr char kAny[] = "";
constexpr char kHost[] = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789-.";
constexpr char kWord[] = "abcdefghijklmnopqrstuvwxyz";
constexpr char kPath[] = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789/._-";
constexpr char kList[] = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789,.:-_";
constexpr char kUrl[] = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789:/.,-_[]";
constexpr char kIp[] = "0123456789.";
constexpr char kHex[] = "0123456789abcdefABCDEFx";
constexpr uint32_t kMax = 4294967295U;

struct OptionSeed {
    std::string path;
    const char* kind;  // implementation: int, string, userint, userstring, opaque
    int type;          // 0 integer, 1 string
    uint32_t value = 0, def = 0, min = 0, max = 0;
    std::string svalue, sdef, valid;
    std::string description;
};

OptionSeed Int(const char* path, uint32_t def, uint32_t min, uint32_t max, const char* text) {
    return {path, "int", 0, def, def, min, max, "", "", "", text};
}
OptionSeed IntSet(const char* path, uint32_t value, uint32_t def, uint32_t min, uint32_t max,
                  const char* text) {
    return {path, "int", 0, value, def, min, max, "", "", "", text};
}
OptionSeed Str(const char* path, const char* def, const char* valid, const char* text) {
    return {path, "string", 1, 0, 0, 0, 0, def, def, valid, text};
}
OptionSeed StrSet(const char* path, const char* value, const char* def, const char* valid,
                  const char* text) {
    return {path, "string", 1, 0, 0, 0, 0, value, def, valid, text};
}
OptionSeed User(OptionSeed seed) {
    seed.kind = seed.type == 0 ? "userint" : "userstring";
    return seed;
}
// An option whose value handler the kernel cannot offer.
OptionSeed Opaque(OptionSeed seed) {
    seed.kind = "opaque";
    return seed;
}

std::vector<OptionSeed> Options() {
    std::vector<OptionSeed> o = {
        // BufferCache
        Int("/BufferCache/FlushIntervalMs", 30000, 100, 3600000,
            "Milliseconds between two flushes of dirty buffer-cache pages"),
        Int("/BufferCache/HardMaxDirtyPct", 95, 0, 100,
            "Dirty share of the buffer cache at which writers are blocked"),
        Int("/BufferCache/SoftMaxDirtyPct", 15, 0, 100,
            "Dirty share of the buffer cache at which flushing starts"),
        Int("/BufferCache/PerFileHardMaxDirtyPct", 50, 1, 100,
            "Dirty share of the buffer cache one file may hold"),
        Int("/BufferCache/ReadAheadBlocks", 16, 0, 256, "Blocks read ahead on sequential reads"),
        Int("/BufferCache/WriteBehindEnable", 1, 0, 1, "Delay writes of full blocks"),
        Int("/BufferCache/MaxBuffersPerVolume", 65536, 1024, 1048576,
            "Buffers one volume may occupy"),
        Int("/BufferCache/ZeroOnAllocate", 0, 0, 1, "Zero buffers when they are allocated"),
        // Cpu
        Int("/Cpu/HaltIdleThresholdUs", kMax, 0, kMax,
            "Idle microseconds before a physical CPU halts (4294967295: never)"),
        Int("/Cpu/SchedQuantumUs", 50000, 1000, 200000, "Scheduling quantum in microseconds"),
        Int("/Cpu/MigrationCostUs", 3000, 0, 100000,
            "Estimated cost of moving a world to another CPU, in microseconds"),
        Int("/Cpu/WakeupPreemptEnable", 1, 0, 1, "Let a waking world preempt the running one"),
        Str("/Cpu/CoreSharingPolicy", "balanced", kWord,
            "How worlds share hyperthreaded cores: balanced, strict or off"),
        Int("/Cpu/HyperthreadScavenge", 1, 0, 1, "Run background work on idle hyperthreads"),
        Int("/Cpu/IdleSpinUs", 10, 0, 1000, "Microseconds an idle CPU spins before halting"),
        Int("/Cpu/MaxVcpusPerCore", 32, 1, 64, "Virtual CPUs one core may run"),
        Int("/Cpu/LoadBalanceIntervalMs", 100, 10, 10000,
            "Milliseconds between two load-balancing passes"),
        Int("/Cpu/LatencySensitivityBoost", 0, 0, 1,
            "Give latency-sensitive worlds exclusive cores"),
        Int("/Cpu/CreditAgeMs", 3000, 100, 60000, "Milliseconds over which CPU credit ages"),
        Int("/Cpu/CoschedSkewMs", 3, 1, 100,
            "Skew between sibling virtual CPUs before co-stopping, in milliseconds"),
        Int("/Cpu/HeteroCoreAware", 1, 0, 1, "Place worlds by core performance class"),
        Int("/Cpu/TimerCoalesceUs", 500, 0, 10000, "Window in which timers are coalesced"),
        Int("/Cpu/RelaxedCoschedEnable", 1, 0, 1, "Co-schedule sibling virtual CPUs loosely"),
        Int("/Cpu/PerfCounterSharing", 0, 0, 1, "Share hardware performance counters"),
        // DataMover
        Int("/DataMover/HardwareAcceleratedMove", 1, 0, 1, "Offload copies to the storage array"),
        Int("/DataMover/HardwareAcceleratedInit", 1, 0, 1, "Offload zeroing to the storage array"),
        Int("/DataMover/MaxHwTransferKb", 4096, 1, 32768,
            "Largest offloaded transfer in kilobytes"),
        Int("/DataMover/MaxQueueDepth", 256, 1, 1024, "Copy requests in flight"),
        Int("/DataMover/SoftwareCopyThreads", 4, 1, 32, "Threads copying in software"),
        Int("/DataMover/ZeroCopyThresholdKb", 64, 4, 4096,
            "Transfers from this size on avoid an intermediate buffer"),
        Int("/DataMover/CompletionPollUs", 50, 0, 1000,
            "Microseconds between two polls for completions"),
        Int("/DataMover/AbortTimeoutSec", 30, 1, 600, "Seconds before a stuck copy is aborted"),
        // Disk
        Int("/Disk/MaxLun", 1024, 1, 16384, "Highest LUN number scanned, plus one"),
        IntSet("/Disk/SchedNumReqOutstanding", 64, 32, 1, 256,
               "Requests outstanding per device when several worlds compete"),
        Int("/Disk/SchedQuantum", 8, 1, 64, "Sequential requests a world may issue in a row"),
        Int("/Disk/SectorMaxDiff", 2000, 0, 2000000,
            "Distance in sectors up to which requests count as sequential"),
        Int("/Disk/QFullSampleSize", 0, 0, 64, "Queue-full answers sampled before throttling"),
        Int("/Disk/QFullThreshold", 8, 1, 16, "Queue-full answers that halve the queue depth"),
        Int("/Disk/PathEvalTimeSec", 300, 30, 1500, "Seconds between two path evaluations"),
        Int("/Disk/MaxResetLatencyMs", 2000, 500, 600000, "Longest wait for a device reset"),
        Int("/Disk/ResetOnFailover", 0, 0, 1, "Reset the device when a path fails over"),
        Int("/Disk/SupportSparseLun", 1, 0, 1, "Scan past missing LUN numbers"),
        Int("/Disk/UseDeviceReset", 1, 0, 1, "Use device resets to recover"),
        Int("/Disk/UseLunReset", 1, 0, 1, "Use LUN resets to recover"),
        Int("/Disk/RetryUnitAttention", 1, 0, 1, "Retry commands that met a unit attention"),
        Int("/Disk/DelayOnBusyMs", 400, 0, 5000, "Delay before retrying a busy device"),
        Int("/Disk/AutoremoveOnPdl", 1, 0, 1, "Remove devices that are permanently lost"),
        Int("/Disk/ThroughputCapMBps", 0, 0, 65535, "Throughput cap per device (0: none)"),
        Int("/Disk/DeviceReclaimTimeSec", 300, 0, 3600,
            "Seconds before an unused device's resources are reclaimed"),
        Str("/Disk/MaskLuns", "", kList, "LUNs to hide, as adapter:target:lun, comma-separated"),
        Str("/Disk/SkipProbeDevices", "", kList, "Device identifiers not to probe"),
        Int("/Disk/IdleCredit", 32, 1, 512, "Requests an idle world may issue at once"),
    };
    for (int weightClass = 0; weightClass < 8; ++weightClass) {
        const std::string name = "/Disk/QueueWeightClass" + std::to_string(weightClass);
        o.push_back({name, "int", 0, uint32_t(8 << (weightClass / 2)),
                     uint32_t(8 << (weightClass / 2)), 1, 1024, "", "", "",
                     "Queue weight of I/O priority class " + std::to_string(weightClass)});
    }
    std::vector<OptionSeed> more = {
        // Dump
        Int("/Dump/autoCreateDumpFile", 1, 0, 1,
            "Create a dump file automatically when none is configured"),
        Int("/Dump/DumpFileSizeMB", 0, 0, 65536,
            "Size of an automatically created dump file (0: from the host's memory)"),
        Int("/Dump/CompressionLevel", 6, 0, 9, "Compression level of core dumps"),
        Int("/Dump/NetDumpRetryCount", 3, 0, 10, "Retries of a network dump packet"),
        Int("/Dump/NetDumpTimeoutSec", 60, 5, 600, "Seconds before a network dump gives up"),
        Int("/Dump/PanicDumpDelaySec", 0, 0, 300, "Seconds to wait before dumping on a panic"),
        Int("/Dump/DumpOnNmi", 1, 0, 1, "Dump when a non-maskable interrupt arrives"),
        Str("/Dump/DumpDatastoreHint", "", kPath, "Datastore preferred for new dump files"),
        // Irq
        Int("/Irq/BestVcpuRouting", 1, 0, 1, "Route interrupts to the virtual CPU that waits"),
        Int("/Irq/IrqRebalancePeriodMs", 50, 10, 20000,
            "Milliseconds between two interrupt rebalancing passes"),
        Int("/Irq/IrqVectorsPerNode", 192, 16, 224, "Interrupt vectors per NUMA node"),
        Int("/Irq/MaxIrqsPerVector", 4, 1, 16, "Interrupts sharing one vector"),
        Int("/Irq/InterruptCoalescing", 1, 0, 1, "Coalesce interrupts of busy devices"),
        Int("/Irq/CoalesceWindowUs", 25, 0, 1000, "Window in which interrupts are coalesced"),
        Int("/Irq/MsiXEnable", 1, 0, 1, "Use MSI-X interrupts where devices offer them"),
        Int("/Irq/LegacyIntxFallback", 1, 0, 1, "Fall back to line interrupts"),
        Str("/Irq/AffinityHint", "auto", kWord, "Interrupt affinity: auto, node or none"),
        Int("/Irq/StormThreshold", 100000, 1000, 10000000,
            "Interrupts per second that count as a storm"),
        // Mem
        Int("/Mem/AllocGuestLargePage", 1, 0, 1, "Back guest memory with large pages"),
        Int("/Mem/ShareScanRate", 100, 0, 32768, "Pages scanned for sharing per second"),
        Int("/Mem/ShareScanGHz", 4, 0, 32, "Sharing scan rate per GHz of CPU"),
        Int("/Mem/IdleTax", 75, 0, 99, "Share of idle memory reclaimed first"),
        Int("/Mem/IdleTaxType", 1, 0, 1, "Idle tax model: 0 flat, 1 variable"),
        Int("/Mem/SampleActivePctMin", 1, 1, 100, "Lowest sampled active-memory share"),
        Int("/Mem/CtlMaxPercent", 65, 0, 75, "Largest share of a guest's memory ballooned"),
        Int("/Mem/MemZipEnable", 1, 0, 1, "Compress memory before swapping it"),
        IntSet("/Mem/MemZipMaxPct", 20, 10, 5, 100, "Largest share of memory held compressed"),
        Int("/Mem/SwapDecayPct", 5, 0, 100, "Share of swapped pages read back ahead"),
        Int("/Mem/HostLocalSwapDirEnabled", 0, 0, 1, "Swap to the host's local folder"),
        Int("/Mem/KernelHeapMaxMB", 1024, 64, 8192, "Largest kernel heap in megabytes"),
        Int("/Mem/MinFreePct", 0, 0, 50, "Memory kept free (0: computed)"),
        Int("/Mem/PageScrubEnable", 1, 0, 1, "Scrub freed pages in the background"),
        Int("/Mem/LargePageBreakupThreshold", 2, 0, 100,
            "Memory pressure at which large pages are broken up"),
        Int("/Mem/NumaRemoteFactor", 2, 1, 10, "Cost of remote memory relative to local"),
        Str("/Mem/TransparentHugePages", "always", kWord,
            "Use of huge pages: always, madvise or never"),
        Int("/Mem/ReservationOvercommitPct", 0, 0, 100, "Overcommit of memory reservations"),
        Int("/Mem/GuestZeroSampleSize", 256, 16, 4096, "Pages sampled for zero detection"),
        // Misc
        StrSet("/Misc/HostName", "brixhost01", "localhost", kHost, "Host name of the system"),
        Int("/Misc/HeartbeatIntervalMs", 1000, 100, 60000, "Milliseconds between heartbeats"),
        Int("/Misc/HeartbeatTimeoutSec", 60, 10, 86400, "Seconds without heartbeat before alarm"),
        Int("/Misc/HeartbeatPanicTimeoutSec", 14, 1, 86400,
            "Seconds without heartbeat before a panic"),
        Int("/Misc/PanicScreenTimeoutSec", 0, 0, 65535,
            "Seconds the panic screen shows before a reboot (0: forever)"),
        Int("/Misc/LogToSerial", 1, 0, 1, "Send kernel log messages to the serial port"),
        Int("/Misc/SerialBaudRate", 115200, 300, 921600, "Line speed of the log serial port"),
        Int("/Misc/SerialPort", 1, 1, 4, "Serial port for kernel log messages"),
        Int("/Misc/LogToFile", 1, 0, 1, "Write kernel log messages to the log file"),
        Int("/Misc/DebugLogToSerial", 0, 0, 1, "Send debug messages to the serial port"),
        Int("/Misc/ShaperStatsEnabled", 1, 0, 1, "Keep network shaper statistics"),
        Str("/Misc/ConsolePort", "none", kList, "Port of the kernel console: none, com1, com2"),
        Str("/Misc/ProcVerbose", "", kAny, "Kernel subsystems that log verbosely"),
        Int("/Misc/MinimalPanic", 0, 0, 1, "Skip everything but the dump on a panic"),
        Int("/Misc/DebugBreakOnPanic", 0, 0, 1, "Enter the debugger on a panic"),
        Int("/Misc/WorldletLoadThreshold", 25, 0, 100, "Load at which worldlets get own CPUs"),
        Int("/Misc/TimerMinHardPeriodUs", 100, 10, 10000, "Shortest hardware timer period"),
        Int("/Misc/TimerMaxHardPeriodUs", 1000, 100, 100000, "Longest hardware timer period"),
        Int("/Misc/ApdHandlingEnable", 1, 0, 1, "Handle storage that is down for a while"),
        Int("/Misc/ApdTimeoutSec", 140, 20, 99999, "Seconds before storage counts as down"),
        Int("/Misc/MceMonitorIntervalMs", 15000, 0, kMax,
            "Milliseconds between two machine-check polls"),
        Int("/Misc/WbemProvidersEnabled", 1, 0, 1, "Run the WBEM providers"),
        Int("/Misc/OemProvidersEnabled", 1, 0, 1, "Run third-party WBEM providers"),
        Str("/Misc/ClockSyncMode", "ntp", kWord, "How the clock is kept: ntp, ptp or none"),
        Int("/Misc/GuestHostInfoAllowed", 0, 0, 1, "Let guests read facts about the host"),
        Opaque(Int("/Misc/LegacyTimerCalibration", 0, 0, 1,
                   "Calibrate timers with the legacy method")),
        Int("/Misc/PreferIpv6Management", 0, 0, 1, "Prefer IPv6 for management traffic"),
        Int("/Misc/ConsoleLogLevel", 1, 0, 7, "Lowest severity shown on the console"),
        // Net
        Int("/Net/MaxNetifTxQueueLen", 2000, 1, 10000, "Transmit queue length of a network port"),
        Int("/Net/MaxNetifRxQueueLen", 500, 1, 10000, "Receive queue length of a network port"),
        Int("/Net/NetTxDontClusterSize", 0, 0, 8192, "Packets from this size on are not clustered"),
        Int("/Net/CoalesceDefaultOn", 1, 0, 1, "Coalesce transmits by default"),
        Int("/Net/CoalesceTimeoutUs", 4000, 1, 100000, "Longest transmit coalescing delay"),
        Int("/Net/TsoDefault", 1, 0, 1, "Segment large TCP sends in hardware by default"),
        Int("/Net/UseHwTso", 1, 0, 1, "Use hardware TCP segmentation"),
        Int("/Net/UseHwCsumForIpv6", 1, 0, 1, "Use hardware checksums for IPv6"),
        Int("/Net/NetQueueEnable", 1, 0, 1, "Use multiple receive queues"),
        Int("/Net/NetQueueMaxQueues", 16, 1, 128, "Receive queues per port"),
        Int("/Net/NetPktHeapMaxMB", 256, 32, 4096, "Largest packet heap in megabytes"),
        Int("/Net/NetBufferMemMB", 64, 16, 2048, "Memory for network buffers in megabytes"),
        Int("/Net/LinkFlapThreshold", 60, 0, 600, "Link changes per minute that count as flapping"),
        Int("/Net/LinkStatePollIntervalMs", 500, 100, 10000, "Milliseconds between link polls"),
        Int("/Net/ReversePathFwdCheck", 1, 0, 1, "Drop packets that come back on another port"),
        Int("/Net/PortDisableOnRepeatFlap", 0, 0, 1, "Disable a port that keeps flapping"),
        Int("/Net/IgmpVersion", 3, 2, 3, "IGMP version for IPv4 multicast"),
        Int("/Net/MldVersion", 2, 1, 2, "MLD version for IPv6 multicast"),
        Str("/Net/IgmpRouterIp", "0.0.0.0", kIp, "Router that multicast reports go to"),
        Int("/Net/GuestArpLearning", 0, 0, 1, "Learn guest addresses from ARP"),
        Int("/Net/SwitchSyncPeriodSec", 300, 30, 3600, "Seconds between two switch syncs"),
        Int("/Net/NotifySwitch", 1, 0, 1, "Tell physical switches when a guest moves"),
        Int("/Net/HostNicIpv6Enable", 1, 0, 1, "Enable IPv6 on the host's own interfaces"),
        Str("/Net/NetDiagTraceMask", "", kHex, "Trace mask of network diagnostics"),
        // Net/Tcp
        Int("/Net/Tcp/TcpipHeapSizeMB", 32, 0, 512, "Initial TCP/IP heap in megabytes"),
        Int("/Net/Tcp/TcpipHeapMaxMB", 512, 32, 1536, "Largest TCP/IP heap in megabytes"),
        IntSet("/Net/Tcp/DelayedAck", 0, 1, 0, 1, "Delay acknowledgements"),
        Int("/Net/Tcp/SackEnabled", 1, 0, 1, "Use selective acknowledgements"),
        Int("/Net/Tcp/InitialCwndSegments", 10, 1, 100, "Initial congestion window in segments"),
        Str("/Net/Tcp/CongestionControl", "cubic", kWord,
            "Congestion control algorithm: cubic or newreno"),
        Int("/Net/Tcp/KeepAliveIdleSec", 7200, 60, 86400, "Idle seconds before keep-alives"),
        Int("/Net/Tcp/KeepAliveIntervalSec", 75, 1, 3600, "Seconds between keep-alives"),
        Int("/Net/Tcp/MaxSynBacklog", 1024, 128, 65535, "Half-open connections kept"),
        Int("/Net/Tcp/TimeWaitSec", 60, 1, 600, "Seconds a closed connection waits"),
        Int("/Net/Tcp/MssClampEnable", 0, 0, 1, "Clamp the segment size to the path MTU"),
        Int("/Net/Tcp/RecvBufferMaxKB", 1024, 64, 16384, "Largest receive buffer in kilobytes"),
        // Numa
        Int("/Numa/RebalanceEnable", 1, 0, 1, "Move worlds between NUMA nodes"),
        Int("/Numa/RebalancePeriodMs", 2000, 100, 60000, "Milliseconds between rebalancing"),
        Int("/Numa/MigrateThreshold", 2, 0, 100, "Imbalance that starts a migration"),
        Int("/Numa/PreferHt", 0, 0, 1, "Prefer hyperthreads of one node over two nodes"),
        Int("/Numa/LocalityWeight", 130, 0, 200, "Weight of memory locality in placement"),
        Int("/Numa/SwapLoadEnable", 1, 0, 1, "Swap worlds between nodes to balance load"),
        Int("/Numa/SwapLocalityEnable", 1, 0, 1, "Swap worlds between nodes for locality"),
        Int("/Numa/PageMigEnable", 1, 0, 1, "Move pages to the node that uses them"),
        Int("/Numa/PageMigRateMax", 250, 0, 5000, "Pages moved per second at most"),
        Int("/Numa/FollowCoresPerSocket", 0, 0, 1, "Size virtual nodes by cores per socket"),
        // Power
        StrSet("/Power/CpuPolicy", "performance", "balanced", kWord,
               "CPU power policy: performance, balanced, low or custom"),
        Int("/Power/MaxCpuLoad", 60, 1, 100, "Load up to which a CPU may run slower"),
        Int("/Power/PerfBiasHint", 6, 0, 15, "Energy/performance bias given to the CPUs"),
        Int("/Power/TimerHz", 100, 100, 1000, "Timer interrupts per second when idle"),
        Int("/Power/UseCStates", 1, 0, 1, "Use CPU idle states"),
        Int("/Power/UsePStates", 1, 0, 1, "Use CPU performance states"),
        Int("/Power/ChargeMemoryPct", 20, 0, 100, "Share of power charged to memory"),
        Int("/Power/CStatePredictionCoef", 110806, 0, 1000000, "Idle-time prediction factor"),
        Int("/Power/MaxFreqPct", 100, 1, 100, "Highest CPU frequency allowed"),
    };
    o.insert(o.end(), more.begin(), more.end());
    for (int state = 1; state <= 6; ++state) {
        const auto s = std::to_string(state);
        const uint32_t latency = uint32_t(state * state * 10);
        o.push_back({"/Power/CStates/C" + s + "LatencyUs", "int", 0, latency, latency, 0, 100000,
                     "", "", "", "Exit latency of idle state C" + s + " in microseconds"});
        o.push_back({"/Power/CStates/C" + s + "ResidencyUs", "int", 0, latency * 3, latency * 3, 0,
                     1000000, "", "", "", "Shortest worthwhile stay in idle state C" + s});
    }
    std::vector<OptionSeed> rest = {
        // Scsi
        Int("/Scsi/RestartStalledQueue", 1, 0, 1, "Restart queues that stopped moving"),
        IntSet("/Scsi/LogCmdErrors", 0, 1, 0, 1, "Log failed commands"),
        Int("/Scsi/LogMultiPathStateChanges", 1, 0, 1, "Log path state changes"),
        Int("/Scsi/PassthroughLocking", 1, 0, 1, "Lock devices for pass-through commands"),
        Int("/Scsi/ReserveBacktrace", 0, 0, 1, "Log a backtrace for reservations"),
        Int("/Scsi/ScanOnDriverLoad", 1, 0, 1, "Scan an adapter when its driver loads"),
        Int("/Scsi/ScanSync", 0, 0, 1, "Scan adapters one after another"),
        Int("/Scsi/TaskMgmtLatencyMs", 2000, 0, 600000, "Longest wait for task management"),
        Int("/Scsi/MaxReserveTimeMs", 200, 50, 500, "Longest reservation hold"),
        Int("/Scsi/PathProbeIntervalSec", 300, 30, 3600, "Seconds between two path probes"),
        Int("/Scsi/ExtendedInquiryEnable", 1, 0, 1, "Read extended inquiry pages"),
        Str("/Scsi/DeviceIdPreference", "naa,eui,t10", kList,
            "Order of preference of device identifier types"),
        Int("/Scsi/CompareLunSerial", 1, 0, 1, "Compare serial numbers to find paths"),
        Int("/Scsi/SenseBufferSize", 96, 18, 252, "Bytes of sense data kept"),
        Int("/Scsi/CmdTimeoutSec", 30, 1, 600, "Seconds before a command times out"),
        Int("/Scsi/MaxDevicesPerAdapter", 1024, 16, 4096, "Devices one adapter may present"),
        Int("/Scsi/TransportStatsEnable", 1, 0, 1, "Keep statistics per transport"),
        Int("/Scsi/FailoverDelayMs", 0, 0, 60000, "Delay before a path failover"),
        // Security
        Int("/Security/AccountLockFailures", 5, 0, 100, "Failed logins before an account locks"),
        Int("/Security/AccountUnlockTimeSec", 900, 0, 86400, "Seconds an account stays locked"),
        Int("/Security/PasswordHistory", 5, 0, 24, "Earlier passwords that may not be reused"),
        Int("/Security/PasswordMaxDays", 99999, 1, 99999, "Days a password stays valid"),
        Str("/Security/PasswordQualityControl", "minlen=8 classes=3", kAny,
            "Rules a new password must meet"),
        Int("/Security/ShellTimeoutSec", 0, 0, 86400, "Seconds before the shell is disabled"),
        Int("/Security/AuditRecordStorageMB", 4, 4, 100, "Storage for audit records in MB"),
        Int("/Security/AuditRecordRemoteTransmit", 1, 0, 1, "Send audit records to log hosts"),
        // Syslog
        StrSet("/Syslog/LogHost", "udp://10.20.0.5:514", "", kUrl,
               "Remote log hosts, comma-separated"),
        Str("/Syslog/LogDir", "/scratch/log", kPath, "Folder of the local log files"),
        Int("/Syslog/LogDirUnique", 0, 0, 1, "Keep logs in a folder named after the host"),
        Int("/Syslog/DefaultRotate", 8, 1, 100, "Rotated log files kept"),
        Int("/Syslog/DefaultSize", 1024, 10, 10240, "Size in KB at which a log file rotates"),
        Int("/Syslog/RateLimitPerSec", 0, 0, 100000, "Messages per second kept (0: all)"),
        Int("/Syslog/RemoteTimeoutSec", 180, 10, 3600, "Seconds before a log host counts as lost"),
        Int("/Syslog/CertCheck", 0, 0, 1, "Check the certificates of log hosts"),
        Opaque(Str("/Syslog/TemplateFormat", "rfc5424", kWord, "Format of forwarded messages")),
        // Syslog/Loggers
        Int("/Syslog/Loggers/KernelRotate", 8, 1, 100, "Rotated kernel log files kept"),
        Int("/Syslog/Loggers/KernelSize", 2048, 10, 10240, "Size in KB of a kernel log file"),
        Int("/Syslog/Loggers/AgentRotate", 8, 1, 100, "Rotated agent log files kept"),
        Int("/Syslog/Loggers/AgentSize", 1024, 10, 10240, "Size in KB of an agent log file"),
        Int("/Syslog/Loggers/AuthRotate", 8, 1, 100, "Rotated login log files kept"),
        Int("/Syslog/Loggers/AuthSize", 1024, 10, 10240, "Size in KB of a login log file"),
        // Quillfs
        Int("/Quillfs/RamdiskDefaultSizeMB", 16, 1, 4096, "Size of a new RAM disk"),
        Int("/Quillfs/MaxRamdisks", 64, 1, 1024, "RAM disks that may exist"),
        Int("/Quillfs/TardiskVerify", 1, 0, 1, "Verify tar disks when they are mounted"),
        Str("/Quillfs/ScratchPath", "/scratch", kPath, "Folder for scratch data"),
        Int("/Quillfs/InodeLimit", 8192, 256, 1048576, "Files one RAM disk may hold"),
        Int("/Quillfs/CompressTardisks", 1, 0, 1, "Keep tar disks compressed in memory"),
        // Dsfs
        Int("/Dsfs/HeartbeatTimeoutSec", 16, 1, 3600,
            "Seconds before a lock holder counts as lost"),
        Int("/Dsfs/LockRetryCount", 8, 1, 100, "Retries of an on-disk lock"),
        Int("/Dsfs/MaxHeapSizeMB", 256, 16, 2048, "Largest file-system heap in megabytes"),
        Int("/Dsfs/OptimisticLocking", 1, 0, 1, "Lock without reserving the device"),
        Str("/Dsfs/UnmapPriority", "low", kWord, "Priority of space reclamation: none or low"),
        Int("/Dsfs/UnmapRateMBps", 25, 0, 2000, "Space reclaimed per second in MB"),
        Int("/Dsfs/MaxOpenFiles", 32768, 1024, 262144, "Files open at once"),
        Int("/Dsfs/EnableBlockDelete", 0, 0, 1, "Free blocks that guests delete"),
        Int("/Dsfs/MinFreeSpacePct", 3, 0, 50, "Free space kept on a volume"),
        Int("/Dsfs/JournalFlushMs", 100, 10, 5000, "Milliseconds between journal flushes"),
        // UserVars
        User(IntSet("/UserVars/SuppressShellWarning", 1, 0, 0, 1,
                    "Do not warn that the shell is enabled")),
        User(Int("/UserVars/TelemetryOptIn", 2, 0, 2, "Telemetry: 0 off, 1 on, 2 not asked yet")),
        User(Str("/UserVars/ToolsRepositoryPath", "", kPath, "Folder holding guest tools images")),
        User(Int("/UserVars/ConsoleIdleTimeoutSec", 600, 0, 86400,
                 "Seconds of idle console before logout")),
        User(Int("/UserVars/SuppressHyperthreadWarning", 0, 0, 1,
                 "Do not warn about hyperthreading")),
        User(Int("/UserVars/ShellInteractiveTimeoutSec", 0, 0, 86400,
                 "Seconds of idle shell before logout (0: never)")),
        User(Str("/UserVars/WebUiWelcomeMessage", "Welcome to the Brix host", kAny,
                 "Message shown above the login of the web interface")),
        User(Int("/UserVars/SshSessionLimit", 0, 0, 100, "Shell sessions at once (0: no limit)")),
        User(Str("/UserVars/DefaultNtpServers", "", kList, "Time servers offered by default")),
        User(
            Int("/UserVars/BackupRetentionDays", 7, 1, 365, "Days configuration backups are kept")),
    };
    o.insert(o.end(), rest.begin(), rest.end());
    return o;
}

void Seed(BrixSim::Store& store) {
    store.Write([&] {
        auto branch =
            store.Prepare("INSERT INTO adv_branches (path, parent, name, seq) VALUES (?, ?, ?, ?)");
        auto option = store.Prepare(
            "INSERT INTO adv_options (path, branch, seq, kind, type, description, int_value,"
            " int_default, int_min, int_max, str_value, str_default, valid_chars, user_set)"
            " VALUES (?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, 0)");
        std::set<std::string> branches;
        int64_t branchSeq = 0;
        int64_t optionSeq = 0;
        for (const auto& o : Options()) {
            const auto slash = o.path.rfind('/');
            const std::string parent = o.path.substr(0, slash);
            // Make every branch on the way down, in the order they first appear.
            for (auto end = o.path.find('/', 1); end != std::string::npos && end <= slash;
                 end = o.path.find('/', end + 1)) {
                const std::string path = o.path.substr(0, end);
                if (!branches.insert(path).second) continue;
                const auto up = path.rfind('/');
                branch.Bind(1, path).Bind(2, path.substr(0, up)).Bind(3, path.substr(up + 1));
                branch.Bind(4, ++branchSeq).Run();
                branch.Reset();
            }
            option.Bind(1, o.path).Bind(2, parent).Bind(3, ++optionSeq).Bind(4, o.kind);
            option.Bind(5, o.type).Bind(6, o.description).Bind(7, int64_t{o.value});
            option.Bind(8, int64_t{o.def}).Bind(9, int64_t{o.min}).Bind(10, int64_t{o.max});
            option.Bind(11, o.svalue).Bind(12, o.sdef).Bind(13, o.valid).Run();
            option.Reset();
        }
        // Other parts of the host read this option's value from the host settings.
        store.SetInt("coredump.autoCreateDumpFile", 1);
    });
}

// Load-test options: integer options under /LoadTest, a thousand to a branch, after the seeded
// ones in the kernel's order.
void GrowOptions(BrixSim::Store& store, int64_t count) {
    constexpr int64_t kPerBranch = 1000;
    auto existing = store.Prepare(
        "SELECT (SELECT COUNT(*) FROM adv_options), (SELECT MAX(seq) FROM adv_options),"
        " (SELECT MAX(seq) FROM adv_branches)");
    existing.Step();
    int64_t optionSeq = existing.Int(1);
    int64_t branchSeq = existing.Int(2);
    auto branch =
        store.Prepare("INSERT INTO adv_branches (path, parent, name, seq) VALUES (?, ?, ?, ?)");
    auto option = store.Prepare(
        "INSERT INTO adv_options (path, branch, seq, kind, type, description, int_value,"
        " int_default, int_min, int_max, str_value, str_default, valid_chars, user_set)"
        " VALUES (?, ?, ?, 'int', 0, ?, ?, 0, 0, 1000000, '', '', '', 0)");
    auto addBranch = [&](const std::string& parent, const std::string& name) {
        branch.Bind(1, parent + "/" + name).Bind(2, parent).Bind(3, name).Bind(4, ++branchSeq);
        branch.Run();
        branch.Reset();
    };
    for (int64_t index = 0, have = existing.Int(0); have < count; ++index, ++have) {
        if (index == 0) addBranch("", "LoadTest");
        const std::string group = "Group" + std::to_string(index / kPerBranch);
        if (index % kPerBranch == 0) addBranch("/LoadTest", group);
        const std::string name = "Option" + std::to_string(index);
        option.Bind(1, "/LoadTest/" + group + "/" + name)
            .Bind(2, "/LoadTest/" + group)
            .Bind(3, ++optionSeq)
            .Bind(4, "Load test option " + std::to_string(index))
            .Bind(5, index % 1000)
            .Run();
        option.Reset();
    }
}

const bool scalable = BrixSim::RegisterScaleKey("options", {"advanced options", GrowOptions});

const bool registered = BrixSim::RegisterTables({
    "advanced",
    // Branches by full path; the root is "" and has no row.
    "CREATE TABLE IF NOT EXISTS adv_branches ("
    " path TEXT PRIMARY KEY, parent TEXT NOT NULL, name TEXT NOT NULL, seq INTEGER NOT NULL);"
    "CREATE INDEX IF NOT EXISTS adv_branches_parent ON adv_branches (parent, seq);"
    // kind: the kernel's implementation of the option (int, string, userint, userstring, or
    // opaque when its value handler is unavailable); type: 0 integer, 1 string.
    "CREATE TABLE IF NOT EXISTS adv_options ("
    " path TEXT PRIMARY KEY, branch TEXT NOT NULL, seq INTEGER NOT NULL, kind TEXT NOT NULL,"
    " type INTEGER NOT NULL, description TEXT NOT NULL,"
    " int_value INTEGER NOT NULL, int_default INTEGER NOT NULL, int_min INTEGER NOT NULL,"
    " int_max INTEGER NOT NULL,"
    " str_value TEXT NOT NULL, str_default TEXT NOT NULL, valid_chars TEXT NOT NULL,"
    " user_set INTEGER NOT NULL);"  // the value was set by the user, not reset since
    "CREATE INDEX IF NOT EXISTS adv_options_branch ON adv_options (branch, seq);",
    Seed,
});

}  // namespace

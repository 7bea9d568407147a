// The kernel's boot settings. SetOption changes the configured value; the running kernel
// keeps the value it started with until the host restarts.
#include "kernctl/KernelOpts.h"

#include <strings.h>

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/core/Boot.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"

using BrixSim::Store;
using HostCtl::Lib::HostCtlException;
using Type = HostCtl::System::KernelOption::OptionType;

namespace {

const BrixSim::Operation kGetOption{"KernCtl::System::KernelOpts::GetOption"};
const BrixSim::Operation kGetOptionDefault{"KernCtl::System::KernelOpts::GetOptionDefault"};
const BrixSim::Operation kGetOptionDescription{"KernCtl::System::KernelOpts::GetOptionDescription"};
const BrixSim::Operation kGetOptionNames{"KernCtl::System::KernelOpts::GetOptionNames"};
const BrixSim::Operation kGetOptionType{"KernCtl::System::KernelOpts::GetOptionType"};
const BrixSim::Operation kGetOptionTypeString{"KernCtl::System::KernelOpts::GetOptionTypeString"};
const BrixSim::Operation kGetRuntimeValue{"KernCtl::System::KernelOpts::GetRuntimeValue"};
const BrixSim::Operation kSetOption{"KernCtl::System::KernelOpts::SetOption"};

struct SettingSeed {
    const char* name;
    Type type;
    const char* defaultValue;
    const char* configured;
    const char* runtime;
    const char* description;
};

const SettingSeed kSettings[] = {
    {"bootConsole", Type::OPTION_STRING, "vga", "vga", "vga",
     "Device that shows the boot console: vga, com1 or com2"},
    {"kernelLogPort", Type::OPTION_STRING, "none", "com1", "com1",
     "Serial port that receives the kernel log"},
    {"debugLogPort", Type::OPTION_STRING, "none", "none", "none",
     "Serial port that receives debug messages"},
    {"gdbPort", Type::OPTION_STRING, "none", "none", "none",
     "Serial port of the kernel debugger stub"},
    {"deviceNamePolicy", Type::OPTION_STRING, "naa", "naa", "t10",
     "Identifier preferred when naming storage devices"},
    {"netConsoleTarget", Type::OPTION_STRING, "", "", "",
     "Address and port that receive the console over the network"},
    {"schedulerPolicy", Type::OPTION_STRING, "default", "default", "default",
     "Policy of the CPU scheduler at boot"},
    {"allowOversizedIo", Type::OPTION_BOOL, "FALSE", "FALSE", "FALSE",
     "Accept I/O requests larger than a device advertises"},
    {"disableHwRng", Type::OPTION_BOOL, "FALSE", "FALSE", "FALSE",
     "Do not use the hardware random number generator"},
    {"enableLargeBar", Type::OPTION_BOOL, "TRUE", "TRUE", "TRUE",
     "Map device memory windows above 4 GB"},
    {"ignoreMsixPrefetch", Type::OPTION_BOOL, "FALSE", "FALSE", "FALSE",
     "Ignore the prefetch bit of MSI-X tables"},
    {"iommuDisableIr", Type::OPTION_BOOL, "FALSE", "TRUE", "FALSE",
     "Turn off interrupt remapping in the IOMMU"},
    {"preferLegacyBoot", Type::OPTION_BOOL, "FALSE", "FALSE", "FALSE",
     "Prefer legacy firmware services to UEFI ones"},
    {"skipPciReset", Type::OPTION_BOOL, "FALSE", "FALSE", "FALSE",
     "Do not reset PCI devices while booting"},
    {"useUefiTimers", Type::OPTION_BOOL, "TRUE", "TRUE", "TRUE",
     "Calibrate timers with UEFI services"},
    {"debugHeapPoison", Type::OPTION_BOOL, "FALSE", "false", "no",
     "Fill freed heap memory with a poison pattern"},
    {"serialUntrusted", Type::OPTION_BOOL, "TRUE", "TRUE", "TRUE",
     "Ignore break sequences received on serial ports"},
    {"maxPcpus", Type::OPTION_UINT32, "576", "576", "576", "Physical CPUs the kernel brings up"},
    {"heapMinSizeMB", Type::OPTION_UINT32, "64", "64", "64", "Smallest kernel heap in megabytes"},
    {"dmaEngineTimeoutMs", Type::OPTION_UINT32, "2000", "2000", "2000",
     "Milliseconds before a DMA engine request times out"},
    {"kernelStackPages", Type::OPTION_UINT32, "4", "4", "4", "Pages of each kernel stack"},
    {"serialBaudRate", Type::OPTION_UINT32, "115200", "0x1c200", "115200",
     "Line speed of the serial console"},
    {"memMapMaxRanges", Type::OPTION_UINT32, "1024", "1024", "1024",
     "Firmware memory-map ranges the kernel accepts"},
    {"intrBalancingPeriodMs", Type::OPTION_UINT32, "100", "250", "250",
     "Milliseconds between two interrupt balancing passes at boot"},
    {"irqRebalanceShift", Type::OPTION_UINT8, "1", "257", "1",
     "Shift applied to interrupt load before rebalancing"},
    {"tscCalibrationRounds", Type::OPTION_UINT8, "3", "3", "3",
     "Rounds of time-stamp counter calibration"},
    {"memTierCount", Type::OPTION_UINT8, "1", "2", "1", "Memory tiers the kernel manages"},
    {"bootVerbosity", Type::OPTION_UINT8, "0", "0", "0", "Verbosity of boot messages"},
    {"timerSkewNs", Type::OPTION_INT32, "0", "0", "0",
     "Correction applied to the timer in nanoseconds"},
    {"clockDriftPpm", Type::OPTION_INT32, "0", "-12", "-12",
     "Known drift of the hardware clock in parts per million"},
    {"netBootRetries", Type::OPTION_INT32, "-1", "-1", "-1",
     "Retries of a network boot (-1: without end)"},
    {"acpiDebugLevel", Type::OPTION_INT32, "0", "0", "0", "Verbosity of the ACPI interpreter"},
    {"memReservedBytes", Type::OPTION_UINT64, "0", "0", "0",
     "Memory held back from the kernel in bytes"},
    {"kernelHeapLimitBytes", Type::OPTION_UINT64, "17179869184", "17179869184", "17179869184",
     "Largest total kernel heap in bytes"},
    {"maxIoSizeBytes", Type::OPTION_UINT64, "33554432", "33554432", "33554432",
     "Largest I/O request in bytes"},
    {"crashKernelBytes", Type::OPTION_UINT64, "268435456", "536870912", "268435456",
     "Memory reserved for the crash kernel in bytes"},
};

const bool registered = [] {
    return BrixSim::RegisterTables({
        "kernelopts",
        // runtime_boot: the boot whose running kernel uses `runtime`; in any later boot the
        // running kernel uses `configured`.
        "CREATE TABLE IF NOT EXISTS kernel_settings ("
        " name TEXT PRIMARY KEY COLLATE NOCASE, seq INTEGER NOT NULL, type INTEGER NOT NULL,"
        " description TEXT NOT NULL, configured TEXT NOT NULL, runtime TEXT NOT NULL,"
        " default_value TEXT NOT NULL, runtime_boot INTEGER NOT NULL);",
        [](Store& store) {
            store.Write([&] {
                auto insert = store.Prepare(
                    "INSERT INTO kernel_settings (name, seq, type, description, configured,"
                    " runtime, default_value, runtime_boot) VALUES (?, ?, ?, ?, ?, ?, ?, 0)");
                int64_t seq = 0;
                for (const auto& s : kSettings) {
                    insert.Bind(1, s.name).Bind(2, ++seq).Bind(3, static_cast<int>(s.type));
                    insert.Bind(4, s.description).Bind(5, s.configured).Bind(6, s.runtime);
                    insert.Bind(7, s.defaultValue).Run();
                    insert.Reset();
                }
            });
        },
    });
}();

// Reads an unsigned number written in decimal or in hexadecimal with "0x"; false when the
// text is anything else or does not fit in 64 bits.
bool ParseUnsigned(const std::string& text, uint64_t& value) {
    if (text.empty() || !std::isxdigit(static_cast<unsigned char>(text[0]))) return false;
    const bool hex = text.size() > 2 && text[0] == '0' && (text[1] == 'x' || text[1] == 'X');
    if (!hex && !std::all_of(text.begin(), text.end(),
                             [](unsigned char c) { return std::isdigit(c) != 0; })) {
        return false;
    }
    errno = 0;
    char* end = nullptr;
    value = std::strtoull(text.c_str(), &end, hex ? 16 : 10);
    return errno == 0 && end != nullptr && *end == '\0';
}

// The value as the setting's type accepts it, or throws.
std::string Validate(const KernCtl::System::KernelOpts::OptionInfo& info,
                     const std::string& value) {
    const auto refuse = [&](const std::string& expected) {
        return HostCtlException("Invalid value '" + CmdKit::MessageExcerpt(value) +
                                "' for kernel setting '" + info.name + "': expected " + expected);
    };
    uint64_t number = 0;
    switch (info.type) {
        case Type::OPTION_STRING:
            return value;
        case Type::OPTION_BOOL:
            if (strcasecmp(value.c_str(), "TRUE") == 0) return "TRUE";
            if (strcasecmp(value.c_str(), "FALSE") == 0) return "FALSE";
            throw refuse("TRUE or FALSE");
        case Type::OPTION_UINT32:
            if (!ParseUnsigned(value, number) || number > UINT32_MAX) {
                throw refuse("a number from 0 to 4294967295");
            }
            return value;
        case Type::OPTION_UINT8:
            if (!ParseUnsigned(value, number) || number > UINT8_MAX) {
                throw refuse("a number from 0 to 255");
            }
            return value;
        case Type::OPTION_INT32: {
            const bool negative = !value.empty() && value[0] == '-';
            const uint64_t limit = negative ? uint64_t{INT32_MAX} + 1 : uint64_t{INT32_MAX};
            if (!ParseUnsigned(negative ? value.substr(1) : value, number) || number > limit) {
                throw refuse("a number from -2147483648 to 2147483647");
            }
            return value;
        }
        case Type::OPTION_UINT64:
            if (!ParseUnsigned(value, number))
                throw refuse("a number from 0 to 18446744073709551615");
            return value;
    }
    throw refuse("a value of a known type");
}

}  // namespace

namespace KernCtl::System {

bool KernelOpts::CaseInsensitiveStringLessThan::operator()(const std::string& left,
                                                           const std::string& right) const {
    return strcasecmp(left.c_str(), right.c_str()) < 0;
}

KernelOpts::KernelOpts() = default;
KernelOpts::~KernelOpts() = default;

void KernelOpts::Load() {
    if (loaded_) return;
    auto& store = Store::Get();
    const int64_t boot = BrixSim::Kernel::CurrentBoot(store);
    auto row = store.Prepare(
        "SELECT name, type, description, configured, runtime, default_value, runtime_boot"
        " FROM kernel_settings ORDER BY seq");
    while (row.Step()) {
        OptionInfo info;
        info.name = row.Text(0);
        info.type = static_cast<Type>(row.Int(1));
        info.description = row.Text(2);
        info.configured = row.Text(3);
        info.runtime = row.Int(6) == boot ? row.Text(4) : info.configured;
        info.defaultValue = row.Text(5);
        options_.emplace(info.name, std::move(info));
    }
    loaded_ = true;
}

KernelOpts::OptionInfo& KernelOpts::Find(const std::string& name) {
    Load();
    const auto found = options_.find(name);
    if (found == options_.end())
        throw HostCtlException("Unknown kernel setting '" + CmdKit::MessageExcerpt(name) + "'");
    return found->second;
}

std::vector<std::string> KernelOpts::GetOptionNames() {
    Store::Get().Check(kGetOptionNames);
    Load();
    std::vector<std::string> names;
    names.reserve(options_.size());
    for (const auto& [name, info] : options_) names.push_back(info.name);
    return names;
}

HostCtl::System::KernelOption::OptionType KernelOpts::GetOptionType(const std::string& name) {
    Store::Get().Check(kGetOptionType);
    return Find(name).type;
}

std::string KernelOpts::GetOptionDescription(const std::string& name) {
    Store::Get().Check(kGetOptionDescription);
    return Find(name).description;
}

std::string KernelOpts::GetOption(const std::string& name) {
    Store::Get().Check(kGetOption);
    return Find(name).configured;
}

std::string KernelOpts::GetRuntimeValue(const std::string& name) {
    Store::Get().Check(kGetRuntimeValue);
    return Find(name).runtime;
}

std::string KernelOpts::GetOptionDefault(const std::string& name) {
    Store::Get().Check(kGetOptionDefault);
    return Find(name).defaultValue;
}

std::string KernelOpts::GetOptionTypeString(HostCtl::System::KernelOption::OptionType type) {
    Store::Get().Check(kGetOptionTypeString);
    switch (type) {
        case Type::OPTION_STRING:
            return "string";
        case Type::OPTION_BOOL:
            return "bool";
        case Type::OPTION_UINT32:
            return "uint32";
        case Type::OPTION_UINT8:
            return "uint8";
        case Type::OPTION_INT32:
            return "int32";
        case Type::OPTION_UINT64:
            return "uint64";
    }
    return "unknown";
}

void KernelOpts::SetOption(const std::string& name, const std::string& value) {
    auto& store = Store::Get();
    store.Check(kSetOption);
    store.Write([&] {
        loaded_ = false;  // read afresh inside the transaction
        options_.clear();
        auto& info = Find(name);
        const std::string stored = Validate(info, value);
        // The running kernel keeps what it started with: pin that before the change.
        store
            .Prepare(
                "UPDATE kernel_settings SET runtime = ?, runtime_boot = ?, configured = ?"
                " WHERE name = ?")
            .Bind(1, info.runtime)
            .Bind(2, BrixSim::Kernel::CurrentBoot(store))
            .Bind(3, stored)
            .Bind(4, info.name)
            .Run();
        store.JournalCall(kSetOption, {info.name, stored});
        info.configured = stored;
    });
}

}  // namespace KernCtl::System

// The host's management-service tool, run as /bin/mgmt-cmd:
//
//   mgmt-cmd hostsvc/maintenance_mode_enter TIMEOUT [MODE]
//   mgmt-cmd hostsvc/maintenance_mode_exit TIMEOUT [MODE]
//
// TIMEOUT is the time the operation may take, in seconds (0: no limit); MODE is the data action
// taken on distributed-storage disks before entering (noAction, ensureObjectAccessibility,
// evacuateAllData; default ensureObjectAccessibility), accepted and ignored when leaving.
// Exits 0 on success; otherwise prints the reason and exits 1 (2 for a usage error).
#include <charconv>
#include <cstdint>
#include <exception>
#include <iostream>
#include <string>
#include <vector>

#include "hostctl/HostCtlException.h"
#include "hostsim/identity/HostService.h"

namespace {

constexpr const char* kEnter = "hostsvc/maintenance_mode_enter";
constexpr const char* kExit = "hostsvc/maintenance_mode_exit";

// A call of the wrong shape gets the usage; a wrong value only the one line that names it, which
// is what the caller shows its user.
int Usage(const std::string& problem) {
    std::cerr << "mgmt-cmd: " << problem << "\n"
              << "Usage: mgmt-cmd " << kEnter << " TIMEOUT [MODE]\n"
              << "       mgmt-cmd " << kExit << " TIMEOUT [MODE]\n";
    return 2;
}

int BadValue(const std::string& problem) {
    std::cerr << "mgmt-cmd: " << problem << "\n";
    return 2;
}

bool ParseTimeout(const std::string& text, int64_t& seconds) {
    const char* end = text.data() + text.size();
    auto [ptr, ec] = std::from_chars(text.data(), end, seconds);
    return ec == std::errc() && ptr == end && seconds >= 0;
}

}  // namespace

int main(int argc, char** argv) {
    const std::vector<std::string> args(argv + 1, argv + argc);
    if (args.empty()) return Usage("missing command");
    const std::string& command = args[0];
    if (command != kEnter && command != kExit) return Usage("unknown command '" + command + "'");
    if (args.size() < 2 || args.size() > 3) return Usage("wrong number of arguments");
    int64_t timeout = 0;
    if (!ParseTimeout(args[1], timeout)) {
        return BadValue("invalid timeout '" + args[1] +
                        "': expected a number of seconds, 0 or more");
    }
    const std::string mode = args.size() > 2 ? args[2] : "ensureObjectAccessibility";
    if (!BrixSim::Maintenance::IsDornaMode(mode)) {
        return BadValue("invalid mode '" + mode +
                        "': expected noAction, ensureObjectAccessibility or evacuateAllData");
    }
    try {
        if (command == kEnter) {
            BrixSim::Maintenance::Enter(timeout, mode);
        } else {
            BrixSim::Maintenance::Exit(timeout);
        }
    } catch (const HostCtl::Lib::HostCtlException& error) {
        std::cerr << error.GetDetailedMessage() << "\n";
        return 1;
    } catch (const std::exception& error) {
        std::cerr << error.what() << "\n";
        return 1;
    }
    return 0;
}

// A symbolic link planted where the host writes a file is never followed out of the root: every
// file is written to a fresh temporary of an unpredictable name and renamed or linked into place,
// and the files opened in place refuse links.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "support/TestHost.h"

namespace {

namespace fs = std::filesystem;

std::string Read(const fs::path& file) {
    std::ostringstream text;
    text << std::ifstream(file).rdbuf();
    return text.str();
}

struct Plant {
    const char* hostPath;  // where the link is planted
    std::vector<std::string> command;
    int status;  // of the command
};

TEST(PlantedLink, NoWriteLeavesTheRoot) {
    const Plant plants[] = {
        {"etc/ostrel/snmp.xml", {"system", "snmp", "set", "--syslocation", "hall-3"}, 1},
        {"etc/ostrel/.snmp.xml.lock", {"system", "snmp", "set", "--syslocation", "hall-3"}, 1},
        // The unlink is refused and its result ignored, as for any unlink.
        {"var/tmp/snmp_boot.txt", {"system", "snmp", "set", "--engineid", "0x0102030405"}, 0},
        {"datastores/ds-local-01/coredump/planted.dumpfile",
         {"system", "coredump", "file", "add", "-d", "ds-local-01", "-f", "planted"},
         1},
    };
    for (const auto& plant : plants) {
        SCOPED_TRACE(plant.hostPath);
        BrixTest::TempHost host;
        const fs::path outside =
            host.Root().parent_path() / (host.Root().filename().string() + "-outside");
        std::ofstream(outside) << "not the host's";
        const fs::path link = host.Root() / plant.hostPath;
        fs::remove(link);
        fs::create_symlink(outside, link);

        const auto run = host.Cli(plant.command);
        EXPECT_EQ(run.status, plant.status) << run.err;
        EXPECT_EQ(Read(outside), "not the host's");
        // The place holds the link still, or a file of the host's own that replaced it.
        EXPECT_TRUE(fs::is_symlink(link) || fs::is_regular_file(fs::symlink_status(link)));
        fs::remove(outside);
    }
}

}  // namespace

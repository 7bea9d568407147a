// brixcli at its edges: a value as long as an argument can be, output that cannot be written, a
// plug-in folder that is not there, and where the built programs look for libraries.
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <sstream>

#include "Robustness.h"
#include "support/BuildTree.h"
#include "support/TestHost.h"

namespace {

namespace fs = std::filesystem;

// The longest value one argument can hold (the kernel's limit is 128 KiB).
const std::string kLongHex(131000, '0');

TEST(ToolEdges, LongValueIsRefusedOrReportedNeverCrashes) {
    BrixTest::TempHost host;
    const auto before = host.Export();
    auto run = host.Cli({"system", "snmp", "set", "--engineid", kLongHex + "g"});
    EXPECT_EQ(run.status, 2);
    EXPECT_EQ(run.err, "Error: Invalid value for --engineid: " + std::string(128, '0') +
                           "... (131001 bytes) does not match the pattern (0x|0X|)[0-9a-fA-F:]+\n");
    run = host.Cli({"system", "snmp", "set", "--engineid", kLongHex});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "Option engineid maximum length is 32 characters.\n");
    EXPECT_EQ(host.Export(), before);
}

struct WriteFault {
    const char* name;
    const char* redirection;  // of standard output, for sh
    const char* reason;
};

// Output that is lost is an error, whether it fails at the last flush (a short answer) or while
// the listing is written (a long one), in every tool: a backup cut short must not look complete.
TEST(ToolEdges, OutputThatCannotBeWrittenFailsTheRun) {
    BrixTest::TempHost host;
    const std::vector<WriteFault> faults = {
        {"full device", ">/dev/full", "No space left on device"},
        {"closed", ">&-", "Bad file descriptor"}};
    const std::string root = host.Root().string();
    const std::vector<std::pair<std::string, std::vector<std::string>>> invocations = {
        {"brixcli", {"system", "uuid", "get"}},
        {"brixcli", {"--list-commands"}},
        {"brixcli", {"--formatter=json", "system", "process", "list"}},
        {"brixsim", {"--root", root, "export"}},
        {"brixsim", {"--root", root, "fault", "ops"}},
        {"brixsim", {"--help"}}};
    for (const auto& fault : faults) {
        for (const auto& [tool, args] : invocations) {
            std::vector<std::string> argv = {"sh", "-c",
                                             std::string("exec \"$0\" \"$@\" ") + fault.redirection,
                                             BrixRobust::Program(tool)};
            argv.insert(argv.end(), args.begin(), args.end());
            const auto run = BrixTest::Run(argv);
            EXPECT_EQ(run.status, 1) << fault.name << " " << tool << " " << args.back();
            EXPECT_EQ(run.err, tool + ": cannot write the output: " + fault.reason + "\n")
                << fault.name << " " << tool << " " << args.back();
        }
    }
}

// A copy of the tool in a folder of its own finds its library through its RUNPATH, and says
// where it looked for plug-ins when that folder is missing; so does a folder given by the
// environment.
TEST(ToolEdges, MissingPluginFolderIsNamed) {
    const fs::path work = fs::temp_directory_path() / ("brixcli-edges-" + std::to_string(getpid()));
    fs::remove_all(work);
    fs::create_directories(work / "bin");
    fs::create_directories(work / "lib");
    fs::copy_file(BrixRobust::Program("brixcli"), work / "bin" / "brixcli");
    fs::create_symlink(BrixTest::BuildDir() / "lib" / "libcmdkit.so",
                       work / "lib" / "libcmdkit.so");
    const std::string unknown =
        "Error: Unknown command or namespace system\nValid choices: (none)\n";

    auto run = BrixTest::Run({"env", "-u", "BRIXCLI_PLUGIN_DIR",
                              (work / "bin" / "brixcli").string(), "system", "uuid", "get"});
    EXPECT_EQ(run.status, 2);
    EXPECT_EQ(run.err, "brixcli: cannot read the plug-in folder " +
                           (work / "lib" / "brixcli" / "plugins").string() +
                           ": No such file or directory\n" + unknown);

    run = BrixTest::Run({"env", "BRIXCLI_PLUGIN_DIR=" + (work / "none").string(),
                         BrixRobust::Program("brixcli"), "system", "uuid", "get"});
    EXPECT_EQ(run.status, 2);
    EXPECT_EQ(run.err, "brixcli: cannot read the plug-in folder " + (work / "none").string() +
                           ": No such file or directory\n" + unknown);
    fs::remove_all(work);
}

// Every built program and library looks for libraries only in absolute folders or relative to
// itself: never in an empty or relative entry, which means the current folder.
TEST(ToolEdges, RunPathsNeverNameTheCurrentFolder) {
    int checked = 0;
    for (const char* folder : {"bin", "lib"}) {
        for (const auto& entry : fs::recursive_directory_iterator(BrixTest::BuildDir() / folder)) {
            if (!entry.is_regular_file()) continue;
            char magic[4] = {};
            std::ifstream(entry.path(), std::ios::binary).read(magic, sizeof magic);
            if (std::string(magic, 4) !=
                "\x7f"
                "ELF")
                continue;
            const auto run = BrixTest::Run({"readelf", "-d", entry.path().string()});
            ASSERT_EQ(run.status, 0) << run.err;
            std::istringstream lines(run.out);
            for (std::string line; std::getline(lines, line);) {
                const auto open = line.find("Library runpath: [");
                const auto openOld = line.find("Library rpath: [");
                if (open == std::string::npos && openOld == std::string::npos) continue;
                const auto start = line.find('[') + 1;
                std::string paths = line.substr(start, line.rfind(']') - start) + ":";
                for (size_t at = 0, colon; (colon = paths.find(':', at)) != std::string::npos;
                     at = colon + 1) {
                    const std::string path = paths.substr(at, colon - at);
                    EXPECT_TRUE(path.rfind("/", 0) == 0 || path.rfind("$ORIGIN", 0) == 0)
                        << entry.path() << ": entry '" << path << "' in " << line;
                }
                ++checked;
            }
        }
    }
    EXPECT_GT(checked, 3);
}

}  // namespace

// The installed layout: `cmake --install` into a prefix, the example plug-in built against that
// prefix with find_package(brixcli) and installed into its plug-in folder, then the INSTALLED
// programs run on a temporary host.
#include <gtest/gtest.h>

#include <filesystem>

#include "support/BuildTree.h"
#include "support/TestHost.h"

namespace {

namespace fs = std::filesystem;

std::string Describe(const std::vector<std::string>& argv, const BrixTest::RunResult& run) {
    std::string line;
    for (const auto& arg : argv) line += (line.empty() ? "" : " ") + arg;
    return line + " exited " + std::to_string(run.status) + "\n" + run.out + run.err;
}

// Installs the build into a prefix, then builds the example plug-in against that prefix and
// installs it into the prefix's plug-in folder. The folder is under the build tree, at a fixed
// place, so the example's compilations hit ccache on later runs. Empty when all went well,
// otherwise the failed step and its output.
std::string Install(const fs::path& work, const fs::path& prefix) {
    std::error_code ec;
    fs::remove_all(work, ec);
    fs::create_directories(work);

    const std::string cmake = BrixTest::CacheValue("CMAKE_COMMAND");
    const fs::path example = BrixTest::SourceDir() / "examples" / "hello-plugin";
    const fs::path exampleBuild = work / "hello-build";
    std::vector<std::string> configure = {
        cmake,
        "-S",
        example.string(),
        "-B",
        exampleBuild.string(),
        "-G",
        BrixTest::CacheValue("CMAKE_GENERATOR"),
        "-DCMAKE_PREFIX_PATH=" + prefix.string(),
        "-DCMAKE_CXX_COMPILER=" + BrixTest::CacheValue("CMAKE_CXX_COMPILER"),
        "-DCMAKE_BUILD_TYPE=Release"};
    if (const auto make = BrixTest::CacheValue("CMAKE_MAKE_PROGRAM"); !make.empty()) {
        configure.push_back("-DCMAKE_MAKE_PROGRAM=" + make);
    }
    if (const auto ccache = BrixTest::CacheValue("CCACHE_PROGRAM");
        !ccache.empty() && ccache.find("NOTFOUND") == std::string::npos) {
        configure.push_back("-DCMAKE_CXX_COMPILER_LAUNCHER=" + ccache);
    }
    const std::vector<std::vector<std::string>> steps = {
        {cmake, "--install", BrixTest::BuildDir().string(), "--prefix", prefix.string()},
        configure,
        {cmake, "--build", exampleBuild.string()},
        {cmake, "--install", exampleBuild.string(), "--prefix", prefix.string()},
    };
    for (const auto& step : steps) {
        const auto run = BrixTest::Run(step);
        if (run.status != 0) return Describe(step, run);
    }
    return "";
}

// Runs an installed program with nothing pointing it at the build tree.
BrixTest::RunResult RunInstalled(const fs::path& prefix, const std::string& program,
                                 const std::vector<std::string>& args) {
    std::vector<std::string> argv = {"env",
                                     "-u",
                                     "BRIXCLI_PLUGIN_DIR",
                                     "-u",
                                     "BRIXSIM_PROGRAM_DIR",
                                     (prefix / "bin" / program).string()};
    argv.insert(argv.end(), args.begin(), args.end());
    return BrixTest::Run(argv);
}

void CheckLayout(const fs::path& prefix) {
    for (const char* file :
         {"bin/brixcli", "bin/brixsim", "bin/brixsim-mgmt-cmd", "lib/libcmdkit.so",
          "lib/libbrixhost.so", "lib/brixcli/plugins/libbrixcli-system.so",
          "lib/brixcli/plugins/libbrixcli-hello.so", "include/cmdkit/AutoCli.h",
          "include/cmdkit/CallSpec.h", "include/cmdkit/MetaObj.h", "include/cmdkit/Cli.h",
          "include/cmdkit/CmdKitException.h", "lib/cmake/brixcli/brixcliConfig.cmake"}) {
        EXPECT_TRUE(fs::is_regular_file(prefix / file)) << file;
    }
}

// The installed files find their libraries relative to themselves, never in the build tree.
void CheckRunPaths(const fs::path& prefix) {
    const std::vector<std::pair<std::string, std::string>> expected = {
        {"bin/brixcli", "$ORIGIN/../lib"},
        {"bin/brixsim", "$ORIGIN/../lib"},
        {"bin/brixsim-mgmt-cmd", "$ORIGIN/../lib"},
        {"lib/libcmdkit.so", "$ORIGIN/../lib"},
        {"lib/libbrixhost.so", "$ORIGIN/../lib"},
        {"lib/brixcli/plugins/libbrixcli-system.so", "$ORIGIN/../.."},
        {"lib/brixcli/plugins/libbrixcli-hello.so", "$ORIGIN/../.."},
    };
    for (const auto& [file, runPath] : expected) {
        const auto run = BrixTest::Run({"readelf", "-d", (prefix / file).string()});
        ASSERT_EQ(run.status, 0) << run.err;
        EXPECT_NE(run.out.find("Library runpath: [" + runPath + "]"), std::string::npos)
            << file << ":\n"
            << run.out;
    }
}

void CheckExamplePlugin(const fs::path& prefix) {
    auto run = RunInstalled(prefix, "brixcli", {"hello", "greet", "--name", "Ada"});
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, "Hello, Ada!\n");
    EXPECT_EQ(run.err, "");

    run = RunInstalled(prefix, "brixcli", {"--formatter=json", "hello", "greet", "-n", "Ada"});
    EXPECT_EQ(run.out, "\"Hello, Ada!\"\n");

    run = RunInstalled(prefix, "brixcli", {"hello", "greet"});
    EXPECT_EQ(run.status, 2);
    EXPECT_EQ(run.err, "Error: Missing required parameter -n|--name\n");
}

void CheckSystemPlugin(const fs::path& prefix, const BrixTest::TempHost& host) {
    const auto built = host.Cli({"system", "uuid", "get"});
    ASSERT_EQ(built.status, 0) << built.err;
    const auto run = RunInstalled(prefix, "brixcli", {"system", "uuid", "get"});
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, built.out);
}

// Maintenance mode runs the host's /bin/mgmt-cmd, which runs the installed brixsim-mgmt-cmd.
void CheckHostPrograms(const fs::path& prefix) {
    auto run =
        RunInstalled(prefix, "brixcli", {"system", "maintenanceMode", "set", "--enable", "true"});
    EXPECT_EQ(run.status, 0) << run.err;
    run = RunInstalled(prefix, "brixcli", {"system", "maintenanceMode", "get"});
    EXPECT_EQ(run.out, "Enabled\n");
    run = RunInstalled(prefix, "brixsim", {"journal"});
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_NE(run.out.find("{\"kind\":\"exec\",\"argv\":[\"/bin/mgmt-cmd\""), std::string::npos)
        << run.out;
    EXPECT_NE(run.out.find("\"status\":0}"), std::string::npos) << run.out;
}

void CheckBothBranchesListed(const fs::path& prefix) {
    auto run = RunInstalled(prefix, "brixcli", {"--help"});
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_NE(run.out.find("\n  hello "), std::string::npos) << run.out;
    EXPECT_NE(run.out.find("\n  system "), std::string::npos) << run.out;

    run = RunInstalled(prefix, "brixcli", {"--completion", "bash"});
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_NE(run.out.find("[$'brixcli']=$'hello\\nsystem'"), std::string::npos);
    EXPECT_NE(run.out.find("[$'brixcli hello greet']=$'--name\\n-n'"), std::string::npos);
}

// One test: ctest runs each test in its own process, and the installation is done once.
TEST(Install, InstalledToolServesTheSystemAndTheExamplePlugin) {
    const fs::path work = BrixTest::BuildDir() / "test-install";
    const fs::path prefix = work / "prefix";
    ASSERT_EQ(Install(work, prefix), "");
    BrixTest::TempHost host;
    {
        SCOPED_TRACE("Layout");
        CheckLayout(prefix);
    }
    {
        SCOPED_TRACE("RunPaths");
        CheckRunPaths(prefix);
    }
    {
        SCOPED_TRACE("ExamplePlugin");
        CheckExamplePlugin(prefix);
    }
    {
        SCOPED_TRACE("SystemPlugin");
        CheckSystemPlugin(prefix, host);
    }
    {
        SCOPED_TRACE("HostPrograms");
        CheckHostPrograms(prefix);
    }
    {
        SCOPED_TRACE("BothBranchesListed");
        CheckBothBranchesListed(prefix);
    }
}

}  // namespace

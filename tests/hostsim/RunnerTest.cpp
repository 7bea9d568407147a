// Host command lines run through the framework reach programs under the host root, with their
// output captured and the run journaled.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>
#include <fstream>

#include "cmdkit/AutoCli.h"
#include "hostsim/core/Store.h"
#include "support/TestHost.h"

namespace {

namespace fs = std::filesystem;
using CmdKit::AutoCli::AutoCli_ShellCmdWithKvUsername;

void WriteProgram(const fs::path& path, const std::string& script) {
    fs::create_directories(path.parent_path());
    std::ofstream(path) << script;
    fs::permissions(path, fs::perms::owner_all);
}

TEST(Runner, RunsHostProgramsAndJournalsThem) {
    BrixTest::TempHost host;
    const fs::path root = BrixSim::Store::Get().Root();
    WriteProgram(root / "bin/greet",
                 "#!/bin/sh\necho \"hello $1 $2\"\necho \"root=$BRIX_HOST_ROOT\" >&2\nexit 3\n");
    WriteProgram(root / "bin/ok", "#!/bin/sh\necho fine\n");
    std::ofstream(root / "bin/plain") << "not a program\n";
    fs::create_symlink("/bin/true", root / "bin/outside");

    struct Case {
        const char* line;
        int status;
        std::string output;
    };
    const Case cases[] = {
        {"/bin/greet  alpha   beta", 3, "hello alpha beta\nroot=" + host.Root().string() + "\n"},
        {"/bin/ok", 0, "fine\n"},
        {"/bin/missing now", 127, "Cannot run /bin/missing: No such file or directory"},
        {"/bin/plain", 126, "Cannot run /bin/plain: Permission denied"},
        {"/bin/outside", 126, "Cannot run /bin/outside: Permission denied"},
        {"/../bin/true", 126, "Cannot run /../bin/true: Permission denied"},
        {"ok", 127, "Cannot run ok: not an absolute host path"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.line);
        std::string output = "stale";
        EXPECT_EQ(AutoCli_ShellCmdWithKvUsername(c.line, "alice", output, ""), c.status);
        EXPECT_EQ(output, c.output);
    }

    const auto journal = host.Journal();
    ASSERT_EQ(journal.size(), std::size(cases));
    EXPECT_EQ(journal[0], (nlohmann::json{{"kind", "exec"},
                                          {"argv", {"/bin/greet", "alpha", "beta"}},
                                          {"user", "alice"},
                                          {"status", 3}}));
    EXPECT_EQ(journal[2]["status"], 127);
    EXPECT_EQ(journal[2]["argv"], (nlohmann::json{"/bin/missing", "now"}));
}

}  // namespace

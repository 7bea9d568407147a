// A handful of representative commands under valgrind's memcheck: no memory error and no
// definite or indirect leak. Skipped in a sanitizer build (its programs cannot run under
// valgrind) and where valgrind is not installed.
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <ostream>
#include <sstream>
#include <string>
#include <vector>

#include "Robustness.h"
#include "support/BuildTree.h"
#include "support/TestHost.h"

#if defined(__SANITIZE_ADDRESS__)
#define BRIX_SANITIZED 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define BRIX_SANITIZED 1
#endif
#endif

namespace {

using BrixTest::TempHost;

std::string FindValgrind() {
    const char* path = getenv("PATH");
    std::istringstream folders(path ? path : "/usr/bin:/bin");
    for (std::string folder; std::getline(folders, folder, ':');) {
        const std::string candidate = folder + "/valgrind";
        if (access(candidate.c_str(), X_OK) == 0) return candidate;
    }
    return "";
}

struct Case {
    const char* name;
    const char* line;
    int status;            // the command's own exit status
    const char* err = "";  // its whole standard error
};

// Names the case in test listings.
void PrintTo(const Case& item, std::ostream* out) {
    *out << item.line;
}

class Valgrind : public ::testing::TestWithParam<Case> {};

TEST_P(Valgrind, RunsWithoutMemoryErrorsOrLeaks) {
#ifdef BRIX_SANITIZED
    GTEST_SKIP() << "sanitizer build";
#endif
    const std::string valgrind = FindValgrind();
    if (valgrind.empty()) GTEST_SKIP() << "valgrind is not installed";
    TempHost host;
    ASSERT_EQ(host.Cli({"system", "uuid", "get"}).status, 0);  // seeds the host

    std::vector<std::string> argv{
        valgrind,
        "--quiet",
        "--leak-check=full",
        "--errors-for-leak-kinds=definite,indirect",
        "--show-leak-kinds=definite,indirect",
        "--error-exitcode=99",
        "--suppressions=" +
            (BrixTest::SourceDir() / "tests" / "robustness" / "valgrind.supp").string(),
        BrixRobust::Program("brixcli")};
    for (const auto& word : BrixRobust::Words(GetParam().line)) argv.push_back(word);
    const auto run = BrixTest::Run(argv);
    // With --quiet valgrind prints only what it finds, so the command's own error stays alone.
    EXPECT_EQ(run.status, GetParam().status) << run.err;
    EXPECT_EQ(run.err, GetParam().err);
}

INSTANTIATE_TEST_SUITE_P(
    Commands, Valgrind,
    ::testing::Values(Case{"Getter", "system uuid get", 0},
                      Case{"JsonListing", "--formatter=json system module list", 0},
                      Case{"Setter", "system hostname set --host node7", 0},
                      Case{"FileSetter", "system snmp set --syslocation 'Hall 9'", 0},
                      Case{"Help", "system settings advanced set --help", 0},
                      Case{"ErrorPath", "system module get --module nosuchmodule", 1,
                           "unknown module 'nosuchmodule'\n"},
                      Case{"PatternRefusal", "system snmp set --engineid 0x12:zz", 2,
                           "Error: Invalid value for --engineid: 0x12:zz does not match the "
                           "pattern (0x|0X|)[0-9a-fA-F:]+\n"}),
    [](const ::testing::TestParamInfo<Case>& info) { return std::string(info.param.name); });

}  // namespace

// Batch mode: many command lines in one process, and --version.
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <nlohmann/json.hpp>

#include "FakeCommand.h"
#include "brixcli/SystemPlugin.h"
#include "support/BuildTree.h"
#include "support/TestHost.h"

namespace CmdKitTest {
namespace {

namespace fs = std::filesystem;

// Echoes --message; --fail adds an error and still answers.
std::shared_ptr<AutoCli::Namespace> EchoTree() {
    auto command = FakeCommand::New(
        [] {
            auto spec = CallSpec::InputSpec::New();
            spec->AddParameter(Param("message", CallSpec::PARAM_STRING, "m"));
            spec->AddParameter(Param("fail", CallSpec::PARAM_FLAG));
            return spec;
        },
        MetaObj::MetaString::New(),
        [](CallSpec::Input& input, CallSpec::Output& output) {
            if (input.IsFlagSet("fail")) output.AddErrorMessage("went wrong");
            output.SetRootObject(MetaObj::MetaString::New(input.GetParameter("message")));
            output.SetComplete();
        });
    return TreeWith(command);
}

// Runs `lines` as a batch file through RunCli with the global options `globals`.
CliRun Batch(const std::shared_ptr<AutoCli::NamespaceNode>& root, const std::string& lines,
             std::vector<std::string> globals = {}) {
    const fs::path file = fs::temp_directory_path() / ("batch-" + std::to_string(getpid()));
    std::ofstream(file) << lines;
    globals.insert(globals.end(), {"--batch", file.string()});
    auto run = Invoke(root, globals);
    fs::remove(file);
    return run;
}

struct QuotingCase {
    std::string line;
    int status;
    std::string out;
    std::string err;
};

void PrintTo(const QuotingCase& row, std::ostream* out) {
    *out << row.line;
}

class BatchQuoting : public testing::TestWithParam<QuotingCase> {};

TEST_P(BatchQuoting, SplitsLikeAShell) {
    const auto& expected = GetParam();
    auto run = Batch(EchoTree(), expected.line + "\n");
    EXPECT_EQ(run.status, expected.status) << expected.line;
    EXPECT_EQ(run.out, expected.out) << expected.line;
    EXPECT_EQ(run.err, expected.err) << expected.line;
}

INSTANTIATE_TEST_SUITE_P(
    Table, BatchQuoting,
    testing::Values(
        QuotingCase{"a b cmd -m 'two  words'", 0, "two  words\n", ""},
        QuotingCase{R"(a b cmd -m "say \"hi\" \\ \n")", 0, "say \"hi\" \\ \\n\n", ""},
        QuotingCase{R"(a b cmd -m two\ words)", 0, "two words\n", ""},
        QuotingCase{R"(a b cmd -m 'it'\''s' --fail)", 1, "it's\n", "line 1: went wrong\n"},
        QuotingCase{"a b cmd --message=\"a b\"c", 0, "a bc\n", ""},
        QuotingCase{"a b cmd -m \"\"", 0, "\n", ""},
        QuotingCase{"\ta b cmd -m '$HOME #x'  ", 0, "$HOME #x\n", ""},
        QuotingCase{"a b cmd -m 'open", 2, "", "line 1: Error: Unmatched ' in the line\n"},
        QuotingCase{"a b cmd -m \"open", 2, "", "line 1: Error: Unmatched \" in the line\n"},
        QuotingCase{"a b cmd -m x\\", 2, "", "line 1: Error: The line ends with a backslash\n"}));

constexpr const char* kMixed =
    "# a comment, then a blank line\n"
    "\n"
    "a b cmd -m one\n"
    "a b cmd -m two --fail\n"
    "a b cmd --bogus\n"
    "  # an indented comment\n"
    "a b cmd -m three\n";

TEST(Batch, AFailingLineDoesNotStopTheRestAndTheWorstStatusWins) {
    auto run = Batch(EchoTree(), kMixed);
    EXPECT_EQ(run.status, 2);
    EXPECT_EQ(run.out, "one\ntwo\nthree\n");
    EXPECT_EQ(run.err, "line 4: went wrong\nline 5: Error: Unknown option --bogus\n");
}

TEST(Batch, StopOnErrorEndsAtTheFirstFailingLine) {
    auto run = Batch(EchoTree(), kMixed, {"--stop-on-error"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.out, "one\ntwo\n");
    EXPECT_EQ(run.err, "line 4: went wrong\n");
}

TEST(Batch, JsonWritesOneDocumentALine) {
    auto run = Batch(EchoTree(), std::string(kMixed) + "a b cmd --formatter=table -m four\na\n",
                     {"--formatter=json"});
    EXPECT_EQ(run.status, 2);
    EXPECT_EQ(run.err, "");
    std::vector<nlohmann::json> documents;
    std::istringstream lines(run.out);
    for (std::string line; std::getline(lines, line);) {
        documents.push_back(nlohmann::json::parse(line));
    }
    using nlohmann::json;
    ASSERT_EQ(documents.size(), 6u) << run.out;
    const json missing = documents[5];
    documents.pop_back();
    EXPECT_EQ(documents, (std::vector<json>{
                             {{"line", 3},
                              {"input", "a b cmd -m one"},
                              {"status", 0},
                              {"messages", json::array()},
                              {"result", "one"}},
                             {{"line", 4},
                              {"input", "a b cmd -m two --fail"},
                              {"status", 1},
                              {"messages", {"went wrong"}},
                              {"result", "two"}},
                             {{"line", 5},
                              {"input", "a b cmd --bogus"},
                              {"status", 2},
                              {"messages", {"Error: Unknown option --bogus"}},
                              {"result", nullptr}},
                             {{"line", 7},
                              {"input", "a b cmd -m three"},
                              {"status", 0},
                              {"messages", json::array()},
                              {"result", "three"}},
                             {{"line", 8},
                              {"input", "a b cmd --formatter=table -m four"},
                              {"status", 0},
                              {"messages", json::array()},
                              {"result", "four"}},
                         }));
    EXPECT_EQ(missing["status"], 2);
    EXPECT_EQ(missing["messages"][0].get<std::string>().rfind("Error: Missing command after a\n\n"
                                                              "Usage: ",
                                                              0),
              0u);
}

TEST(Batch, RefusesWhatABatchCannotTake) {
    auto tree = EchoTree();
    EXPECT_EQ(Invoke(tree, {"--batch", "/nonexistent/batch"}).err,
              "Error: Cannot read /nonexistent/batch: No such file or directory\n");
    EXPECT_EQ(Invoke(tree, {"--batch", "f", "a"}).err, "Error: Unexpected argument a\n");
    EXPECT_EQ(Invoke(tree, {"--batch", "f", "--help"}).err,
              "Error: --batch takes only --formatter and --stop-on-error\n");
    EXPECT_EQ(Invoke(tree, {"a", "b", "cmd", "--stop-on-error"}).err,
              "Error: --stop-on-error needs --batch\n");
    EXPECT_EQ(Invoke(tree, {"--verbose"}).err, "Error: --verbose needs --version\n");
    auto nested = Batch(tree, "--batch other\n");
    EXPECT_EQ(nested.status, 2);
    EXPECT_EQ(nested.err, "line 1: Error: --batch cannot be used in a batch\n");
}

// The real tool against a host: what separate invocations would do, in one process.
TEST(BatchOnHost, EachLineSeesTheLinesBeforeItAndIsJournalled) {
    BrixTest::TempHost host;
    auto run = host.Cli({"--batch", "-"},
                        "system welcomemsg set --message 'Hello \"there\"'\n"
                        "system welcomemsg get\n");
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, "true\nHello \"there\"\n");
    const auto journal = host.Journal();
    ASSERT_FALSE(journal.empty());
    EXPECT_EQ(journal.back()["args"], nlohmann::json::array({"Hello \"there\""}));
}

TEST(BatchOnHost, AFaultForOneCallFailsOneLine) {
    BrixTest::TempHost host;
    host.Fault("KernCtl::System::SystemInfoImpl::GetSystemUuid", "uuid unreadable", 1);
    auto run = host.Cli({"--formatter=json", "--batch", "-"}, "system uuid get\nsystem uuid get\n");
    EXPECT_EQ(run.status, 1);
    std::istringstream lines(run.out);
    std::string first, second;
    std::getline(lines, first);
    std::getline(lines, second);
    EXPECT_EQ(nlohmann::json::parse(first)["messages"], nlohmann::json::array({"uuid unreadable"}));
    EXPECT_EQ(nlohmann::json::parse(second)["status"], 0);
    EXPECT_EQ(host.Sim({"fault", "list"}).out, "");
}

// A line sees what another process changed after the line before it: the batch holds no
// transaction and no cached state between its lines.
TEST(BatchOnHost, ALineSeesAnotherProcessesChange) {
    BrixTest::TempHost host;
    auto root = AutoCli::Namespace::New();
    AutoCli_RegisterNamespaces(root);
    auto other = FakeCommand::New(
        nullptr, MetaObj::MetaBool::New(), [&](CallSpec::Input&, CallSpec::Output& output) {
            auto set = host.Cli({"system", "welcomemsg", "set", "-m", "from elsewhere"});
            output.SetRootObject(MetaObj::MetaBool::New(set.status == 0));
        });
    root->SubNamespace("other")->RegisterNamespaceNode(other, "set");
    auto run = Batch(root, "system welcomemsg get\nother set\nsystem welcomemsg get\n");
    EXPECT_EQ(run.status, 0) << run.err;
    const auto lines = run.out.substr(run.out.find('\n') + 1);
    EXPECT_EQ(lines, "true\nfrom elsewhere\n");
}

TEST(Version, BothToolsAnswer) {
    BrixTest::TempHost host;
    auto cli = host.Cli({"--version"});
    EXPECT_EQ(cli.status, 0);
    EXPECT_EQ(cli.out, "brixcli " BRIX_VERSION "\n");
    auto verbose = host.Cli({"--version", "--verbose"});
    EXPECT_EQ(verbose.status, 0);
    EXPECT_EQ(verbose.out,
              "brixcli " BRIX_VERSION "\nPlug-ins:\n  " +
                  fs::canonical(BrixTest::BuildDir() / "lib/brixcli/plugins").string() +
                  "/libbrixcli-system.so\n");
    auto sim = host.Sim({"--version"});
    EXPECT_EQ(sim.status, 0);
    EXPECT_EQ(sim.out, "brixsim " BRIX_VERSION "\n");
}

}  // namespace
}  // namespace CmdKitTest

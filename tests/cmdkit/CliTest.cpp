// Invocations end to end through RunCli: paths, global options, exit statuses, help.
#include <gtest/gtest.h>
#include <pwd.h>
#include <unistd.h>

#include <nlohmann/json.hpp>

#include "FakeCommand.h"

namespace CmdKitTest {
namespace {

std::shared_ptr<CallSpec::InputSpec> MessageSpec() {
    auto spec = CallSpec::InputSpec::New();
    auto message = Param("message", CallSpec::PARAM_STRING, "m", true);
    message->SetDescription("The message.");
    spec->AddParameter(message);
    spec->AddParameter(Param("fail", CallSpec::PARAM_FLAG));
    spec->AddParameter(Param("throw", CallSpec::PARAM_FLAG));
    spec->AddParameter(Param("count", CallSpec::PARAM_INT));
    spec->AddParameter(Param("bounce", CallSpec::PARAM_FLAG));
    return spec;
}

// Echoes --message; --fail adds two errors (and still answers), --throw throws, --bounce
// answers only an error that quotes the message as it is.
std::shared_ptr<FakeCommand> Echo() {
    auto command = FakeCommand::New(
        MessageSpec, MetaObj::MetaString::New(),
        [](CallSpec::Input& input, CallSpec::Output& output) {
            if (input.IsFlagSet("throw")) {
                output.AddErrorMessage("first");
                throw std::runtime_error("boom");
            }
            if (input.IsFlagSet("bounce")) {
                output.AddErrorMessage("bad: " + input.GetParameter("message"));
                return;
            }
            if (input.IsFlagSet("fail")) {
                output.AddErrorMessage("went wrong");
                output.AddErrorMessage("Error 2, as added.");
            }
            output.SetRootObject(MetaObj::MetaString::New(input.GetParameter("message")));
            output.SetComplete();
        });
    command->SetDescription("Echo a message.");
    return command;
}

struct Case {
    std::vector<std::string> args;
    int status;
    std::string out;
    std::string err;
};

void PrintTo(const Case& row, std::ostream* out) {
    PrintWords(row.args, out);
}

class Invocation : public testing::TestWithParam<Case> {};

TEST_P(Invocation, PrintsAndExits) {
    const auto& expected = GetParam();
    auto run = Invoke(TreeWith(Echo()), expected.args);
    EXPECT_EQ(run.status, expected.status);
    EXPECT_EQ(run.out, expected.out);
    EXPECT_EQ(run.err, expected.err);
}

INSTANTIATE_TEST_SUITE_P(
    Table, Invocation,
    testing::Values(
        Case{{"a", "b", "cmd", "-m", "hi"}, 0, "hi\n", ""},
        Case{{"--formatter=json", "a", "b", "cmd", "-m", "hi"}, 0, "\"hi\"\n", ""},
        Case{{"--formatter", "json", "a", "b", "cmd", "-m", "hi"}, 0, "\"hi\"\n", ""},
        Case{{"a", "b", "cmd", "-m", "hi", "--formatter", "json"}, 0, "\"hi\"\n", ""},
        Case{{"a", "b", "cmd", "--formatter=json", "-m", "hi"}, 0, "\"hi\"\n", ""},
        // A value word that looks like a global option belongs to its option.
        Case{{"a", "b", "cmd", "-m", "--help"}, 0, "--help\n", ""},
        Case{{"a", "b", "cmd", "-m", "--formatter=json"}, 0, "--formatter=json\n", ""},
        Case{
            {"a", "b", "cmd", "-m", "hi", "--fail"}, 1, "hi\n", "went wrong\nError 2, as added.\n"},
        Case{{"a", "b", "cmd", "-m", "hi", "--throw"}, 1, "", "first\nError: boom\n"},
        Case{{"a", "b", "cmd"}, 2, "", "Error: Missing required parameter -m|--message\n"},
        Case{{"a", "b", "cmd", "-m", "x", "--bogus"}, 2, "", "Error: Unknown option --bogus\n"},
        Case{{"a", "b", "cmd", "-m", "x", "extra"}, 2, "", "Error: Unexpected argument extra\n"},
        Case{{"a", "b", "cmd", "-m", "x", "--count", "1e3"},
             2,
             "",
             "Error: Invalid value for --count: 1e3 is not an integer\n"},
        Case{{"--formatter=yaml", "a", "b", "cmd", "-m", "x"},
             2,
             "",
             "Error: Unknown formatter yaml (one of: simple, table, json, xml, csv, keyvalue)\n"},
        Case{{"a", "b", "cmd", "-m", "x", "--formatter"},
             2,
             "",
             "Error: Missing value for --formatter (one of: simple, table, json, xml, csv, "
             "keyvalue)\n"},
        Case{{"--bogus", "a"}, 2, "", "Error: Unknown option --bogus\n"},
        Case{{"a", "x", "cmd"},
             2,
             "",
             "Error: Unknown command or namespace a x\nValid choices under a: b\n"},
        Case{{"zz"}, 2, "", "Error: Unknown command or namespace zz\nValid choices: a\n"},
        Case{{"a", "b", "--bogus"}, 2, "", "Error: Unknown option --bogus\n"},
        // Whatever a message quotes, it is printed on one line that cannot steer a terminal.
        Case{{"a", "b", "cmd", "-m", "x\ny\x1b[2J", "--bounce"}, 1, "", "bad: x\\ny\\x1b[2J\n"},
        Case{{"--formatter=y\x1bml", "a", "b", "cmd", "-m", "x"},
             2,
             "",
             "Error: Unknown formatter y\\x1bml (one of: simple, table, json, xml, csv, "
             "keyvalue)\n"},
        Case{{"a", "x\ny"},
             2,
             "",
             "Error: Unknown command or namespace a x\\ny\nValid choices under a: b\n"}),
    [](const testing::TestParamInfo<Case>& info) {
        return WordsTestName(info.param.args, info.index);
    });

TEST(Cli, LongMessageIsCut) {
    auto run =
        Invoke(TreeWith(Echo()), {"a", "b", "cmd", "-m", std::string(2000, 'x'), "--bounce"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "bad: " + std::string(1019, 'x') + "... (2005 bytes)\n");
}

TEST(Cli, NamespaceWithoutCommandShowsHelpAndFails) {
    auto run = Invoke(TreeWith(Echo()), {"a", "b"});
    EXPECT_EQ(run.status, 2);
    EXPECT_EQ(run.out, "");
    EXPECT_EQ(run.err.rfind("Error: Missing command after a b\n", 0), 0u) << run.err;
    EXPECT_NE(run.err.find("Available Commands:\n  cmd  Echo a message.\n"), std::string::npos)
        << run.err;
    EXPECT_EQ(Invoke(TreeWith(Echo()), {}).status, 2);
}

TEST(Cli, HelpAnywhereAfterThePathSucceeds) {
    const std::vector<std::vector<std::string>> forms = {{"a", "b", "cmd", "--help"},
                                                         {"a", "b", "cmd", "-h"},
                                                         {"--help", "a", "b", "cmd"},
                                                         {"a", "b", "cmd", "--bogus", "--help"},
                                                         {"a", "b", "cmd", "-m", "x", "-h"}};
    for (const auto& args : forms) {
        auto run = Invoke(TreeWith(Echo()), args);
        EXPECT_EQ(run.status, 0);
        EXPECT_EQ(run.err, "");
        EXPECT_NE(run.out.find("-m|--message=<str>"), std::string::npos) << run.out;
    }
    auto run = Invoke(TreeWith(Echo()), {"a", "--help"});
    EXPECT_EQ(run.status, 0);
    EXPECT_NE(run.out.find("Namespace a."), std::string::npos);
    EXPECT_NE(run.out.find("  b  Namespace b."), std::string::npos) << run.out;
}

TEST(Cli, ListCommandsIsAResult) {
    auto root = TreeWith(Echo());
    auto other = FakeCommand::New(nullptr, nullptr, nullptr);
    other->SetDescription("Other one.");
    root->SubNamespace("z")->RegisterNamespaceNode(other, "do");
    auto run = Invoke(root, {"--list-commands", "--formatter=json"});
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(nlohmann::json::parse(run.out),
              nlohmann::json::parse(R"([{"Command":"a b cmd","Description":"Echo a message."},
                                        {"Command":"z do","Description":"Other one."}])"));
    run = Invoke(root, {"--list-commands"});
    EXPECT_EQ(run.out,
              "Command  Description\n"
              "-------  ---------------\n"
              "a b cmd  Echo a message.\n"
              "z do     Other one.\n");
    run = Invoke(root, {"z", "--list-commands", "--formatter=csv"});
    EXPECT_EQ(run.out, "Command,Description\nz do,Other one.\n");
}

TEST(Cli, UserContextOnlyWhenSupported) {
    std::string seen = "unset";
    auto spec = [] {
        auto input = CallSpec::InputSpec::New();
        input->SetContextSupported("user");
        return input;
    };
    auto command = FakeCommand::New(spec, nullptr, [&](CallSpec::Input& input, CallSpec::Output&) {
        seen = input.GetContext("user");
    });
    auto run = Invoke(TreeWith(command), {"a", "b", "cmd"});
    EXPECT_EQ(run.status, 0);
    const passwd* entry = getpwuid(geteuid());
    ASSERT_NE(entry, nullptr);
    EXPECT_EQ(seen, entry->pw_name);

    auto plain = FakeCommand::New(nullptr, nullptr, nullptr);
    Invoke(TreeWith(plain), {"a", "b", "cmd"});
    ASSERT_NE(plain->lastInput, nullptr);
    EXPECT_EQ(plain->lastInput->GetContext("user"), "");
}

TEST(Cli, CommandWithoutResultPrintsNothing) {
    auto command = FakeCommand::New(nullptr, nullptr, nullptr);
    for (const std::string formatter : {"simple", "table", "json", "xml", "csv", "keyvalue"}) {
        auto run = Invoke(TreeWith(command), {"--formatter", formatter, "a", "b", "cmd"});
        EXPECT_EQ(run.status, 0);
        EXPECT_EQ(run.out, "") << formatter;
        EXPECT_EQ(run.err, "");
    }
}

TEST(Cli, CommandsOwnShortHWins) {
    auto spec = [] {
        auto input = CallSpec::InputSpec::New();
        input->AddParameter(Param("host", CallSpec::PARAM_STRING, "h"));
        return input;
    };
    auto command =
        FakeCommand::New(spec, nullptr, [](CallSpec::Input& input, CallSpec::Output& output) {
            output.SetRootObject(MetaObj::MetaString::New(input.GetParameter("host")));
        });
    auto run = Invoke(TreeWith(command), {"a", "b", "cmd", "-h", "box"});
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.out, "box\n");
    EXPECT_EQ(Invoke(TreeWith(command), {"a", "b", "cmd", "--help"}).status, 0);
}

}  // namespace
}  // namespace CmdKitTest

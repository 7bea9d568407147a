// DryRunCli: everything RunCli does before a command runs, and never the command itself.
#include <gtest/gtest.h>

#include "FakeCommand.h"

namespace CmdKitTest {
namespace {

CliRun Dry(const std::shared_ptr<AutoCli::NamespaceNode>& root,
           const std::vector<std::string>& args) {
    return Invoke(root, args, &AutoCli::DryRunCli);
}

// A command that must never run: it takes a required integer in 1..9 and a flag.
std::shared_ptr<FakeCommand> Guarded(bool& ran) {
    auto spec = [] {
        auto input = CallSpec::InputSpec::New();
        auto level = Param("level", CallSpec::PARAM_INT, "l", true);
        level->SetConstraint(IntRange(1, 9));
        input->AddParameter(level);
        input->AddParameter(Param("force", CallSpec::PARAM_FLAG));
        return input;
    };
    auto command = FakeCommand::New(spec, MetaObj::MetaBool::New(),
                                    [&ran](CallSpec::Input&, CallSpec::Output& output) {
                                        ran = true;
                                        output.SetRootObject(MetaObj::MetaBool::New(true));
                                    });
    command->SetDescription("Change a level.");
    return command;
}

TEST(DryRunCli, AnswersLikeRunCliUpToExecution) {
    const std::vector<std::vector<std::string>> invocations = {
        {"a", "b", "cmd", "--help"},
        {"--list-commands", "--formatter=csv"},
        {"a", "b", "cmd"},
        {"a", "b", "cmd", "-l", "10"},
        {"a", "b", "cmd", "-l", "x"},
        {"a", "b", "cmd", "-l", "1", "--force=yes"},
        {"a", "b", "cmd", "-l", "1", "--formatter=yaml"},
        {"a", "zz"},
        {"a", "b"},
        {"--bogus"},
    };
    for (const auto& args : invocations) {
        bool ran = false;
        const auto dry = Dry(TreeWith(Guarded(ran)), args);
        const auto real = Invoke(TreeWith(Guarded(ran)), args);
        EXPECT_EQ(dry.status, real.status) << args.back();
        EXPECT_EQ(dry.out, real.out) << args.back();
        EXPECT_EQ(dry.err, real.err) << args.back();
        EXPECT_FALSE(ran) << args.back();
    }
}

TEST(DryRunCli, AcceptedInvocationDoesNotExecute) {
    bool ran = false;
    auto command = Guarded(ran);
    const auto dry = Dry(TreeWith(command), {"a", "b", "cmd", "--level=3", "--force"});
    EXPECT_EQ(dry.status, 0);
    EXPECT_EQ(dry.out, "");
    EXPECT_EQ(dry.err, "");
    EXPECT_FALSE(ran);
    EXPECT_EQ(command->lastInput, nullptr);
    // A batch would run commands: its file is not even read.
    EXPECT_EQ(Dry(TreeWith(command), {"--batch", "/nonexistent"}).status, 0);

    EXPECT_EQ(Invoke(TreeWith(command), {"a", "b", "cmd", "--level=3"}).out, "true\n");
    EXPECT_TRUE(ran);
}

}  // namespace
}  // namespace CmdKitTest

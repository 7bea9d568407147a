// The command tree, command objects and the host command runner.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include "FakeCommand.h"

namespace CmdKitTest {
namespace {

// A node made without New(): it has no shared owner to hand out.
class LooseNamespace : public AutoCli::Namespace {
  public:
    LooseNamespace() = default;
};

TEST(Node, GetThisSharesOwnershipWithNew) {
    auto first = FakeCommand::New(nullptr, nullptr, nullptr);
    auto second = FakeCommand::New(nullptr, nullptr, nullptr);
    EXPECT_NE(first.get(), second.get());
    auto again = first->GetThis();
    EXPECT_EQ(again.get(), static_cast<AutoCli::NamespaceNode*>(first.get()));
    EXPECT_EQ(first.use_count(), 2);
    EXPECT_FALSE(first.owner_before(again) || again.owner_before(first));
    auto other = second->GetThis();
    EXPECT_TRUE(first.owner_before(other) || other.owner_before(first));
}

TEST(Node, GetThisWithoutNewThrows) {
    LooseNamespace loose;
    EXPECT_THROW(loose.GetThis(), CmdKit::CmdKitException);
}

TEST(Node, EmptyInputSpecIsNotNullAndAskedOnce) {
    auto command = FakeCommand::New(nullptr, MetaObj::MetaBool::New(), nullptr);
    auto spec = command->GetInputSpec();
    ASSERT_NE(spec, nullptr);
    EXPECT_TRUE(spec->GetParameters().empty());
    EXPECT_EQ(command->GetInputSpec(), spec);
    EXPECT_EQ(command->inputSpecCalls, 1);
    EXPECT_EQ(command->GetOutputSpec(), command->GetOutputSpec());
    EXPECT_EQ(command->GetOutputSpec()->GetRootObject()->GetMetaType(), MetaObj::META_BOOL);
}

TEST(Node, TreeKeepsOrderPathsAndReplacesDuplicates) {
    auto root = AutoCli::Namespace::New();
    auto system = root->SubNamespace("system");
    EXPECT_EQ(root->SubNamespace("system"), system);
    auto stats = AutoCli::Namespace::New();
    auto get = FakeCommand::New(nullptr, nullptr, nullptr);
    stats->RegisterNamespaceNode(get, "get");  // children before the parent is attached
    system->RegisterNamespaceNode(stats, "stats");
    system->RegisterNamespaceNode(AutoCli::Namespace::New(), "boot");
    EXPECT_EQ(system->GetNamespaceNodeNames(), (std::vector<std::string>{"stats", "boot"}));
    EXPECT_EQ(get->GetPath(), (std::vector<std::string>{"system", "stats", "get"}));
    EXPECT_EQ(get->GetPathString('.'), "system.stats.get");
    EXPECT_EQ(get->GetParent(), stats.get());
    EXPECT_EQ(get->GetName(), "get");
    EXPECT_EQ(get->GetType(), AutoCli::NodeType::Command);
    EXPECT_EQ(system->GetType(), AutoCli::NodeType::Namespace);
    EXPECT_EQ(root->GetPathString(' '), "");

    size_t consumed = 0;
    auto found = root->ResolveNode({"system", "stats", "get", "--x"}, consumed);
    EXPECT_EQ(found.get(), static_cast<AutoCli::NamespaceNode*>(get.get()));
    EXPECT_EQ(consumed, 3u);
    found = root->ResolveNode({"system", "nope"}, consumed);
    EXPECT_EQ(found, system);
    EXPECT_EQ(consumed, 1u);

    auto replacement = AutoCli::Namespace::New();
    system->RegisterNamespaceNode(replacement, "stats");
    EXPECT_EQ(system->GetNamespaceNodeNames(), (std::vector<std::string>{"stats", "boot"}));
    EXPECT_EQ(system->GetNamespaceNode("stats"), replacement);
    EXPECT_TRUE(system->HasNamespaceNode("boot"));
    EXPECT_FALSE(system->HasNamespaceNode("get"));
    EXPECT_THROW(system->RegisterNamespaceNode(nullptr, "x"), CmdKit::CmdKitException);
}

TEST(Node, ResultObjects) {
    auto row = MetaObj::MetaStruct::New("Row");
    row->SetField("A", "x", MetaObj::MetaStruct::_docEmpty);
    row->SetField("B", 5, MetaObj::MetaStruct::_docEmpty);
    row->SetField("A", true, MetaObj::MetaStruct::_docEmpty);  // replaced in place
    ASSERT_EQ(row->GetFields().size(), 2u);
    EXPECT_EQ(row->GetFields()[0].name, "A");
    EXPECT_EQ(row->GetField("A")->GetMetaType(), MetaObj::META_BOOL);
    EXPECT_EQ(row->GetField("C"), nullptr);
    auto strings = MetaObj::MetaList::New(MetaObj::META_STRING);
    EXPECT_THROW(strings->Add(row), CmdKit::CmdKitException);
    auto rows = MetaObj::MetaList::New(MetaObj::META_STRUCT, row);
    EXPECT_THROW(rows->Add(std::string("x")), CmdKit::CmdKitException);
    EXPECT_THROW(MetaObj::MetaList::New(MetaObj::META_INT), CmdKit::CmdKitException);
    EXPECT_FALSE(MetaObj::MetaInt::New()->HasValue());
    EXPECT_EQ(MetaObj::MetaInt::New(-3)->GetValue(), -3);
}

std::vector<std::string> seenArgv;
std::string seenUser;

int RecordingRunner(const std::vector<std::string>& argv, const std::string& user,
                    std::string& output) {
    seenArgv = argv;
    seenUser = user;
    output = "ran";
    return 3;
}

TEST(ShellCmd, SplitsOnWhitespaceAndCallsTheInstalledRunner) {
    AutoCli::SetHostCommandRunner(&RecordingRunner);
    std::string output;
    int status = AutoCli::AutoCli_ShellCmdWithKvUsername("  /bin/mgmt-cmd \t hostsvc/mode_enter ",
                                                         "alice", output, "");
    AutoCli::SetHostCommandRunner(nullptr);
    EXPECT_EQ(status, 3);
    EXPECT_EQ(output, "ran");
    EXPECT_EQ(seenArgv, (std::vector<std::string>{"/bin/mgmt-cmd", "hostsvc/mode_enter"}));
    EXPECT_EQ(seenUser, "alice");
}

TEST(ShellCmd, DefaultRunnerCapturesOutputAndStatus) {
    AutoCli::SetHostCommandRunner(nullptr);  // the host library may have installed its own
    std::string output;
    EXPECT_EQ(AutoCli::AutoCli_ShellCmdWithKvUsername("/bin/echo hello  world", "u", output, ""),
              0);
    EXPECT_EQ(output, "hello world\n");
    EXPECT_EQ(AutoCli::AutoCli_ShellCmdWithKvUsername("/bin/false", "u", output, ""), 1);
    // No PATH search and no shell: a bare name does not start.
    EXPECT_NE(AutoCli::AutoCli_ShellCmdWithKvUsername("echo hi", "u", output, ""), 0);
    EXPECT_NE(output.find("Cannot run echo"), std::string::npos) << output;
    EXPECT_NE(AutoCli::AutoCli_ShellCmdWithKvUsername("   ", "u", output, ""), 0);
}

// The program gets standard input, output and error, and nothing else the caller holds open.
TEST(ShellCmd, NoDescriptorOfTheCallerReachesTheProgram) {
    const int leaked = open("/dev/null", O_RDONLY);  // deliberately without close-on-exec
    ASSERT_GE(leaked, 3);
    std::string output;
    const std::string fd = std::to_string(leaked);
    EXPECT_EQ(AutoCli::RunProgram("/bin/sh",
                                  {"sh", "-c",
                                   "test -e /proc/self/fd/" + fd +
                                       " && echo leaked; "
                                       "test -e /proc/self/fd/2 && echo stderr"},
                                  output),
              0);
    close(leaked);
    EXPECT_EQ(output, "stderr\n");
    EXPECT_EQ(AutoCli::RunProgram("/no/such/program", {"x"}, output), 127);
    EXPECT_EQ(output, "Cannot run x: No such file or directory");
}

}  // namespace
}  // namespace CmdKitTest

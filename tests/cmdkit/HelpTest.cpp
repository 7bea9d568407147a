// Help of namespaces and commands.
#include <gtest/gtest.h>

#include "FakeCommand.h"

namespace CmdKitTest {
namespace {

std::shared_ptr<CallSpec::InputSpec> RichSpec() {
    auto spec = CallSpec::InputSpec::New();
    auto level = Param("level", CallSpec::PARAM_STRING, "l", true);
    level->SetDescription("The level, one of: %ENUM%.");
    auto levels = StringEnum({{"low", "Quiet operation"}, {"high", "Loud operation"}});
    level->SetConstraint(levels);
    spec->AddParameter(level);
    auto mode = Param("mode", CallSpec::PARAM_STRING);
    mode->SetDescription("The mode:%FULLENUM%");
    mode->SetConstraint(levels);
    spec->AddParameter(mode);
    auto port = Param("port", CallSpec::PARAM_INT, "p");
    port->SetDescription("The port.");
    port->SetConstraint(IntRange(1, 65525));
    spec->AddParameter(port);
    auto id = Param("id", CallSpec::PARAM_STRING);
    id->SetDescription("An identifier.");
    id->SetConstraint(Regex("[a-z]+"));
    spec->AddParameter(id);
    auto enabled = Param("enabled", CallSpec::PARAM_BOOL, "e");
    enabled->SetDescription("Turn on or off.");
    spec->AddParameter(enabled);
    auto force = Param("force", CallSpec::PARAM_FLAG, "f");
    force->SetDescription("Do it anyway.");
    spec->AddParameter(force);
    auto tags = Param("tag", CallSpec::PARAM_STRING_LIST);
    tags->SetDescription("A tag.");
    spec->AddParameter(tags);
    return spec;
}

std::string CommandHelp() {
    auto command = FakeCommand::New(RichSpec, nullptr, nullptr);
    command->SetDescription("Do a rich thing.");
    auto run = Invoke(TreeWith(command), {"a", "b", "cmd", "--help"});
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.err, "");
    return run.out;
}

TEST(Help, CommandShowsPathDescriptionAndEveryParameter) {
    const std::string help = CommandHelp();
    const std::vector<std::string> parts = {
        "Usage: brixcli [--formatter=simple|table|json|xml|csv|keyvalue] a b cmd [cmd options]\n",
        "Description:\n  cmd: Do a rich thing.\n",
        "  -l|--level=<str>     The level, one of: low, high. (required)\n",
        "  --mode=<str>         The mode:\n                         low: Quiet operation\n"
        "                         high: Loud operation\n",
        "  -p|--port=<long>     The port. (range 1..65525)\n",
        "  --id=<str>           An identifier. (must match [a-z]+)\n",
        "  -e|--enabled=<bool>  Turn on or off.\n",
        "  -f|--force",
        "  --tag=<str[]>",
    };
    for (const auto& part : parts) {
        EXPECT_NE(help.find(part), std::string::npos) << "missing:\n" << part << "\nin:\n" << help;
    }
    EXPECT_EQ(help.find("%ENUM%"), std::string::npos);
    EXPECT_EQ(help.find("%FULLENUM%"), std::string::npos);
}

TEST(Help, NamespaceListsChildrenWithTheirDescriptions) {
    auto root = AutoCli::Namespace::New();
    auto parent = root->SubNamespace("top");
    parent->SetDescription("Top level.");
    auto quiet = AutoCli::Namespace::New();  // deliberately without a description
    parent->RegisterNamespaceNode(quiet, "quiet");
    auto command = FakeCommand::New(nullptr, nullptr, nullptr);
    command->SetDescription("Run it.");
    parent->RegisterNamespaceNode(command, "run");

    auto run = Invoke(root, {"top", "--help"});
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.out,
              "Usage: brixcli [--formatter=simple|table|json|xml|csv|keyvalue] top {cmd} [cmd "
              "options]\n"
              "\nDescription:\n  Top level.\n"
              "\nAvailable Namespaces:\n  quiet\n"
              "\nAvailable Commands:\n  run  Run it.\n");

    run = Invoke(root, {"top", "quiet", "-h"});
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.out.find("Description"), std::string::npos) << run.out;
}

TEST(Help, CommandWithoutParameters) {
    auto command = FakeCommand::New(nullptr, nullptr, nullptr);
    auto run = Invoke(TreeWith(command), {"a", "b", "cmd", "--help"});
    EXPECT_NE(run.out.find("Cmd options:\n  (none)\n"), std::string::npos) << run.out;
}

}  // namespace
}  // namespace CmdKitTest

// Completion scripts, run by the shells themselves: bash through its completion variables,
// zsh through the script's candidate function.
#include <gtest/gtest.h>
#include <stdlib.h>

#include <filesystem>
#include <fstream>
#include <sstream>

#include "FakeCommand.h"
#include "support/TestHost.h"

namespace CmdKitTest {
namespace {

namespace fs = std::filesystem;

std::shared_ptr<CallSpec::InputSpec> CreateSpec() {
    auto spec = CallSpec::InputSpec::New();
    auto size = Param("size", CallSpec::PARAM_INT, "s");
    size->SetConstraint(IntRange(1, 100));
    spec->AddParameter(size);
    auto mode = Param("mode", CallSpec::PARAM_STRING);
    mode->SetDescription("How to create it: %ENUM%. Slow is safer.");
    mode->SetConstraint(StringEnum({{"fast", "Quick: no checks"}, {"slow", ""}}));
    spec->AddParameter(mode);
    auto secure = Param("secure", CallSpec::PARAM_BOOL, "e");
    secure->SetDescription("Encrypt the volume.");
    spec->AddParameter(secure);
    spec->AddParameter(Param("force", CallSpec::PARAM_FLAG, "f"));
    spec->AddParameter(Param("label", CallSpec::PARAM_STRING, "l"));
    spec->AddParameter(Param("tag", CallSpec::PARAM_STRING_LIST));
    // Values a shell could mangle: a quote, an expansion, a glob.
    auto when = Param("when", CallSpec::PARAM_STRING);
    when->SetConstraint(StringEnum({{"o'clock", ""}, {"$HOME", ""}, {"*", ""}}));
    spec->AddParameter(when);
    return spec;
}

std::shared_ptr<FakeCommand> Command(const std::string& description,
                                     FakeCommand::InputFactory inputs = nullptr) {
    auto command = FakeCommand::New(std::move(inputs), MetaObj::MetaString::New(), nullptr);
    command->SetDescription(description);
    return command;
}

// disk volume {create, show}, disk list, dns get.
std::shared_ptr<AutoCli::Namespace> Tree() {
    auto root = AutoCli::Namespace::New();
    auto disk = root->SubNamespace("disk");
    disk->SetDescription("Disks: the host's block devices. They hold the volumes.");
    auto volume = disk->SubNamespace("volume");
    volume->RegisterNamespaceNode(Command("Create a volume. It takes a while.", CreateSpec),
                                  "create");
    volume->RegisterNamespaceNode(Command("Show a volume."), "show");
    disk->RegisterNamespaceNode(Command(std::string(120, 'x')), "list");
    root->SubNamespace("dns")->RegisterNamespaceNode(Command("Get DNS."), "get");
    return root;
}

std::vector<std::string> Lines(const std::string& text) {
    std::vector<std::string> lines;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);) lines.push_back(line);
    return lines;
}

bool HasProgram(const std::string& name) {
    return BrixTest::Run({"sh", "-c", "command -v \"$1\" >/dev/null", "sh", name}).status == 0;
}

class ScriptFile {
  public:
    ScriptFile(AutoCli::NamespaceNode& root, const std::string& shell) {
        std::string pattern = fs::temp_directory_path() / "brixcli-completion-XXXXXX";
        if (!mkdtemp(pattern.data())) throw std::runtime_error("mkdtemp failed");
        dir_ = pattern;
        std::ofstream out(Path());
        AutoCli::WriteCompletionScript(root, shell, out);
    }
    ~ScriptFile() {
        std::error_code ec;
        fs::remove_all(dir_, ec);
    }
    fs::path Path() const { return dir_ / "script"; }

  private:
    fs::path dir_;
};

// Sources the script in a plain bash, sets the completion variables as readline would for
// `brixcli WORDS...` (the last word under the cursor) and prints COMPREPLY, one a line.
std::vector<std::string> BashComplete(const fs::path& script,
                                      const std::vector<std::string>& words) {
    std::vector<std::string> argv = {"bash",
                                     "--norc",
                                     "--noprofile",
                                     "-c",
                                     R"(source "$1" || exit 3
                                        shift
                                        COMP_WORDS=(brixcli "$@")
                                        COMP_CWORD=$#
                                        _brixcli || exit 4
                                        ((${#COMPREPLY[@]} == 0)) || printf '%s\n' "${COMPREPLY[@]}")",
                                     "bash",
                                     script.string()};
    argv.insert(argv.end(), words.begin(), words.end());
    const auto run = BrixTest::Run(argv);
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.err, "");
    return Lines(run.out);
}

const std::vector<std::string> kGlobals = {"--help",      "-h",           "--list-commands",
                                           "--formatter", "--completion", "--reference",
                                           "--version",   "--verbose"};
// Offered only before a path.
const std::vector<std::string> kRootGlobals = {"--batch", "--stop-on-error"};
const std::vector<std::string> kCreateLong = {"--size",  "--mode", "--secure", "--force",
                                              "--label", "--tag",  "--when"};
const std::vector<std::string> kBooleans = {"true", "false", "yes", "no", "1", "0"};

std::vector<std::string> Join(std::vector<std::string> first,
                              const std::vector<std::string>& then) {
    first.insert(first.end(), then.begin(), then.end());
    return first;
}

struct CompletionCase {
    std::string name;
    std::vector<std::string> words;  // after the program; the last is being completed
    std::vector<std::string> expected;
};

std::ostream& operator<<(std::ostream& out, const CompletionCase& c) {
    return out << c.name;
}

class BashCompletion : public testing::TestWithParam<CompletionCase> {};

TEST_P(BashCompletion, OffersExactly) {
    auto root = Tree();
    ScriptFile script(*root, "bash");
    EXPECT_EQ(BashComplete(script.Path(), GetParam().words), GetParam().expected);
}

const std::vector<std::string> kCreate = {"disk", "volume", "create"};

std::vector<std::string> Create(const std::vector<std::string>& more) {
    return Join(kCreate, more);
}

INSTANTIATE_TEST_SUITE_P(
    Table, BashCompletion,
    testing::Values(
        CompletionCase{"FirstWord", {""}, {"disk", "dns"}},
        CompletionCase{"FirstWordPrefix", {"di"}, {"disk"}},
        CompletionCase{"NestedPath", {"disk", ""}, {"volume", "list"}},
        CompletionCase{"DeepPath", {"disk", "volume", "s"}, {"show"}},
        CompletionCase{"UnknownWordEndsCompletion", {"disk", "bogus", ""}, {}},
        CompletionCase{"GlobalOptionsAtRoot", {"-"}, Join(kGlobals, kRootGlobals)},
        CompletionCase{"BatchOnlyAtRoot", {"disk", "--b"}, {}},
        CompletionCase{"GlobalBeforePath", {"--formatter", "json", "d"}, {"disk", "dns"}},
        CompletionCase{"FormatterValues",
                       {"--formatter", ""},
                       {"simple", "table", "json", "xml", "csv", "keyvalue"}},
        CompletionCase{"FormatterInline", {"disk", "--formatter=j"}, {"--formatter=json"}},
        CompletionCase{"CompletionShells", {"--completion", ""}, {"bash", "zsh"}},
        CompletionCase{"OptionsLongThenShort", Create({""}),
                       Join(kCreateLong, {"-s", "-e", "-f", "-l"})},
        CompletionCase{
            "OptionsAndGlobalsAfterDashes", Create({"--"}),
            Join(kCreateLong, {"--help", "--list-commands", "--formatter", "--completion",
                               "--reference", "--version", "--verbose"})},
        CompletionCase{"OptionPrefix", Create({"--s"}), {"--size", "--secure"}},
        CompletionCase{"NoPathAfterCommand", Create({"sh"}), {}},
        CompletionCase{"NothingAfterCommandWithoutOptions", {"disk", "volume", "show", ""}, {}},
        CompletionCase{"EnumValues", Create({"--mode", ""}), {"fast", "slow"}},
        CompletionCase{"EnumPrefix", Create({"--mode", "s"}), {"slow"}},
        CompletionCase{"EnumAfterSplitEquals", Create({"--mode", "=", ""}), {"fast", "slow"}},
        CompletionCase{"EnumAfterSplitEqualsPrefix", Create({"--mode", "=", "f"}), {"fast"}},
        CompletionCase{"EnumInlineWord", Create({"--mode=s"}), {"--mode=slow"}},
        CompletionCase{"ValuesKeptLiterally", Create({"--when", ""}), {"o'clock", "$HOME", "*"}},
        CompletionCase{"BooleanLong", Create({"--secure", ""}), kBooleans},
        CompletionCase{"BooleanShort", Create({"-e", "y"}), {"yes"}},
        CompletionCase{"NoValuesForIntegers", Create({"--size", ""}), {}},
        CompletionCase{"NoValuesForFreeText", Create({"--label", ""}), {}},
        CompletionCase{"FlagTakesNoValue", Create({"--force", "--m"}), {"--mode"}},
        CompletionCase{"ValueWordIsSkipped", Create({"--label", "disk", "--w"}), {"--when"}},
        CompletionCase{"SplitValueIsSkipped", Create({"--mode", "=", "fast", "--mo"}), {"--mode"}},
        CompletionCase{"ShortOptionValueIsSkipped", Create({"-s", "5", "-"}),
                       Join(Join(kCreateLong, {"-s", "-e", "-f", "-l"}), kGlobals)}),
    [](const testing::TestParamInfo<CompletionCase>& info) { return info.param.name; });

// The script of the real tool holds the plug-ins' branches.
TEST(BashCompletionOfTool, CompletesThePluginTree) {
    BrixTest::TempHost host;
    const auto run = host.Cli({"--completion", "bash"});
    ASSERT_EQ(run.status, 0) << run.err;
    const fs::path script = host.Root() / "brixcli.bash";
    std::ofstream(script) << run.out;
    EXPECT_EQ(BashComplete(script, {"sys"}), std::vector<std::string>{"system"});
    EXPECT_EQ(BashComplete(script, {"system", "coredump", ""}),
              (std::vector<std::string>{"partition", "network", "file"}));
    EXPECT_EQ(BashComplete(script, {"system", "coredump", "partition", "set", "--enable", ""}),
              kBooleans);
    EXPECT_EQ(BashComplete(script, {"system", "slp", "search", "-P", ""}),
              (std::vector<std::string>{"tcp", "udp"}));
}

// Loads the script in `zsh -f` and prints the candidate function's answer: what it offers,
// then one candidate a line. The candidate function needs nothing of the completion system, so
// a stand-in compdef spares the slow compinit.
std::vector<std::string> ZshCandidates(const fs::path& script,
                                       const std::vector<std::string>& words) {
    std::vector<std::string> argv = {"zsh",
                                     "-f",
                                     "-c",
                                     R"(compdef() { :; }
                                        source "$1" || exit 3
                                        shift
                                        _brixcli_candidates "$@" || exit 5
                                        print -r -- "$REPLY"
                                        print -rC1 -- "${reply[@]}")",
                                     "zsh",
                                     script.string()};
    argv.insert(argv.end(), words.begin(), words.end());
    const auto run = BrixTest::Run(argv);
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.err, "");
    return Lines(run.out);
}

class NeedsZsh : public testing::Test {
  protected:
    void SetUp() override {
        if (!HasProgram("zsh"))
            GTEST_SKIP() << "zsh is not installed (scripts/bootstrap installs it)";
    }
};

class ZshCompletion : public NeedsZsh, public testing::WithParamInterface<CompletionCase> {};

TEST_P(ZshCompletion, OffersWithSummaries) {
    auto root = Tree();
    ScriptFile script(*root, "zsh");
    EXPECT_EQ(ZshCandidates(script.Path(), GetParam().words), GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(
    Table, ZshCompletion,
    testing::Values(
        CompletionCase{
            "FirstWord", {""}, {"commands", "disk:Disks: the host's block devices", "dns"}},
        CompletionCase{"LongSummaryIsCut",
                       {"disk", "l"},
                       {"commands", "volume", "list:" + std::string(77, 'x') + "..."}},
        CompletionCase{"EnumValuesWithTheirSummaries",
                       Create({"--mode", ""}),
                       {"values", "fast:Quick: no checks", "slow"}},
        CompletionCase{
            "EnumInlineWord", Create({"--mode=f"}), {"values", "fast:Quick: no checks", "slow"}},
        CompletionCase{"BooleanValues", Create({"-e", ""}), Join({"values"}, kBooleans)},
        CompletionCase{
            "OptionSummaries",
            {"disk", "volume", "create", "--s"},
            Join({"options", "--size", "--mode:How to create it: fast, slow",
                  "--secure:Encrypt the volume", "--force", "--label", "--tag", "--when", "-s",
                  "-e:Encrypt the volume", "-f", "-l"},
                 {"--help:Print the help of the path", "-h:Print the help of the path",
                  "--list-commands:List every command below the path", "--formatter:Output format",
                  "--completion:Print a shell completion script",
                  "--reference:Print the command reference in Markdown",
                  "--version:Print the version",
                  "--verbose:With --version: list the plug-ins loaded"})},
        CompletionCase{"FreeTextIsFiles", Create({"--label", ""}), {"files"}},
        CompletionCase{"BatchFileIsFiles", {"--batch", ""}, {"files"}},
        CompletionCase{"UnknownWordEndsCompletion", {"disk", "bogus", ""}, {""}}),
    [](const testing::TestParamInfo<CompletionCase>& info) { return info.param.name; });

// Under the real completion system the script registers _brixcli for brixcli, and the
// function runs inside a completion without errors.
TEST_F(NeedsZsh, ScriptLoadsUnderCompinit) {
    auto root = Tree();
    ScriptFile script(*root, "zsh");
    const auto run = BrixTest::Run({"zsh", "-f", "-c",
                                    R"(autoload -Uz compinit && compinit -u -D || exit 3
                                       source "$1" || exit 3
                                       print -r -- "${_comps[brixcli]}")",
                                    "zsh", script.Path().string()});
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.err, "");
    EXPECT_EQ(run.out, "_brixcli\n");
}

struct GlobalCase {
    std::vector<std::string> args;
    int status;
    std::string outStart;
    std::string err;
};

void PrintTo(const GlobalCase& row, std::ostream* out) {
    *out << testing::PrintToString(row.args);
}

class CompletionOption : public testing::TestWithParam<GlobalCase> {};

TEST_P(CompletionOption, IsAGlobalOption) {
    const auto& expected = GetParam();
    auto run = Invoke(Tree(), expected.args);
    EXPECT_EQ(run.status, expected.status);
    EXPECT_EQ(run.out.substr(0, expected.outStart.size()), expected.outStart);
    EXPECT_EQ(run.err, expected.err);
}

INSTANTIATE_TEST_SUITE_P(
    Table, CompletionOption,
    testing::Values(
        GlobalCase{{"--completion", "bash"}, 0, "# bash completion for brixcli", ""},
        GlobalCase{{"--completion=zsh"}, 0, "#compdef brixcli\n", ""},
        // After a path the script still covers the whole tree.
        GlobalCase{{"disk", "volume", "--completion", "bash"}, 0, "# bash completion", ""},
        GlobalCase{
            {"--completion", "fish"}, 2, "", "Error: Unknown shell fish (one of: bash, zsh)\n"},
        GlobalCase{
            {"--completion"}, 2, "", "Error: Missing value for --completion (one of: bash, zsh)\n"},
        GlobalCase{{"disk", "nope", "--completion", "bash"},
                   2,
                   "",
                   "Error: Unknown command or namespace disk nope\n"
                   "Valid choices under disk: volume, list\n"}));

TEST(CompletionScript, CoversTheWholeTreeFromAnyPath) {
    auto run = Invoke(Tree(), {"dns", "--completion", "bash"});
    EXPECT_NE(run.out.find("[$'brixcli disk volume create']="), std::string::npos);
}

}  // namespace
}  // namespace CmdKitTest

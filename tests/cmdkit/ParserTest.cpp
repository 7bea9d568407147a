// Option parsing and checking against an declared input.
#include <gtest/gtest.h>

#include <climits>
#include <regex>

#include "FakeCommand.h"

namespace CmdKitTest {
namespace {

using CallSpec::ParameterConstraint;

std::shared_ptr<CallSpec::InputSpec> TestSpec() {
    auto spec = CallSpec::InputSpec::New();
    spec->AddParameter(Param("message", CallSpec::PARAM_STRING, "m", true));
    spec->AddParameter(Param("name", CallSpec::PARAM_STRING, "n"));
    auto port = Param("port", CallSpec::PARAM_INT, "P");
    port->SetConstraint(IntRange(1, 65525));
    spec->AddParameter(port);
    auto wide = Param("wide", CallSpec::PARAM_INT);
    wide->SetConstraint(IntRange(INT64_MIN, INT64_MAX));
    spec->AddParameter(wide);
    spec->AddParameter(Param("count", CallSpec::PARAM_INT, "c"));
    spec->AddParameter(Param("enabled", CallSpec::PARAM_BOOL, "e"));
    spec->AddParameter(Param("force", CallSpec::PARAM_FLAG, "f"));
    spec->AddParameter(Param("tag", CallSpec::PARAM_STRING_LIST, "t"));
    auto mode = Param("mode", CallSpec::PARAM_STRING);
    mode->SetConstraint(StringEnum({{"fast", "Go fast"}, {"slow", "Go slow"}}));
    spec->AddParameter(mode);
    auto id = Param("id", CallSpec::PARAM_STRING);
    id->SetConstraint(Regex("[a-z]+[0-9]"));
    spec->AddParameter(id);
    auto pin = Param("pin", CallSpec::PARAM_STRING, "p");
    pin->SetSecret(true);
    pin->SetConstraint(Regex("[0-9]{4}"));
    spec->AddParameter(pin);
    auto secretNumber = Param("secretnum", CallSpec::PARAM_INT);
    secretNumber->SetSecret(true);
    spec->AddParameter(secretNumber);
    return spec;
}

std::vector<std::string> With(std::vector<std::string> args) {
    args.insert(args.begin(), {"-m", "hello"});
    return args;
}

struct Refusal {
    std::vector<std::string> args;
    std::string message;
};

void PrintTo(const Refusal& row, std::ostream* out) {
    PrintWords(row.args, out);
}

class ParserRefuses : public testing::TestWithParam<Refusal> {};

TEST_P(ParserRefuses, WithTheFrameworksMessage) {
    const auto& refusal = GetParam();
    try {
        AutoCli::ParseArguments(*TestSpec(), refusal.args);
        FAIL() << "accepted";
    } catch (const CmdKit::UsageError& error) {
        EXPECT_EQ(error.what(), refusal.message);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Table, ParserRefuses,
    testing::Values(
        Refusal{{}, "Error: Missing required parameter -m|--message"},
        Refusal{{"--name", "x"}, "Error: Missing required parameter -m|--message"},
        Refusal{With({"--foo"}), "Error: Unknown option --foo"},
        Refusal{With({"--foo=bar"}), "Error: Unknown option --foo"},
        Refusal{With({"-z"}), "Error: Unknown option -z"},
        Refusal{With({"stray"}), "Error: Unexpected argument stray"},
        Refusal{With({"-"}), "Error: Unexpected argument -"},
        Refusal{With({"--name", "a", "--name", "b"}), "Error: Option --name given more than once"},
        Refusal{With({"-n", "a", "--name=b"}), "Error: Option --name given more than once"},
        Refusal{With({"--force", "--force"}), "Error: Option --force given more than once"},
        Refusal{With({"--force=yes"}), "Error: Option --force takes no value"},
        Refusal{With({"--name"}), "Error: Missing value for --name"},
        Refusal{With({"--count", "12x"}),
                "Error: Invalid value for --count: 12x is not an integer"},
        Refusal{With({"--count", ""}), "Error: Invalid value for --count:  is not an integer"},
        Refusal{With({"--count", "1.5"}),
                "Error: Invalid value for --count: 1.5 is not an integer"},
        Refusal{With({"--count", "0x10"}),
                "Error: Invalid value for --count: 0x10 is not an integer"},
        Refusal{With({"--count", " 5"}), "Error: Invalid value for --count:  5 is not an integer"},
        Refusal{With({"--count", "+-5"}),
                "Error: Invalid value for --count: +-5 is not an integer"},
        Refusal{With({"--count", "9223372036854775808"}),
                "Error: Invalid value for --count: 9223372036854775808 is outside the 64-bit "
                "integer range"},
        Refusal{With({"--count", "-9223372036854775809"}),
                "Error: Invalid value for --count: -9223372036854775809 is outside the 64-bit "
                "integer range"},
        Refusal{With({"--count", "99999999999999999999x"}),
                "Error: Invalid value for --count: 99999999999999999999x is not an integer"},
        // The type is checked before the range.
        Refusal{With({"--port", "80x"}), "Error: Invalid value for --port: 80x is not an integer"},
        Refusal{With({"--port", "0x1"}), "Error: Invalid value for --port: 0x1 is not an integer"},
        Refusal{With({"--port", "0"}),
                "Error: Invalid value for --port: 0 is not in the range 1..65525"},
        Refusal{With({"--port", "65526"}),
                "Error: Invalid value for --port: 65526 is not in the range 1..65525"},
        Refusal{With({"-P", "70000"}),
                "Error: Invalid value for --port: 70000 is not in the range 1..65525"},
        Refusal{With({"--enabled", "maybe"}),
                "Error: Invalid value for --enabled: maybe is not a boolean (yes|no, true|false, "
                "1|0)"},
        Refusal{With({"--enabled", "2"}),
                "Error: Invalid value for --enabled: 2 is not a boolean (yes|no, true|false, 1|0)"},
        Refusal{With({"--mode", "FAST"}),
                "Error: Invalid value for --mode: FAST is not one of: fast, slow"},
        Refusal{With({"--mode", "fas"}),
                "Error: Invalid value for --mode: fas is not one of: fast, slow"},
        Refusal{With({"--id", "abc1x"}),
                "Error: Invalid value for --id: abc1x does not match the pattern [a-z]+[0-9]"},
        Refusal{With({"--id", "Xabc1"}),
                "Error: Invalid value for --id: Xabc1 does not match the pattern [a-z]+[0-9]"},
        Refusal{With({"--pin", "12345"}),
                "Error: Invalid value for --pin: the given value does not match the pattern "
                "[0-9]{4}"},
        Refusal{With({"--secretnum", "s3cr3t"}),
                "Error: Invalid value for --secretnum: the given value is not an integer"},
        // A quoted value stays on one line and cannot steer a terminal.
        Refusal{With({"--count", "1\n2\t\r\x1b[2J\x7f"}),
                "Error: Invalid value for --count: 1\\n2\\t\\r\\x1b[2J\\x7f is not an integer"},
        Refusal{With({"--mode", "\xff\xc3(\xe2\x80\xaeok\xc2\x9b"}),
                "Error: Invalid value for --mode: \\xff\\xc3(\\u202eok\\u009b is not one of: fast, "
                "slow"},
        Refusal{With({"st\nray"}), "Error: Unexpected argument st\\nray"},
        Refusal{With({"--fo\x1bo=x\ny"}), "Error: Unknown option --fo\\x1bo"}),
    [](const testing::TestParamInfo<Refusal>& info) {
        return WordsTestName(info.param.args, info.index);
    });

struct Acceptance {
    std::vector<std::string> args;
    std::string name;                 // parameter looked at
    std::vector<std::string> values;  // as recorded
};

void PrintTo(const Acceptance& row, std::ostream* out) {
    PrintWords(row.args, out);
}

class ParserAccepts : public testing::TestWithParam<Acceptance> {};

TEST_P(ParserAccepts, AndRecordsTheValues) {
    const auto& acceptance = GetParam();
    auto input = AutoCli::ParseArguments(*TestSpec(), acceptance.args);
    std::vector<std::string> values;
    input->GetParameterList(acceptance.name, values);
    EXPECT_EQ(values, acceptance.values);
}

INSTANTIATE_TEST_SUITE_P(
    Table, ParserAccepts,
    testing::Values(
        Acceptance{{"--message", "hi"}, "message", {"hi"}},
        Acceptance{{"--message=hi=there"}, "message", {"hi=there"}},
        Acceptance{{"-m", "--name"}, "message", {"--name"}}, Acceptance{{"-m=x"}, "message", {"x"}},
        Acceptance{{"-m", ""}, "message", {""}},
        Acceptance{With({"-t", "a", "--tag", "b", "--tag=c"}), "tag", {"a", "b", "c"}},
        Acceptance{With({"--count", "-5"}), "count", {"-5"}},
        Acceptance{With({"--count", "+7"}), "count", {"+7"}},
        Acceptance{With({"--count", "9223372036854775807"}), "count", {"9223372036854775807"}},
        Acceptance{With({"--count", "-9223372036854775808"}), "count", {"-9223372036854775808"}},
        Acceptance{With({"--wide", "-9223372036854775808"}), "wide", {"-9223372036854775808"}},
        Acceptance{With({"--wide", "9223372036854775807"}), "wide", {"9223372036854775807"}},
        Acceptance{With({"--port", "1"}), "port", {"1"}},
        Acceptance{With({"--port", "65525"}), "port", {"65525"}},
        Acceptance{With({"--mode", "slow"}), "mode", {"slow"}},
        Acceptance{With({"--id", "abc1"}), "id", {"abc1"}},
        Acceptance{With({"-p", "0042"}), "pin", {"0042"}},
        Acceptance{With({"-f"}), "force", {"true"}}),
    [](const testing::TestParamInfo<Acceptance>& info) {
        return WordsTestName(info.param.args, info.index);
    });

TEST(Parser, IntegersReadBackExactly) {
    auto input = AutoCli::ParseArguments(
        *TestSpec(), With({"--count", "-9223372036854775808", "--wide", "9223372036854775807"}));
    EXPECT_EQ(input->GetParameterInt("count"), LONG_MIN);
    EXPECT_EQ(input->GetParameterInt("wide"), LONG_MAX);
}

TEST(Parser, BooleanSpellingsInAnyCase) {
    const std::vector<std::pair<std::string, bool>> spellings = {
        {"yes", true}, {"YES", true}, {"True", true},   {"1", true},  {"tRUE", true},
        {"no", false}, {"No", false}, {"FALSE", false}, {"0", false}, {"false", false}};
    for (const auto& [text, expected] : spellings) {
        auto input = AutoCli::ParseArguments(*TestSpec(), With({"--enabled", text}));
        EXPECT_EQ(input->GetParameterBool("enabled"), expected) << text;
    }
}

TEST(Parser, AbsentParametersAreNotGiven) {
    auto input = AutoCli::ParseArguments(*TestSpec(), With({}));
    EXPECT_FALSE(input->HasParameter("name"));
    EXPECT_FALSE(input->IsFlagSet("force"));
    EXPECT_THROW(input->GetParameter("name"), CmdKit::CmdKitException);
    EXPECT_THROW(input->GetParameterInt("count"), CmdKit::CmdKitException);
    EXPECT_THROW(input->GetParameterBool("enabled"), CmdKit::CmdKitException);
    std::vector<std::string> tags{"stale"};
    input->GetParameterList("tag", tags);
    EXPECT_TRUE(tags.empty());
    EXPECT_EQ(input->GetContext("user"), "");
}

TEST(Parser, FlagGivenIsSet) {
    auto input = AutoCli::ParseArguments(*TestSpec(), With({"--force"}));
    EXPECT_TRUE(input->HasParameter("force"));
    EXPECT_TRUE(input->IsFlagSet("force"));
}

TEST(Parser, SecretValueNeverInAnyMessage) {
    const std::string secret = "hunter2-topsecret";
    const std::vector<std::vector<std::string>> attempts = {
        With({"--pin", secret}), With({"--pin=" + secret}), With({"--secretnum", secret}),
        With({"--pin", "1234", "--pin", secret})};
    for (const auto& args : attempts) {
        try {
            AutoCli::ParseArguments(*TestSpec(), args);
            FAIL() << "accepted";
        } catch (const CmdKit::UsageError& error) {
            EXPECT_EQ(std::string(error.what()).find(secret), std::string::npos) << error.what();
        }
    }
}

// The longest value one argument can hold: a matcher that recursed per character crashed here.
TEST(Parser, LongValueIsRefusedQuotingAnExcerpt) {
    const std::string shown = std::string(128, 'a') + "... (131000 bytes)";
    const std::vector<std::pair<std::vector<std::string>, std::string>> cases = {
        {With({"--id", std::string(131000, 'a')}),
         "Error: Invalid value for --id: " + shown + " does not match the pattern [a-z]+[0-9]"},
        {With({"--mode", std::string(131000, 'a')}),
         "Error: Invalid value for --mode: " + shown + " is not one of: fast, slow"},
        {With({std::string(131000, 'a')}), "Error: Unexpected argument " + shown},
    };
    for (const auto& [args, message] : cases) {
        try {
            AutoCli::ParseArguments(*TestSpec(), args);
            ADD_FAILURE() << "accepted";
        } catch (const CmdKit::UsageError& error) {
            EXPECT_EQ(error.what(), message);
        }
    }
    auto input =
        AutoCli::ParseArguments(*TestSpec(), With({"--id", std::string(131000, 'a') + "1"}));
    EXPECT_EQ(input->GetParameter("id").size(), 131001u);
}

// The regex constraints, the plug-in's engine id pattern among them, accept exactly what
// ECMAScript matching of the whole value accepts.
TEST(Parser, RegexConstraintsMatchAsEcmaScriptDoes) {
    const std::vector<std::string> patterns = {"(0x|0X|)[0-9a-fA-F:]+", "[a-z]+[0-9]",
                                               "[0-9]{4}|none", "a(b|c)*d?", "[^:]+:\\d{2,3}"};
    const std::vector<std::string> values = {"",
                                             "0x",
                                             "0x0123456789abcdef",
                                             "0XAB:cd",
                                             "deadbeef",
                                             "0xg1",
                                             "x0",
                                             "12 34",
                                             "0x12\n",
                                             "ab1",
                                             "abc",
                                             "1234",
                                             "12345",
                                             "none",
                                             "nonex",
                                             "abbcd",
                                             "ad",
                                             "a",
                                             "h:123",
                                             "h:1",
                                             ":12",
                                             "a\xff"
                                             "1",
                                             "\xe9\xe9:99"};
    for (const auto& pattern : patterns) {
        auto spec = CallSpec::InputSpec::New();
        auto value = Param("value", CallSpec::PARAM_STRING);
        value->SetConstraint(Regex(pattern));
        spec->AddParameter(value);
        const std::regex ecma(pattern, std::regex::ECMAScript);
        for (const auto& text : values) {
            bool accepted = true;
            try {
                AutoCli::ParseArguments(*spec, {"--value", text});
            } catch (const CmdKit::UsageError&) {
                accepted = false;
            }
            EXPECT_EQ(accepted, std::regex_match(text, ecma)) << pattern << " on " << text;
        }
    }
}

TEST(Parser, DeclarationMisuseIsRejected) {
    EXPECT_THROW(CallSpec::ParameterSpec::New("", CallSpec::PARAM_STRING), CmdKit::CmdKitException);
    EXPECT_THROW(CallSpec::ParameterSpec::New("x", 7), CmdKit::CmdKitException);
    EXPECT_THROW(ParameterConstraint::New(2), CmdKit::CmdKitException);
    EXPECT_THROW(ParameterConstraint::New(CallSpec::CONSTRAINT_INT_RANGE)->SetIntRange(5, 4),
                 CmdKit::CmdKitException);
    // Not ECMAScript, or beyond a matcher linear in the value: refused when declared.
    for (const char* pattern : {"([", "(a)\\1", "(?=a)a", "(?i)a", "a{1001}"}) {
        EXPECT_THROW(ParameterConstraint::New(CallSpec::CONSTRAINT_REGEX)->SetStringRegex(pattern),
                     CmdKit::CmdKitException)
            << pattern;
    }
    auto spec = CallSpec::InputSpec::New();
    spec->AddParameter(Param("one", CallSpec::PARAM_STRING, "o"));
    EXPECT_THROW(spec->AddParameter(Param("one", CallSpec::PARAM_INT)), CmdKit::CmdKitException);
    EXPECT_THROW(spec->AddParameter(Param("other", CallSpec::PARAM_INT, "o")),
                 CmdKit::CmdKitException);
    EXPECT_EQ(spec->FindParameter("one")->GetShortName(), "o");
    EXPECT_EQ(spec->FindParameter("missing"), nullptr);
}

}  // namespace
}  // namespace CmdKitTest

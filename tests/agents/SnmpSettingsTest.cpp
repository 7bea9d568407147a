// The SNMP configuration file's XML form: what the agent writes reads back as the same settings.
#include <gtest/gtest.h>

#include "hostsim/agents/snmp/SnmpSettings.h"

namespace {

using BrixSim::Snmp::FormatSettings;
using BrixSim::Snmp::ParseSettings;
using BrixSim::Snmp::Settings;

struct Text {
    const char* name;
    std::string value;
};

void PrintTo(const Text& text, std::ostream* out) {
    *out << text.name;
}

class SettingsRoundTrip : public testing::TestWithParam<Text> {};

// A commit rewrites the whole file from what it read, so every value a file can hold must
// survive the rewrite, in lists and in options alike.
TEST_P(SettingsRoundTrip, ValueSurvivesFormatAndParse) {
    Settings settings = BrixSim::Snmp::FactoryDefaults();
    settings.communities = {GetParam().value, "public"};
    settings.options["syslocation"] = GetParam().value;
    settings.options[GetParam().value] = "key";
    const std::string written = FormatSettings(settings);
    const auto read = ParseSettings(written);
    ASSERT_TRUE(read.has_value()) << written;
    EXPECT_EQ(read->communities, settings.communities) << written;
    EXPECT_EQ(read->options, settings.options) << written;
    // Written again, the file does not change.
    EXPECT_EQ(FormatSettings(*read), written);
}

INSTANTIATE_TEST_SUITE_P(
    Values, SettingsRoundTrip,
    testing::Values(Text{"CarriageReturn", "rack\r4"}, Text{"CarriageReturnLineFeed", "a\r\nb"},
                    Text{"LoneTrailingReturn", "row B\r"}, Text{"LineFeed", "a\nb"},
                    Text{"Tab", "a\tb"}, Text{"ControlCharacter", "a\x01z"},
                    Text{"Markup", "<x a=\"1\"> & 'y'"}, Text{"OuterBlanks", "  padded  "},
                    Text{"Utf8", "H\xc3\xa4rad"}),
    [](const testing::TestParamInfo<Text>& info) { return info.param.name; });

TEST(SnmpSettingsXml, CarriageReturnReferenceInAFileIsKept) {
    const auto read = ParseSettings(
        "<snmpAgent><communities><community>a&#13;b</community></communities></snmpAgent>");
    ASSERT_TRUE(read.has_value());
    ASSERT_EQ(read->communities.size(), 1u);
    EXPECT_EQ(read->communities[0], "a\rb");
}

}  // namespace

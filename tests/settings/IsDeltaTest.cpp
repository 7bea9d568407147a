// IsDelta: the type-aware comparison of a kernel setting with its default.
#include <gtest/gtest.h>

#include "settings/IsDelta.h"

namespace {

using OstrelCli::System::IsDelta;
using Type = HostCtl::System::KernelOption::OptionType;

struct Case {
    const char* name;
    int type;
    const char* defaultValue;
    const char* configured;
    const char* runtime;
    bool delta;
};

// Test output names the row instead of dumping its bytes.
void PrintTo(const Case& row, std::ostream* out) {
    *out << row.name;
}

class IsDeltaTest : public testing::TestWithParam<Case> {};

TEST_P(IsDeltaTest, ComparesByType) {
    const auto& c = GetParam();
    EXPECT_EQ(IsDelta(static_cast<Type>(c.type), c.defaultValue, c.configured, c.runtime), c.delta);
}

const Case kCases[] = {
    // Text compares byte for byte.
    {"StringAllEqual", 0, "vga", "vga", "vga", false},
    {"StringConfiguredDiffers", 0, "vga", "com1", "vga", true},
    {"StringOnlyRuntimeDiffers", 0, "naa", "naa", "t10", true},
    {"StringCaseCounts", 0, "vga", "VGA", "vga", true},
    {"StringEmptyEqual", 0, "", "", "", false},
    // Booleans: true when the first four characters are "TRUE" in any case.
    {"BoolFalseSpellings", 1, "FALSE", "false", "no", false},
    {"BoolTrueAnyCase", 1, "TRUE", "true", "TrUe", false},
    {"BoolTruePrefix", 1, "TRUE", "trueish", "TRUEx", false},
    {"BoolOneIsFalse", 1, "FALSE", "1", "FALSE", false},
    {"BoolShortTextIsFalse", 1, "FALSE", "tru", "", false},
    {"BoolConfiguredTrue", 1, "FALSE", "TRUE", "FALSE", true},
    {"BoolRuntimeTrue", 1, "false", "false", "true", true},
    // Numbers parse as strtoul with base 0, then are cut to the type's width.
    {"Uint32HexEqualsDecimal", 2, "16", "0x10", "0X10", false},
    {"Uint32OctalEqualsDecimal", 2, "8", "010", "8", false},
    {"Uint32EmptyIsZero", 2, "0", "", "junk", false},
    {"Uint32TrailingTextIgnored", 2, "100", "100ms", " 100", false},
    {"Uint32Differs", 2, "100", "250", "250", true},
    {"Uint32Wraps", 2, "0", "4294967296", "0", false},
    {"Uint32MinusOneIsMax", 2, "4294967295", "-1", "4294967295", false},
    {"Uint8KeepsLowBits", 3, "1", "257", "1", false},
    {"Uint8TwoFiftySixIsZero", 3, "0", "256", "0x100", false},
    {"Uint8Differs", 3, "1", "2", "1", true},
    {"Int32Negative", 4, "-12", "4294967284", "-12", false},
    {"Int32Differs", 4, "0", "-1", "0", true},
    {"Int32Wraps", 4, "0", "4294967296", "0", false},
    {"Uint64Wide", 5, "4294967296", "4294967296", "0x100000000", false},
    {"Uint64NotCut", 5, "0", "4294967296", "0", true},
    // An unknown type never differs.
    {"UnknownTypeSix", 6, "a", "b", "c", false},
    {"UnknownTypeNegative", -1, "a", "b", "c", false},
};

INSTANTIATE_TEST_SUITE_P(Types, IsDeltaTest, testing::ValuesIn(kCases),
                         [](const testing::TestParamInfo<Case>& info) { return info.param.name; });

}  // namespace

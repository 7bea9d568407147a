// A constraint kind is added in one place, its rule, and the parser, help, the reference,
// completion and the placeholders all follow it.
#include <gtest/gtest.h>

#include "FakeCommand.h"
#include "cmdkit/CmdKitException.h"
#include "cmdkit/ConstraintRule.h"

namespace CmdKitTest {
namespace {

constexpr int kPaletteKind = 50;

// Accepts the colours of a fixed palette.
class PaletteRule : public CallSpec::ConstraintRule {
  public:
    std::string Refusal(const CallSpec::ParameterSpec&, const CallSpec::ParameterConstraint&,
                        const std::string& value) const override {
        return value == "red" || value == "green" ? "" : "is no colour of the palette";
    }
    std::string HelpNote(const CallSpec::ParameterConstraint&, bool valuesShown) const override {
        return valuesShown ? "" : "(a colour)";
    }
    std::string ReferenceText(const CallSpec::ParameterConstraint&) const override {
        return "a colour of the palette";
    }
    std::vector<CallSpec::ParameterConstraint::EnumValue> Values(
        const CallSpec::ParameterConstraint&) const override {
        return {{"red", "Warm."}, {"green", ""}};
    }
};

std::shared_ptr<AutoCli::Namespace> PaintTree() {
    static const bool registered = [] {
        CallSpec::RegisterConstraintRule(kPaletteKind, std::make_shared<PaletteRule>());
        return true;
    }();
    (void)registered;
    auto inputs = [] {
        auto spec = CallSpec::InputSpec::New();
        auto paint = Param("paint", CallSpec::PARAM_STRING);
        paint->SetDescription("Paint with %ENUM%.");
        paint->SetConstraint(CallSpec::ParameterConstraint::New(kPaletteKind));
        spec->AddParameter(paint);
        auto trim = Param("trim", CallSpec::PARAM_STRING);
        trim->SetConstraint(CallSpec::ParameterConstraint::New(kPaletteKind));
        spec->AddParameter(trim);
        return spec;
    };
    return TreeWith(FakeCommand::New(inputs, nullptr, nullptr));
}

TEST(ConstraintRule, OneRuleServesParserHelpReferenceAndCompletion) {
    const auto tree = PaintTree();

    const auto refused = Invoke(tree, {"a", "b", "cmd", "--paint", "mauve"}, &AutoCli::DryRunCli);
    EXPECT_EQ(refused.status, 2);
    EXPECT_NE(refused.err.find("Invalid value for --paint: mauve is no colour of the palette"),
              std::string::npos)
        << refused.err;
    EXPECT_EQ(Invoke(tree, {"a", "b", "cmd", "--paint", "green"}, &AutoCli::DryRunCli).status, 0);

    const auto help = Invoke(tree, {"a", "b", "cmd", "--help"});
    EXPECT_NE(help.out.find("Paint with red, green."), std::string::npos) << help.out;
    EXPECT_EQ(help.out.find("Paint with red, green. (a colour)"), std::string::npos) << help.out;
    EXPECT_NE(help.out.find("(a colour)"), std::string::npos) << help.out;

    std::ostringstream reference;
    AutoCli::WriteReference(*tree, reference);
    EXPECT_NE(reference.str().find("| a colour of the palette | Paint with red, green. |"),
              std::string::npos)
        << reference.str();

    std::ostringstream completion;
    AutoCli::WriteCompletionScript(*tree, "bash", completion);
    EXPECT_NE(completion.str().find("green"), std::string::npos);
    EXPECT_NE(completion.str().find("Warm"), std::string::npos);
}

TEST(ConstraintRule, AKindWithoutARuleOrWithTwoIsRefused) {
    PaintTree();
    EXPECT_THROW(CallSpec::ParameterConstraint::New(kPaletteKind + 1), CmdKit::CmdKitException);
    EXPECT_THROW(CallSpec::RegisterConstraintRule(kPaletteKind, std::make_shared<PaletteRule>()),
                 CmdKit::CmdKitException);
    EXPECT_THROW(CallSpec::RegisterConstraintRule(CallSpec::CONSTRAINT_REGEX,
                                                  std::make_shared<PaletteRule>()),
                 CmdKit::CmdKitException);
}

}  // namespace
}  // namespace CmdKitTest

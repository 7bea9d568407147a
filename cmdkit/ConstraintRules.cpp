// The constraint kinds the framework knows, and the table every part of it looks them up in.
#include <map>
#include <mutex>

#include "Internal.h"
#include "Values.h"
#include "cmdkit/CmdKitException.h"
#include "cmdkit/ConstraintRule.h"
#include "cmdkit/Text.h"

namespace CmdKit::CallSpec {

std::vector<ParameterConstraint::EnumValue> ConstraintRule::Values(
    const ParameterConstraint&) const {
    return {};
}

namespace {

class IntRangeRule : public ConstraintRule {
  public:
    std::string Refusal(const ParameterSpec& parameter, const ParameterConstraint& constraint,
                        const std::string& value) const override {
        if (parameter.GetType() != PARAM_INT) return "";
        int64_t number = 0;
        Detail::ParseInt64(value, number);
        if (number >= constraint.GetMin() && number <= constraint.GetMax()) return "";
        return "is not in the range " + std::to_string(constraint.GetMin()) + ".." +
               std::to_string(constraint.GetMax());
    }
    std::string HelpNote(const ParameterConstraint& constraint, bool) const override {
        const std::string range = Detail::RangeText(constraint.GetMin(), constraint.GetMax());
        return range.empty() ? "" : "(range " + range + ")";
    }
    std::string ReferenceText(const ParameterConstraint& constraint) const override {
        const bool bounded = constraint.GetMin() != INT64_MIN && constraint.GetMax() != INT64_MAX;
        return (bounded ? "range " : "") +
               Detail::RangeText(constraint.GetMin(), constraint.GetMax());
    }
};

class StringEnumRule : public ConstraintRule {
  public:
    std::string Refusal(const ParameterSpec&, const ParameterConstraint& constraint,
                        const std::string& value) const override {
        for (const auto& entry : constraint.GetEnumValues()) {
            if (entry.value == value) return "";
        }
        return "is not one of: " + Names(constraint);
    }
    std::string HelpNote(const ParameterConstraint& constraint, bool valuesShown) const override {
        return valuesShown ? "" : "(one of: " + Names(constraint) + ")";
    }
    std::string ReferenceText(const ParameterConstraint& constraint) const override {
        // Values with descriptions one a line, bare values on one line.
        bool described = false;
        for (const auto& entry : constraint.GetEnumValues()) {
            described = described || !entry.description.empty();
        }
        std::string text = "one of:";
        const char* separator = " ";
        for (const auto& entry : constraint.GetEnumValues()) {
            text += (described ? "<br>" : separator) + MarkdownCode(entry.value);
            if (!entry.description.empty()) text += ": " + MarkdownText(entry.description);
            separator = ", ";
        }
        return text;
    }
    std::vector<ParameterConstraint::EnumValue> Values(
        const ParameterConstraint& constraint) const override {
        return constraint.GetEnumValues();
    }

  private:
    static std::string Names(const ParameterConstraint& constraint) {
        std::vector<std::string> names;
        for (const auto& entry : constraint.GetEnumValues()) names.push_back(entry.value);
        return Detail::Join(names, ", ");
    }
};

class RegexRule : public ConstraintRule {
  public:
    std::string Refusal(const ParameterSpec&, const ParameterConstraint& constraint,
                        const std::string& value) const override {
        if (Detail::MatchesWhole(constraint.GetRegex(), value)) return "";
        return "does not match the pattern " + constraint.GetRegex();
    }
    std::string HelpNote(const ParameterConstraint& constraint, bool) const override {
        return "(must match " + constraint.GetRegex() + ")";
    }
    std::string ReferenceText(const ParameterConstraint& constraint) const override {
        return "matches " + MarkdownCode(constraint.GetRegex());
    }
};

struct RuleTable {
    std::mutex mutex;
    std::map<int, std::shared_ptr<const ConstraintRule>> rules = {
        {CONSTRAINT_INT_RANGE, std::make_shared<IntRangeRule>()},
        {CONSTRAINT_STRING_ENUM, std::make_shared<StringEnumRule>()},
        {CONSTRAINT_REGEX, std::make_shared<RegexRule>()},
    };
};

RuleTable& Rules() {
    static RuleTable table;
    return table;
}

}  // namespace

const ConstraintRule* FindConstraintRule(int kind) {
    auto& table = Rules();
    std::lock_guard lock(table.mutex);
    const auto found = table.rules.find(kind);
    return found == table.rules.end() ? nullptr : found->second.get();
}

void RegisterConstraintRule(int kind, std::shared_ptr<const ConstraintRule> rule) {
    auto& table = Rules();
    std::lock_guard lock(table.mutex);
    // A rule stays once it is looked up, so a kind is never given another.
    if (!rule || !table.rules.emplace(kind, std::move(rule)).second) {
        throw CmdKitException("Constraint kind " + std::to_string(kind) +
                              " is already registered or has no rule");
    }
}

}  // namespace CmdKit::CallSpec

// What the framework does with one kind of parameter constraint. The parser checks values with
// its rule, help and the reference describe it with it, completion and the enumeration
// placeholders list its values: one rule per kind, kept in one table.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "cmdkit/CallSpec.h"

namespace CmdKit::CallSpec {

class ConstraintRule {
  public:
    virtual ~ConstraintRule() = default;

    // Why `value` is refused, completing "Invalid value for --name: <value> ...", e.g.
    // "is not one of: a, b"; empty when it is accepted. `value` already has the parameter's
    // type.
    virtual std::string Refusal(const ParameterSpec& parameter,
                                const ParameterConstraint& constraint,
                                const std::string& value) const = 0;
    // The note help adds after the parameter's description, e.g. "(range 1..10)"; empty for
    // none. `valuesShown`: the description lists the values already, through a placeholder.
    virtual std::string HelpNote(const ParameterConstraint& constraint, bool valuesShown) const = 0;
    // The constraint's cell in the reference, in Markdown (see MarkdownCode and MarkdownText).
    virtual std::string ReferenceText(const ParameterConstraint& constraint) const = 0;
    // The values a user chooses from, with their descriptions: completion offers them and the
    // placeholders "%ENUM%" and "%FULLENUM%" list them. Empty when the values are no closed set.
    virtual std::vector<ParameterConstraint::EnumValue> Values(
        const ParameterConstraint& constraint) const;
};

// The rule of a constraint kind, or null for a kind nobody registered. The kinds of
// ParameterConstraintType are registered from the start.
const ConstraintRule* FindConstraintRule(int kind);
// Registers the rule of a new `kind`, after which ParameterConstraint::New accepts it. Throws
// CmdKitException for a kind that has a rule already.
void RegisterConstraintRule(int kind, std::shared_ptr<const ConstraintRule> rule);

}  // namespace CmdKit::CallSpec

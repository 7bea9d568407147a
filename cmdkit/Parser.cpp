// Parsing and checking a command's option words against its declared input.
#include "Internal.h"
#include "Values.h"
#include "cmdkit/Cli.h"
#include "cmdkit/ConstraintRule.h"
#include "cmdkit/Text.h"

namespace CmdKit {

namespace Detail {

std::shared_ptr<CallSpec::ParameterSpec> FindOption(const CallSpec::InputSpec& spec,
                                                    const std::string& word, bool& hasInlineValue) {
    hasInlineValue = false;
    if (word.size() < 2 || word[0] != '-') return nullptr;
    const bool isLong = word[1] == '-';
    std::string name = word.substr(isLong ? 2 : 1);
    auto equals = name.find('=');
    if (equals != std::string::npos) {
        hasInlineValue = true;
        name.erase(equals);
    }
    if (name.empty()) return nullptr;
    for (const auto& parameter : spec.GetParameters()) {
        if (isLong ? parameter->GetName() == name : parameter->GetShortName() == name) {
            return parameter;
        }
    }
    return nullptr;
}

}  // namespace Detail

namespace AutoCli {

namespace {

std::string OptionName(const CallSpec::ParameterSpec& parameter) {
    return "--" + parameter.GetName();
}

std::string BothNames(const CallSpec::ParameterSpec& parameter) {
    if (parameter.GetShortName().empty()) return OptionName(parameter);
    return "-" + parameter.GetShortName() + "|" + OptionName(parameter);
}

[[noreturn]] void Refuse(const std::string& message) {
    throw UsageError("Error: " + message);
}

// "Invalid value for --name: <value> <reason>", with a secret value never shown and any other
// quoted as a short excerpt.
[[noreturn]] void RefuseValue(const CallSpec::ParameterSpec& parameter, const std::string& value,
                              const std::string& reason) {
    const std::string shown = parameter.IsSecret() ? "the given value" : MessageExcerpt(value);
    Refuse("Invalid value for " + OptionName(parameter) + ": " + shown + " " + reason);
}

void CheckType(const CallSpec::ParameterSpec& parameter, const std::string& value) {
    switch (parameter.GetType()) {
        case CallSpec::PARAM_INT: {
            int64_t number = 0;
            switch (Detail::ParseInt64(value, number)) {
                case Detail::IntError::NotANumber:
                    RefuseValue(parameter, value, "is not an integer");
                case Detail::IntError::OutOfRange:
                    RefuseValue(parameter, value, "is outside the 64-bit integer range");
                case Detail::IntError::None:
                    break;
            }
            break;
        }
        case CallSpec::PARAM_BOOL:
            if (!Detail::ParseBool(value)) {
                RefuseValue(parameter, value, "is not a boolean (yes|no, true|false, 1|0)");
            }
            break;
        default:
            break;
    }
}

void CheckConstraint(const CallSpec::ParameterSpec& parameter, const std::string& value) {
    const auto& constraint = parameter.GetConstraint();
    const auto* rule = constraint ? CallSpec::FindConstraintRule(constraint->GetType()) : nullptr;
    if (!rule) return;
    if (const std::string reason = rule->Refusal(parameter, *constraint, value); !reason.empty()) {
        RefuseValue(parameter, value, reason);
    }
}

}  // namespace

std::shared_ptr<CallSpec::Input> ParseArguments(const CallSpec::InputSpec& spec,
                                                const std::vector<std::string>& args) {
    auto input = CallSpec::Input::New();
    for (size_t i = 0; i < args.size(); ++i) {
        const std::string& word = args[i];
        if (word.size() < 2 || word[0] != '-') {
            Refuse("Unexpected argument " + MessageExcerpt(word));
        }
        bool hasInlineValue = false;
        auto parameter = Detail::FindOption(spec, word, hasInlineValue);
        if (!parameter) {
            Refuse("Unknown option " + MessageExcerpt(word.substr(0, word.find('='))));
        }
        std::string value;
        if (parameter->GetType() == CallSpec::PARAM_FLAG) {
            if (hasInlineValue) Refuse("Option " + OptionName(*parameter) + " takes no value");
            value = "true";
        } else if (hasInlineValue) {
            value = word.substr(word.find('=') + 1);
        } else if (i + 1 < args.size()) {
            value = args[++i];
        } else {
            Refuse("Missing value for " + OptionName(*parameter));
        }
        if (input->HasParameter(parameter->GetName()) &&
            parameter->GetType() != CallSpec::PARAM_STRING_LIST) {
            Refuse("Option " + OptionName(*parameter) + " given more than once");
        }
        CheckType(*parameter, value);
        CheckConstraint(*parameter, value);
        input->AddValue(parameter->GetName(), value);
    }
    for (const auto& parameter : spec.GetParameters()) {
        if (parameter->IsRequired() && !input->HasParameter(parameter->GetName())) {
            Refuse("Missing required parameter " + BothNames(*parameter));
        }
    }
    return input;
}

}  // namespace AutoCli

}  // namespace CmdKit

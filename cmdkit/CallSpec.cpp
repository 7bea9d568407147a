// Call descriptions and the per-invocation Input and Output.
#include "cmdkit/CallSpec.h"

#include <re2/re2.h>

#include <boost/algorithm/string/case_conv.hpp>
#include <charconv>
#include <regex>

#include "Values.h"
#include "cmdkit/CmdKitException.h"
#include "cmdkit/ConstraintRule.h"

namespace CmdKit {

namespace Detail {

IntError ParseInt64(const std::string& text, int64_t& value) {
    const char* begin = text.data();
    const char* end = begin + text.size();
    if (begin != end && *begin == '+') {
        ++begin;
        if (begin != end && (*begin == '-' || *begin == '+')) return IntError::NotANumber;
    }
    if (begin == end) return IntError::NotANumber;
    auto [ptr, ec] = std::from_chars(begin, end, value, 10);
    if (ec == std::errc::result_out_of_range) {
        // from_chars stops at the end of the digits even when they overflow; junk after them
        // still makes the text no number at all.
        while (ptr != end && *ptr >= '0' && *ptr <= '9') ++ptr;
        return ptr == end ? IntError::OutOfRange : IntError::NotANumber;
    }
    if (ec != std::errc() || ptr != end) return IntError::NotANumber;
    return IntError::None;
}

std::optional<bool> ParseBool(const std::string& text) {
    const std::string lower = boost::algorithm::to_lower_copy(text);
    if (lower == "yes" || lower == "true" || lower == "1") return true;
    if (lower == "no" || lower == "false" || lower == "0") return false;
    return std::nullopt;
}

namespace {

// Bytes, as the ECMAScript matcher of std::regex<char> reads them; errors are reported by
// RegexProblem, not logged.
RE2::Options MatcherOptions() {
    RE2::Options options;
    options.set_encoding(RE2::Options::EncodingLatin1);
    options.set_log_errors(false);
    return options;
}

}  // namespace

std::string RegexProblem(const std::string& pattern) {
    // The ECMAScript check stays: a pattern is documented and read as ECMAScript. Only the
    // pattern is compiled here, never a value.
    try {
        std::regex check(pattern, std::regex::ECMAScript);
    } catch (const std::regex_error& error) {
        return error.what();
    }
    RE2 matcher(pattern, MatcherOptions());
    if (!matcher.ok()) return matcher.error();
    return std::string();
}

bool MatchesWhole(const std::string& pattern, const std::string& value) {
    RE2 matcher(pattern, MatcherOptions());
    if (!matcher.ok()) {
        throw CmdKitException("Invalid regular expression " + pattern + ": " + matcher.error());
    }
    return RE2::FullMatch(value, matcher);
}

}  // namespace Detail

namespace CallSpec {

std::shared_ptr<ParameterConstraint> ParameterConstraint::New(int type) {
    if (!FindConstraintRule(type)) {
        throw CmdKitException("Unknown parameter constraint type " + std::to_string(type));
    }
    return std::shared_ptr<ParameterConstraint>(new ParameterConstraint(type));
}

void ParameterConstraint::SetIntRange(int64_t min, int64_t max) {
    if (min > max) {
        throw CmdKitException("Invalid integer range " + std::to_string(min) + ".." +
                              std::to_string(max));
    }
    min_ = min;
    max_ = max;
}

void ParameterConstraint::SetStringRegex(const std::string& pattern) {
    if (const std::string problem = Detail::RegexProblem(pattern); !problem.empty()) {
        throw CmdKitException("Invalid regular expression " + pattern + ": " + problem);
    }
    regex_ = pattern;
}

void ParameterConstraint::AddStringEnum(const std::string& value, const std::string& description) {
    enums_.push_back(EnumValue{value, description});
}

std::shared_ptr<ParameterSpec> ParameterSpec::New(const std::string& name, int type) {
    if (name.empty()) throw CmdKitException("A parameter needs a name");
    if (type < PARAM_STRING || type > PARAM_STRING_LIST) {
        throw CmdKitException("Unknown type " + std::to_string(type) + " of parameter " + name);
    }
    return std::shared_ptr<ParameterSpec>(new ParameterSpec(name, type));
}

void ParameterSpec::SetShortName(const std::string& shortName) {
    std::string name = shortName;
    if (!name.empty() && name[0] == '-') name.erase(0, 1);
    shortName_ = name;
}

void ParameterSpec::SetDescription(const std::string& description) {
    description_ = description;
}

void ParameterSpec::SetRequired(bool required) {
    required_ = required;
}

void ParameterSpec::SetSecret(bool secret) {
    secret_ = secret;
}

void ParameterSpec::SetConstraint(std::shared_ptr<ParameterConstraint> constraint) {
    constraint_ = std::move(constraint);
}

std::shared_ptr<InputSpec> InputSpec::New() {
    return std::shared_ptr<InputSpec>(new InputSpec);
}

void InputSpec::AddParameter(std::shared_ptr<ParameterSpec> parameter) {
    if (!parameter) throw CmdKitException("Cannot add a null parameter");
    for (const auto& other : parameters_) {
        if (other->GetName() == parameter->GetName()) {
            throw CmdKitException("Parameter --" + parameter->GetName() + " declared twice");
        }
        if (!parameter->GetShortName().empty() &&
            other->GetShortName() == parameter->GetShortName()) {
            throw CmdKitException("Short name -" + parameter->GetShortName() + " declared twice");
        }
    }
    parameters_.push_back(std::move(parameter));
}

void InputSpec::SetContextSupported(const std::string& name) {
    for (const auto& context : contexts_) {
        if (context == name) return;
    }
    contexts_.push_back(name);
}

std::shared_ptr<ParameterSpec> InputSpec::FindParameter(const std::string& name) const {
    for (const auto& parameter : parameters_) {
        if (parameter->GetName() == name) return parameter;
    }
    return nullptr;
}

std::shared_ptr<OutputSpec> OutputSpec::New() {
    return std::shared_ptr<OutputSpec>(new OutputSpec);
}

void OutputSpec::SetRootObject(std::shared_ptr<MetaObj::MetaObject> prototype) {
    root_ = std::move(prototype);
}

std::shared_ptr<Input> Input::New() {
    return std::shared_ptr<Input>(new Input);
}

const std::vector<std::string>* Input::Values(const std::string& name) const {
    auto found = values_.find(name);
    if (found == values_.end() || found->second.empty()) return nullptr;
    return &found->second;
}

namespace {

const std::vector<std::string>& Required(const std::vector<std::string>* values,
                                         const std::string& name) {
    if (!values) throw CmdKitException("Parameter --" + name + " was not given");
    return *values;
}

}  // namespace

std::string Input::GetParameter(const std::string& name) const {
    return Required(Values(name), name).front();
}

long Input::GetParameterInt(const std::string& name) const {
    int64_t value = 0;
    if (Detail::ParseInt64(Required(Values(name), name).front(), value) != Detail::IntError::None) {
        throw CmdKitException("Parameter --" + name + " is not an integer");
    }
    return static_cast<long>(value);
}

bool Input::GetParameterBool(const std::string& name) const {
    auto value = Detail::ParseBool(Required(Values(name), name).front());
    if (!value) throw CmdKitException("Parameter --" + name + " is not a boolean");
    return *value;
}

bool Input::IsFlagSet(const std::string& name) const {
    const auto* values = Values(name);
    if (!values) return false;
    // The parser records a flag as "true"; an explicit false spelling (from a test) clears it.
    auto value = Detail::ParseBool(values->front());
    return !value || *value;
}

bool Input::HasParameter(const std::string& name) const {
    return Values(name) != nullptr;
}

void Input::GetParameterList(const std::string& name, std::vector<std::string>& values) const {
    // An absent list reads as empty: a list has no single value whose absence could mislead.
    const auto* given = Values(name);
    if (given) {
        values = *given;
    } else {
        values.clear();
    }
}

std::string Input::GetContext(const std::string& name) const {
    auto found = contexts_.find(name);
    return found == contexts_.end() ? std::string() : found->second;
}

void Input::AddValue(const std::string& name, const std::string& value) {
    values_[name].push_back(value);
}

void Input::SetContext(const std::string& name, const std::string& value) {
    contexts_[name] = value;
}

std::shared_ptr<Output> Output::New() {
    return std::shared_ptr<Output>(new Output);
}

void Output::SetRootObject(std::shared_ptr<MetaObj::MetaObject> object) {
    root_ = std::move(object);
}

void Output::AddErrorMessage(const std::string& message) {
    errors_.push_back(message);
}

void Output::SetComplete() {
    complete_ = true;
}

}  // namespace CallSpec

}  // namespace CmdKit

// Call descriptions: what a command accepts (InputSpec) and answers (OutputSpec), and the
// per-invocation Input and Output objects.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "cmdkit/MetaObj.h"

namespace CmdKit::CallSpec {

enum ParameterType : int {
    PARAM_STRING = 0,
    PARAM_INT = 1,
    PARAM_BOOL = 2,
    PARAM_FLAG = 3,
    PARAM_STRING_LIST = 4,
};

enum ParameterConstraintType : int {
    CONSTRAINT_INT_RANGE = 1,
    CONSTRAINT_STRING_ENUM = 3,
    CONSTRAINT_REGEX = 4,
};

class ParameterConstraint {
  public:
    struct EnumValue {
        std::string value;
        std::string description;
    };

    static std::shared_ptr<ParameterConstraint> New(int type);

    void SetIntRange(int64_t min, int64_t max);
    void SetStringRegex(const std::string& pattern);
    void AddStringEnum(const std::string& value, const std::string& description);

    int GetType() const { return type_; }
    int64_t GetMin() const { return min_; }
    int64_t GetMax() const { return max_; }
    const std::string& GetRegex() const { return regex_; }
    const std::vector<EnumValue>& GetEnumValues() const { return enums_; }

  private:
    explicit ParameterConstraint(int type) : type_(type) {}

    int type_;
    int64_t min_ = INT64_MIN;
    int64_t max_ = INT64_MAX;
    std::string regex_;
    std::vector<EnumValue> enums_;
};

class ParameterSpec {
  public:
    static std::shared_ptr<ParameterSpec> New(const std::string& name, int type);

    void SetShortName(const std::string& shortName);
    void SetDescription(const std::string& description);
    void SetRequired(bool required);
    void SetSecret(bool secret);
    void SetConstraint(std::shared_ptr<ParameterConstraint> constraint);

    const std::string& GetName() const { return name_; }
    int GetType() const { return type_; }
    const std::string& GetShortName() const { return shortName_; }
    const std::string& GetDescription() const { return description_; }
    bool IsRequired() const { return required_; }
    bool IsSecret() const { return secret_; }
    const std::shared_ptr<ParameterConstraint>& GetConstraint() const { return constraint_; }

  private:
    ParameterSpec(std::string name, int type) : name_(std::move(name)), type_(type) {}

    std::string name_;
    int type_;
    std::string shortName_;
    std::string description_;
    bool required_ = false;
    bool secret_ = false;
    std::shared_ptr<ParameterConstraint> constraint_;
};

class InputSpec {
  public:
    static std::shared_ptr<InputSpec> New();

    void AddParameter(std::shared_ptr<ParameterSpec> parameter);
    void SetContextSupported(const std::string& name);

    const std::vector<std::shared_ptr<ParameterSpec>>& GetParameters() const { return parameters_; }
    const std::vector<std::string>& GetSupportedContexts() const { return contexts_; }
    // The parameter with this long name, or null.
    std::shared_ptr<ParameterSpec> FindParameter(const std::string& name) const;

  private:
    InputSpec() = default;

    std::vector<std::shared_ptr<ParameterSpec>> parameters_;
    std::vector<std::string> contexts_;
};

class OutputSpec {
  public:
    static std::shared_ptr<OutputSpec> New();

    void SetRootObject(std::shared_ptr<MetaObj::MetaObject> prototype);
    const std::shared_ptr<MetaObj::MetaObject>& GetRootObject() const { return root_; }

  private:
    OutputSpec() = default;

    std::shared_ptr<MetaObj::MetaObject> root_;
};

// The parsed, checked arguments of one invocation. Values are kept as given on the command
// line; the typed getters convert (the parser has already checked that they convert).
class Input {
  public:
    static std::shared_ptr<Input> New();

    std::string GetParameter(const std::string& name) const;
    long GetParameterInt(const std::string& name) const;
    bool GetParameterBool(const std::string& name) const;
    bool IsFlagSet(const std::string& name) const;
    bool HasParameter(const std::string& name) const;
    void GetParameterList(const std::string& name, std::vector<std::string>& values) const;
    std::string GetContext(const std::string& name) const;

    // Filled by the framework's parser (and by tests).
    void AddValue(const std::string& name, const std::string& value);
    void SetContext(const std::string& name, const std::string& value);

  private:
    Input() = default;
    const std::vector<std::string>* Values(const std::string& name) const;

    std::map<std::string, std::vector<std::string>> values_;
    std::map<std::string, std::string> contexts_;
};

class Output {
  public:
    static std::shared_ptr<Output> New();

    void SetRootObject(std::shared_ptr<MetaObj::MetaObject> object);
    void AddErrorMessage(const std::string& message);
    void SetComplete();

    const std::shared_ptr<MetaObj::MetaObject>& GetRootObject() const { return root_; }
    const std::vector<std::string>& GetErrorMessages() const { return errors_; }
    bool IsComplete() const { return complete_; }

  private:
    Output() = default;

    std::shared_ptr<MetaObj::MetaObject> root_;
    std::vector<std::string> errors_;
    bool complete_ = false;
};

}  // namespace CmdKit::CallSpec

// A configurable command for exercising the framework in-process.
#pragma once

#include <cctype>
#include <functional>
#include <memory>
#include <ostream>
#include <sstream>
#include <string>
#include <vector>

#include "cmdkit/AutoCli.h"
#include "cmdkit/Cli.h"

namespace CmdKitTest {

// A readable, unique test name for a table row of command-line words: its index, then the
// words with everything but letters and digits dropped ("7_count_12x").
inline std::string WordsTestName(const std::vector<std::string>& words, size_t index) {
    std::string name = std::to_string(index);
    for (const auto& word : words) {
        std::string kept;
        for (char c : word) {
            if (std::isalnum(static_cast<unsigned char>(c))) kept += c;
        }
        if (!kept.empty()) name += "_" + kept;
    }
    return name;
}

// Test output shows a row of command-line words as they would be typed.
inline void PrintWords(const std::vector<std::string>& words, std::ostream* out) {
    for (size_t i = 0; i < words.size(); ++i) *out << (i ? " " : "") << words[i];
}

namespace AutoCli = CmdKit::AutoCli;
namespace CallSpec = CmdKit::CallSpec;
namespace MetaObj = CmdKit::MetaObj;

class FakeCommand : public virtual AutoCli::Command {
  public:
    using InputFactory = std::function<std::shared_ptr<CallSpec::InputSpec>()>;
    using Work = std::function<void(CallSpec::Input&, CallSpec::Output&)>;

    static std::shared_ptr<FakeCommand> New(InputFactory inputs,
                                            std::shared_ptr<MetaObj::MetaObject> prototype,
                                            Work work) {
        return AdoptSelf(std::shared_ptr<FakeCommand>(
            new FakeCommand(std::move(inputs), std::move(prototype), std::move(work))));
    }
    ~FakeCommand() override = default;

    int inputSpecCalls = 0;
    std::shared_ptr<CallSpec::Input> lastInput;

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override {
        ++inputSpecCalls;
        return inputs_ ? inputs_() : CallSpec::InputSpec::New();
    }
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override {
        auto spec = CallSpec::OutputSpec::New();
        spec->SetRootObject(prototype_);
        return spec;
    }
    void ExecuteInternal(std::shared_ptr<CallSpec::Input> input,
                         std::shared_ptr<CallSpec::Output> output) override {
        lastInput = input;
        if (work_) work_(*input, *output);
    }

  private:
    FakeCommand(InputFactory inputs, std::shared_ptr<MetaObj::MetaObject> prototype, Work work)
        : inputs_(std::move(inputs)), prototype_(std::move(prototype)), work_(std::move(work)) {}

    InputFactory inputs_;
    std::shared_ptr<MetaObj::MetaObject> prototype_;
    Work work_;
};

inline std::shared_ptr<CallSpec::ParameterSpec> Param(const std::string& name, int type,
                                                      const std::string& shortName = "",
                                                      bool required = false) {
    auto parameter = CallSpec::ParameterSpec::New(name, type);
    if (!shortName.empty()) parameter->SetShortName(shortName);
    parameter->SetRequired(required);
    return parameter;
}

inline std::shared_ptr<CallSpec::ParameterConstraint> IntRange(int64_t min, int64_t max) {
    auto range = CallSpec::ParameterConstraint::New(CallSpec::CONSTRAINT_INT_RANGE);
    range->SetIntRange(min, max);
    return range;
}

// Values with their descriptions, in order.
inline std::shared_ptr<CallSpec::ParameterConstraint> StringEnum(
    std::initializer_list<std::pair<std::string, std::string>> values) {
    auto choices = CallSpec::ParameterConstraint::New(CallSpec::CONSTRAINT_STRING_ENUM);
    for (const auto& [value, description] : values) choices->AddStringEnum(value, description);
    return choices;
}

inline std::shared_ptr<CallSpec::ParameterConstraint> Regex(const std::string& pattern) {
    auto regex = CallSpec::ParameterConstraint::New(CallSpec::CONSTRAINT_REGEX);
    regex->SetStringRegex(pattern);
    return regex;
}

struct CliRun {
    int status = -1;
    std::string out;
    std::string err;
};

// Runs `args` through `entry` (RunCli, or DryRunCli), capturing both streams.
inline CliRun Invoke(const std::shared_ptr<AutoCli::NamespaceNode>& root,
                     const std::vector<std::string>& args,
                     decltype(&AutoCli::RunCli) entry = &AutoCli::RunCli) {
    std::ostringstream out;
    std::ostringstream err;
    CliRun run;
    run.status = entry(root, args, out, err, {});
    run.out = out.str();
    run.err = err.str();
    return run;
}

// A tree with one command at `a b <word>`.
inline std::shared_ptr<AutoCli::Namespace> TreeWith(std::shared_ptr<FakeCommand> command,
                                                    const std::string& word = "cmd") {
    auto root = AutoCli::Namespace::New();
    auto a = root->SubNamespace("a");
    a->SetDescription("Namespace a.");
    auto b = a->SubNamespace("b");
    b->SetDescription("Namespace b.");
    b->RegisterNamespaceNode(command, word);
    return root;
}

}  // namespace CmdKitTest

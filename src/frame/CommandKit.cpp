#include "frame/CommandKit.h"

#include "hostctl/ReadScope.h"

namespace OstrelCli::System {

Params& Params::Add(const std::string& name, int type, const std::string& shortName,
                    const std::string& description, bool required,
                    std::shared_ptr<CallSpec::ParameterConstraint> constraint) {
    auto parameter = CallSpec::ParameterSpec::New(name, type);
    if (!shortName.empty()) parameter->SetShortName(shortName);
    parameter->SetDescription(description);
    parameter->SetRequired(required);
    if (constraint) parameter->SetConstraint(std::move(constraint));
    spec_->AddParameter(parameter);
    return *this;
}

Params& Params::AddSecret(const std::string& name, int type, const std::string& shortName,
                          const std::string& description, bool required) {
    auto parameter = CallSpec::ParameterSpec::New(name, type);
    if (!shortName.empty()) parameter->SetShortName(shortName);
    parameter->SetDescription(description);
    parameter->SetRequired(required);
    parameter->SetSecret(true);
    spec_->AddParameter(parameter);
    return *this;
}

Params& Params::Context(const std::string& name) {
    spec_->SetContextSupported(name);
    return *this;
}

std::shared_ptr<CallSpec::ParameterConstraint> IntRange(int64_t min, int64_t max) {
    auto constraint = CallSpec::ParameterConstraint::New(CallSpec::CONSTRAINT_INT_RANGE);
    constraint->SetIntRange(min, max);
    return constraint;
}

std::shared_ptr<CallSpec::ParameterConstraint> StringEnum(
    std::initializer_list<std::pair<const char*, const char*>> valuesAndDescriptions) {
    auto constraint = CallSpec::ParameterConstraint::New(CallSpec::CONSTRAINT_STRING_ENUM);
    for (const auto& [value, description] : valuesAndDescriptions) {
        constraint->AddStringEnum(value, description);
    }
    return constraint;
}

std::shared_ptr<CallSpec::ParameterConstraint> Regex(const std::string& pattern) {
    auto constraint = CallSpec::ParameterConstraint::New(CallSpec::CONSTRAINT_REGEX);
    constraint->SetStringRegex(pattern);
    return constraint;
}

std::shared_ptr<CallSpec::OutputSpec> Returns(std::shared_ptr<MetaObj::MetaObject> prototype) {
    auto spec = CallSpec::OutputSpec::New();
    spec->SetRootObject(std::move(prototype));
    return spec;
}

std::shared_ptr<MetaObj::MetaList> StructList(std::shared_ptr<MetaObj::MetaStruct> prototype) {
    return MetaObj::MetaList::New(MetaObj::META_STRUCT, std::move(prototype));
}

namespace {

// The rows are read in the read scope taken when the command made the list, so every walk over
// them sees the same host.
class CallbackRows final : public MetaObj::RowSource {
  public:
    CallbackRows(std::function<void(const RowCallback&)> each, std::string prefix)
        : each_(std::move(each)), prefix_(std::move(prefix)) {}

    void Each(const RowCallback& row) override {
        try {
            each_(row);
        } catch (const HostCtl::Lib::HostCtlException& error) {
            throw MetaObj::RowError(prefix_ + error.what());
        }
    }

  private:
    HostCtl::Lib::ReadScope scope_;
    std::function<void(const RowCallback&)> each_;
    std::string prefix_;
};

}  // namespace

std::shared_ptr<MetaObj::MetaList> StreamedList(std::shared_ptr<MetaObj::MetaStruct> prototype,
                                                std::function<void(const RowCallback& row)> each,
                                                const std::string& prefix) {
    return MetaObj::MetaList::New(std::move(prototype),
                                  std::make_shared<CallbackRows>(std::move(each), prefix));
}

void Answer(CallSpec::Output& output, std::shared_ptr<MetaObj::MetaObject> result) {
    output.SetRootObject(std::move(result));
    output.SetComplete();
}

void Succeed(CallSpec::Output& output) {
    Answer(output, MetaObj::MetaBool::New(true));
}

void Fail(CallSpec::Output& output, const std::string& message) {
    output.AddErrorMessage(message);
}

void Describe(CmdKit::AutoCli::CommandSpec& command, const std::string& description,
              const char* formatter, const char* kind) {
    command.SetDescription(description);
    if (formatter != nullptr) command.SetDefaultOutputFormatter(formatter);
    command.SetMetaDataField("type", kind);
}

}  // namespace OstrelCli::System

// Shared mechanics of the system commands: declaring parameters and results, the error
// convention, and answering.
#pragma once

#include <functional>
#include <initializer_list>
#include <memory>
#include <string>
#include <utility>

#include "cmdkit/AutoCli.h"
#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"

namespace OstrelCli::System {

namespace CallSpec = CmdKit::CallSpec;
using CmdKit::MessageExcerpt;
namespace MetaObj = CmdKit::MetaObj;
using InputPtr = std::shared_ptr<CmdKit::CallSpec::Input>;
using OutputPtr = std::shared_ptr<CmdKit::CallSpec::Output>;

// Builds an declared input parameter by parameter, in declaration order.
class Params {
  public:
    Params() : spec_(CallSpec::InputSpec::New()) {}

    // `shortName` may be empty.
    Params& Add(const std::string& name, int type, const std::string& shortName,
                const std::string& description, bool required,
                std::shared_ptr<CallSpec::ParameterConstraint> constraint = nullptr);
    // As Add, for a value that must never be echoed.
    Params& AddSecret(const std::string& name, int type, const std::string& shortName,
                      const std::string& description, bool required);
    Params& Context(const std::string& name);

    std::shared_ptr<CallSpec::InputSpec> Done() { return spec_; }
    operator std::shared_ptr<CallSpec::InputSpec>() { return spec_; }

  private:
    std::shared_ptr<CallSpec::InputSpec> spec_;
};

std::shared_ptr<CallSpec::ParameterConstraint> IntRange(int64_t min, int64_t max);
std::shared_ptr<CallSpec::ParameterConstraint> StringEnum(
    std::initializer_list<std::pair<const char*, const char*>> valuesAndDescriptions);
std::shared_ptr<CallSpec::ParameterConstraint> Regex(const std::string& pattern);

// An declared output whose root is `prototype`.
std::shared_ptr<CallSpec::OutputSpec> Returns(std::shared_ptr<MetaObj::MetaObject> prototype);
// A list of structures shaped like `prototype`.
std::shared_ptr<MetaObj::MetaList> StructList(std::shared_ptr<MetaObj::MetaStruct> prototype);

// A list of structures shaped like `prototype`, whose rows `each` hands to `row` while the list is
// printed, one at a time, so that a listing of any length takes the memory of one row. `each` may
// be called more than once and gives the same rows each time. A HostCtlException it throws becomes
// the command's error message `prefix + what()`, as with Guard.
using RowCallback = std::function<void(std::shared_ptr<MetaObj::MetaStruct>)>;
std::shared_ptr<MetaObj::MetaList> StreamedList(std::shared_ptr<MetaObj::MetaStruct> prototype,
                                                std::function<void(const RowCallback& row)> each,
                                                const std::string& prefix = std::string());

// Sets `result` as the root object and marks the output complete.
void Answer(CallSpec::Output& output, std::shared_ptr<MetaObj::MetaObject> result);
// The answer of a changing command: boolean true, complete.
void Succeed(CallSpec::Output& output);
// Reports a message that ends the command (no result, not complete).
void Fail(CallSpec::Output& output, const std::string& message);

// The error convention: runs `work`; a HostCtlException becomes the error message
// `prefix + what()` on the output and the command ends without a result.
template <class Work>
void Guard(CallSpec::Output& output, Work&& work, const std::string& prefix = std::string()) {
    try {
        std::forward<Work>(work)();
    } catch (const HostCtl::Lib::HostCtlException& error) {
        output.AddErrorMessage(prefix + error.what());
    }
}

// As Guard, reporting the exception's detailed message.
template <class Work>
void GuardDetailed(CallSpec::Output& output, Work&& work) {
    try {
        std::forward<Work>(work)();
    } catch (const HostCtl::Lib::HostCtlException& error) {
        output.AddErrorMessage(error.GetDetailedMessage());
    }
}

// Sets the constructor-time properties shared by every command.
void Describe(CmdKit::AutoCli::CommandSpec& command, const std::string& description,
              const char* formatter, const char* kind);

}  // namespace OstrelCli::System

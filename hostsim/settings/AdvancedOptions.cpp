// The kernel-control adapters of the advanced-option tree.
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"
#include "kernctl/Adv.h"

using BrixSim::Store;
using HostCtl::Lib::HostCtlException;

namespace {

const BrixSim::Operation kGetDefault{"KernCtl::Adv::AdvancedIntegerOptionImpl::GetDefault"};
const BrixSim::Operation kGetMax{"KernCtl::Adv::AdvancedIntegerOptionImpl::GetMax"};
const BrixSim::Operation kGetMin{"KernCtl::Adv::AdvancedIntegerOptionImpl::GetMin"};
const BrixSim::Operation kGetValue{"KernCtl::Adv::AdvancedIntegerOptionImpl::GetValue"};
const BrixSim::Operation kSetValue{"KernCtl::Adv::AdvancedIntegerOptionImpl::SetValue"};
const BrixSim::Operation kGetBranch{"KernCtl::Adv::AdvancedOptionBranchImpl::GetBranch"};
const BrixSim::Operation kGetBranches{"KernCtl::Adv::AdvancedOptionBranchImpl::GetBranches"};
const BrixSim::Operation kGetOptions{"KernCtl::Adv::AdvancedOptionBranchImpl::GetOptions"};
const BrixSim::Operation kApplyChange{"KernCtl::Adv::AdvancedOptionImpl::ApplyChange"};
const BrixSim::Operation kClearOverride{"KernCtl::Adv::AdvancedOptionImpl::ClearOverride"};
const BrixSim::Operation kFindOption{"KernCtl::Adv::AdvancedOptionImpl::FindOption"};
const BrixSim::Operation kGetDescription{"KernCtl::Adv::AdvancedOptionImpl::GetDescription"};
const BrixSim::Operation kGetPath{"KernCtl::Adv::AdvancedOptionImpl::GetPath"};
const BrixSim::Operation kGetType{"KernCtl::Adv::AdvancedOptionImpl::GetType"};
const BrixSim::Operation kResetToDefault{"KernCtl::Adv::AdvancedOptionImpl::ResetToDefault"};
const BrixSim::Operation kAdvancedStringOptionImplGetDefault{
    "KernCtl::Adv::AdvancedStringOptionImpl::GetDefault"};
const BrixSim::Operation kGetValidCharacters{
    "KernCtl::Adv::AdvancedStringOptionImpl::GetValidCharacters"};
const BrixSim::Operation kAdvancedStringOptionImplGetValue{
    "KernCtl::Adv::AdvancedStringOptionImpl::GetValue"};
const BrixSim::Operation kAdvancedStringOptionImplSetValue{
    "KernCtl::Adv::AdvancedStringOptionImpl::SetValue"};
const BrixSim::Operation kAdvancedUserIntegerOptionImplGetDefault{
    "KernCtl::Adv::AdvancedUserIntegerOptionImpl::GetDefault"};
const BrixSim::Operation kAdvancedUserIntegerOptionImplGetMax{
    "KernCtl::Adv::AdvancedUserIntegerOptionImpl::GetMax"};
const BrixSim::Operation kAdvancedUserIntegerOptionImplGetMin{
    "KernCtl::Adv::AdvancedUserIntegerOptionImpl::GetMin"};
const BrixSim::Operation kAdvancedUserIntegerOptionImplGetValue{
    "KernCtl::Adv::AdvancedUserIntegerOptionImpl::GetValue"};
const BrixSim::Operation kAdvancedUserIntegerOptionImplSetValue{
    "KernCtl::Adv::AdvancedUserIntegerOptionImpl::SetValue"};
const BrixSim::Operation kAdvancedUserStringOptionImplGetDefault{
    "KernCtl::Adv::AdvancedUserStringOptionImpl::GetDefault"};
const BrixSim::Operation kAdvancedUserStringOptionImplGetValidCharacters{
    "KernCtl::Adv::AdvancedUserStringOptionImpl::GetValidCharacters"};
const BrixSim::Operation kAdvancedUserStringOptionImplGetValue{
    "KernCtl::Adv::AdvancedUserStringOptionImpl::GetValue"};
const BrixSim::Operation kAdvancedUserStringOptionImplSetValue{
    "KernCtl::Adv::AdvancedUserStringOptionImpl::SetValue"};

// Other parts of the host read this option's value from the host settings.
constexpr char kMirroredOption[] = "/Dump/autoCreateDumpFile";
constexpr char kMirrorKey[] = "coredump.autoCreateDumpFile";

constexpr char kColumns[] =
    "path, kind, type, description, int_value, int_default, int_min, int_max, str_value,"
    " str_default, valid_chars";

// The operations of the option classes share their adapters: each is found by the name its
// class and method make, which must be one defined above.
const BrixSim::Operation& OperationOf(const char* className, const char* method) {
    return BrixSim::Operation::Named(std::string(className) + "::" + method);
}

void Check(const char* className, const char* method) {
    Store::Get().Check(OperationOf(className, method));
}

std::unique_ptr<KernCtl::Adv::AdvancedOptionImpl> MakeOption(const BrixSim::Stmt& row) {
    using namespace KernCtl::Adv;
    AdvancedOptionData data;
    data.path = row.Text(0);
    const std::string kind = row.Text(1);
    data.type = static_cast<int>(row.Int(2));
    data.description = row.Text(3);
    data.intValue = static_cast<uint32_t>(row.Int(4));
    data.intDefault = static_cast<uint32_t>(row.Int(5));
    data.intMin = static_cast<uint32_t>(row.Int(6));
    data.intMax = static_cast<uint32_t>(row.Int(7));
    data.stringValue = row.Text(8);
    data.stringDefault = row.Text(9);
    data.validCharacters = row.Text(10);
    if (kind == "int") return std::make_unique<AdvancedIntegerOptionImpl>(std::move(data));
    if (kind == "string") return std::make_unique<AdvancedStringOptionImpl>(std::move(data));
    if (kind == "userint") return std::make_unique<AdvancedUserIntegerOptionImpl>(std::move(data));
    if (kind == "userstring") {
        return std::make_unique<AdvancedUserStringOptionImpl>(std::move(data));
    }
    return std::make_unique<AdvancedOptionImpl>(std::move(data));
}

}  // namespace

namespace KernCtl::Adv {

// --- every option ---

AdvancedOptionImpl::AdvancedOptionImpl(AdvancedOptionData data) : data_(std::move(data)) {}
AdvancedOptionImpl::~AdvancedOptionImpl() = default;

const char* AdvancedOptionImpl::ClassName() const {
    return "KernCtl::Adv::AdvancedOptionImpl";
}

std::unique_ptr<AdvancedOptionImpl> AdvancedOptionImpl::FindOption(const std::string& path) {
    auto& store = Store::Get();
    store.Check(kFindOption);
    auto row =
        store.Prepare(std::string("SELECT ") + kColumns + " FROM adv_options WHERE path = ?");
    row.Bind(1, path);
    if (!row.Step())
        throw HostCtlException("Unable to find option " + CmdKit::MessageExcerpt(path),
                               "Not found");
    return MakeOption(row);
}

std::string AdvancedOptionImpl::GetPath() {
    Store::Get().Check(kGetPath);
    return data_.path;
}

int AdvancedOptionImpl::GetType() {
    Store::Get().Check(kGetType);
    return data_.type;
}

std::string AdvancedOptionImpl::GetDescription() {
    Store::Get().Check(kGetDescription);
    return data_.description;
}

// What an option object has staged since its last ApplyChange: the values to store and the
// calls to journal, in the order they were made.
struct StagedOptionChange {
    std::optional<uint32_t> intValue;
    std::optional<std::string> stringValue;
    std::optional<bool> userSet;
    std::vector<std::pair<const BrixSim::Operation*, std::vector<BrixSim::Value>>> calls;
};

StagedOptionChange& AdvancedOptionImpl::Staged() {
    if (!staged_) staged_ = std::make_unique<StagedOptionChange>();
    return *staged_;
}

void AdvancedOptionImpl::ResetToDefault() {
    Store::Get().Check(kResetToDefault);
    if (std::string(ClassName()) == "KernCtl::Adv::AdvancedOptionImpl") {
        throw HostCtlException("Unable to reset option " + data_.path,
                               "the option's value handler is not available");
    }
    auto& staged = Staged();
    staged.calls.push_back({&kResetToDefault, {data_.path}});
    staged.intValue = data_.intDefault;
    staged.stringValue = data_.stringDefault;
    data_.intValue = data_.intDefault;
    data_.stringValue = data_.stringDefault;
}

void AdvancedOptionImpl::ClearOverride() {
    Store::Get().Check(kClearOverride);
    auto& staged = Staged();
    staged.calls.push_back({&kClearOverride, {data_.path}});
    staged.userSet = false;
}

void AdvancedOptionImpl::ApplyChange() {
    auto& store = Store::Get();
    store.Check(kApplyChange);
    store.Write([&] {
        if (staged_) {
            auto update = store.Prepare(
                "UPDATE adv_options SET int_value = COALESCE(?, int_value),"
                " str_value = COALESCE(?, str_value), user_set = COALESCE(?, user_set)"
                " WHERE path = ?");
            if (staged_->intValue) {
                update.Bind(1, int64_t{*staged_->intValue});
            } else {
                update.BindNull(1);
            }
            if (staged_->stringValue) {
                update.Bind(2, *staged_->stringValue);
            } else {
                update.BindNull(2);
            }
            if (staged_->userSet) {
                update.Bind(3, *staged_->userSet);
            } else {
                update.BindNull(3);
            }
            update.Bind(4, data_.path).Run();
            if (staged_->intValue && data_.path == kMirroredOption) {
                store.SetInt(kMirrorKey, *staged_->intValue);
            }
            for (const auto& [operation, args] : staged_->calls)
                store.JournalCall(*operation, args);
        }
        store.JournalCall(kApplyChange, {data_.path});
    });
    staged_.reset();
}

void AdvancedOptionImpl::StoreInteger(uint32_t value) {
    if (value < data_.intMin || value > data_.intMax) {
        throw HostCtlException(
            "Invalid value " + std::to_string(value) + " for option " + data_.path,
            "the value must be between " + std::to_string(data_.intMin) + " and " +
                std::to_string(data_.intMax));
    }
    auto& staged = Staged();
    staged.calls.push_back({&OperationOf(ClassName(), "SetValue"), {data_.path, int64_t{value}}});
    staged.intValue = value;
    staged.userSet = true;
    data_.intValue = value;
}

void AdvancedOptionImpl::StoreString(const std::string& value) {
    if (!data_.validCharacters.empty()) {
        const auto bad = value.find_first_not_of(data_.validCharacters);
        if (bad != std::string::npos) {
            throw HostCtlException(
                "Invalid value '" + CmdKit::MessageExcerpt(value) + "' for option " + data_.path,
                "character '" + CmdKit::MessageExcerpt(value.substr(bad, 1)) + "' is not allowed");
        }
    }
    auto& staged = Staged();
    staged.calls.push_back({&OperationOf(ClassName(), "SetValue"), {data_.path, value}});
    staged.stringValue = value;
    staged.userSet = true;
    data_.stringValue = value;
}

// --- integer options ---

AdvancedIntegerOptionImpl::AdvancedIntegerOptionImpl(AdvancedOptionData data)
    : AdvancedOptionImpl(std::move(data)) {}
AdvancedIntegerOptionImpl::~AdvancedIntegerOptionImpl() = default;
const char* AdvancedIntegerOptionImpl::ClassName() const {
    return "KernCtl::Adv::AdvancedIntegerOptionImpl";
}
uint32_t AdvancedIntegerOptionImpl::GetDefault() {
    Check(ClassName(), "GetDefault");
    return data_.intDefault;
}
uint32_t AdvancedIntegerOptionImpl::GetMin() {
    Check(ClassName(), "GetMin");
    return data_.intMin;
}
uint32_t AdvancedIntegerOptionImpl::GetMax() {
    Check(ClassName(), "GetMax");
    return data_.intMax;
}
uint32_t AdvancedIntegerOptionImpl::GetValue() {
    Check(ClassName(), "GetValue");
    return data_.intValue;
}
void AdvancedIntegerOptionImpl::SetValue(uint32_t value) {
    Check(ClassName(), "SetValue");
    StoreInteger(value);
}

AdvancedUserIntegerOptionImpl::AdvancedUserIntegerOptionImpl(AdvancedOptionData data)
    : AdvancedOptionImpl(std::move(data)) {}
AdvancedUserIntegerOptionImpl::~AdvancedUserIntegerOptionImpl() = default;
const char* AdvancedUserIntegerOptionImpl::ClassName() const {
    return "KernCtl::Adv::AdvancedUserIntegerOptionImpl";
}
uint32_t AdvancedUserIntegerOptionImpl::GetDefault() {
    Check(ClassName(), "GetDefault");
    return data_.intDefault;
}
uint32_t AdvancedUserIntegerOptionImpl::GetMin() {
    Check(ClassName(), "GetMin");
    return data_.intMin;
}
uint32_t AdvancedUserIntegerOptionImpl::GetMax() {
    Check(ClassName(), "GetMax");
    return data_.intMax;
}
uint32_t AdvancedUserIntegerOptionImpl::GetValue() {
    Check(ClassName(), "GetValue");
    return data_.intValue;
}
void AdvancedUserIntegerOptionImpl::SetValue(uint32_t value) {
    Check(ClassName(), "SetValue");
    StoreInteger(value);
}

// --- string options ---

AdvancedStringOptionImpl::AdvancedStringOptionImpl(AdvancedOptionData data)
    : AdvancedOptionImpl(std::move(data)) {}
AdvancedStringOptionImpl::~AdvancedStringOptionImpl() = default;
const char* AdvancedStringOptionImpl::ClassName() const {
    return "KernCtl::Adv::AdvancedStringOptionImpl";
}
std::string AdvancedStringOptionImpl::GetDefault() {
    Check(ClassName(), "GetDefault");
    return data_.stringDefault;
}
std::string AdvancedStringOptionImpl::GetValidCharacters() {
    Check(ClassName(), "GetValidCharacters");
    return data_.validCharacters;
}
std::string AdvancedStringOptionImpl::GetValue() {
    Check(ClassName(), "GetValue");
    return data_.stringValue;
}
void AdvancedStringOptionImpl::SetValue(const std::string& value) {
    Check(ClassName(), "SetValue");
    StoreString(value);
}

AdvancedUserStringOptionImpl::AdvancedUserStringOptionImpl(AdvancedOptionData data)
    : AdvancedOptionImpl(std::move(data)) {}
AdvancedUserStringOptionImpl::~AdvancedUserStringOptionImpl() = default;
const char* AdvancedUserStringOptionImpl::ClassName() const {
    return "KernCtl::Adv::AdvancedUserStringOptionImpl";
}
std::string AdvancedUserStringOptionImpl::GetDefault() {
    Check(ClassName(), "GetDefault");
    return data_.stringDefault;
}
std::string AdvancedUserStringOptionImpl::GetValidCharacters() {
    Check(ClassName(), "GetValidCharacters");
    return data_.validCharacters;
}
std::string AdvancedUserStringOptionImpl::GetValue() {
    Check(ClassName(), "GetValue");
    return data_.stringValue;
}
void AdvancedUserStringOptionImpl::SetValue(const std::string& value) {
    Check(ClassName(), "SetValue");
    StoreString(value);
}

// --- branches ---

AdvancedOptionBranchImpl::AdvancedOptionBranchImpl() = default;
AdvancedOptionBranchImpl::AdvancedOptionBranchImpl(std::string path) : path_(std::move(path)) {}
AdvancedOptionBranchImpl::~AdvancedOptionBranchImpl() = default;

std::vector<std::unique_ptr<HostCtl::Adv::AdvancedOption>> AdvancedOptionBranchImpl::GetOptions() {
    auto& store = Store::Get();
    store.Check(kGetOptions);
    auto row = store.Prepare(std::string("SELECT ") + kColumns +
                             " FROM adv_options WHERE branch = ? ORDER BY seq");
    row.Bind(1, path_);
    std::vector<std::unique_ptr<HostCtl::Adv::AdvancedOption>> options;
    while (row.Step()) options.push_back(MakeOption(row));
    return options;
}

std::vector<std::unique_ptr<HostCtl::Adv::AdvancedOptionBranch>>
AdvancedOptionBranchImpl::GetBranches() {
    auto& store = Store::Get();
    store.Check(kGetBranches);
    auto row = store.Prepare("SELECT path FROM adv_branches WHERE parent = ? ORDER BY seq");
    row.Bind(1, path_);
    std::vector<std::unique_ptr<HostCtl::Adv::AdvancedOptionBranch>> branches;
    while (row.Step()) branches.push_back(std::make_unique<AdvancedOptionBranchImpl>(row.Text(0)));
    return branches;
}

std::unique_ptr<HostCtl::Adv::AdvancedOptionBranch> AdvancedOptionBranchImpl::GetBranch(
    const std::string& name) {
    auto& store = Store::Get();
    store.Check(kGetBranch);
    auto row = store.Prepare("SELECT path FROM adv_branches WHERE parent = ? AND name = ?");
    row.Bind(1, path_).Bind(2, name);
    if (!row.Step()) return nullptr;
    return std::make_unique<AdvancedOptionBranchImpl>(row.Text(0));
}

}  // namespace KernCtl::Adv

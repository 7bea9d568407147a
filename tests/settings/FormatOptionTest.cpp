// FormatOption and FormatBranch on hand-made option trees: the row shapes and the walk.
#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "hostctl/Adv.h"
#include "hostctl/HostCtlException.h"
#include "settings/FormatOption.h"

namespace {

namespace MetaObj = CmdKit::MetaObj;
using HostCtl::Lib::HostCtlException;
using OstrelCli::System::FormatBranch;
using OstrelCli::System::FormatOption;

// An option with nothing but its base operations (its typed view cannot be obtained).
class BareOption : public virtual HostCtl::Adv::AdvancedOption {
  public:
    BareOption(std::string path, int type) : path_(std::move(path)), type_(type) {}
    std::string GetPath() override { return path_; }
    int GetType() override { return type_; }
    std::string GetDescription() override {
        if (failDescription) throw HostCtlException("description unavailable");
        return "about " + path_;
    }
    void ResetToDefault() override {}
    bool failDescription = false;

  private:
    std::string path_;
    int type_;
};

class IntOption : public HostCtl::Adv::AdvancedIntegerOption, public BareOption {
  public:
    IntOption(std::string path, uint32_t value, uint32_t def, uint32_t min, uint32_t max)
        : BareOption(std::move(path), 0), value_(value), def_(def), min_(min), max_(max) {}
    uint32_t GetDefault() override { return def_; }
    uint32_t GetMin() override { return min_; }
    uint32_t GetMax() override { return max_; }
    uint32_t GetValue() override { return value_; }
    void SetValue(uint32_t value) override { value_ = value; }

  private:
    uint32_t value_, def_, min_, max_;
};

class StringOption : public HostCtl::Adv::AdvancedStringOption, public BareOption {
  public:
    StringOption(std::string path, std::string value, std::string def, std::string valid)
        : BareOption(std::move(path), 1),
          value_(std::move(value)),
          def_(std::move(def)),
          valid_(std::move(valid)) {}
    std::string GetDefault() override { return def_; }
    std::string GetValidCharacters() override { return valid_; }
    std::string GetValue() override { return value_; }
    void SetValue(const std::string& value) override { value_ = value; }

  private:
    std::string value_, def_, valid_;
};

// A field's value as text: strings as they are, integers in decimal, "null" for an integer
// without value, "<unset>" for a missing field.
std::string Field(const MetaObj::MetaStruct& row, const std::string& name) {
    const auto value = row.GetField(name);
    if (!value) return "<unset>";
    if (auto text = std::dynamic_pointer_cast<MetaObj::MetaString>(value)) return text->GetValue();
    if (auto number = std::dynamic_pointer_cast<MetaObj::MetaInt>(value)) {
        return number->HasValue() ? std::to_string(number->GetValue()) : "null";
    }
    return "<other>";
}

std::vector<std::string> FieldNames(const MetaObj::MetaStruct& row) {
    std::vector<std::string> names;
    for (const auto& field : row.GetFields()) names.push_back(field.name);
    return names;
}

const std::vector<std::string> kAllFields = {"Path",
                                             "Type",
                                             "Int Value",
                                             "Default Int Value",
                                             "Min Value",
                                             "Max Value",
                                             "String Value",
                                             "Default String Value",
                                             "Valid Characters",
                                             "Description"};

struct RowCase {
    const char* name;
    std::shared_ptr<HostCtl::Adv::AdvancedOption> option;
    bool delta;
    bool include;
    // Expected values of kAllFields, in order.
    std::vector<std::string> values;
};

// Test output names the row instead of dumping its bytes.
void PrintTo(const RowCase& row, std::ostream* out) {
    *out << row.name;
}

class FormatOptionRows : public testing::TestWithParam<RowCase> {};

TEST_P(FormatOptionRows, ShapesTheRow) {
    const auto& c = GetParam();
    bool include = !c.include;
    const auto row = FormatOption(*c.option, c.delta, include);
    EXPECT_EQ(row->GetName(), "SettingsAdvancedOption");
    EXPECT_EQ(include, c.include);
    EXPECT_EQ(FieldNames(*row), kAllFields);
    for (size_t i = 0; i < kAllFields.size(); ++i) {
        EXPECT_EQ(Field(*row, kAllFields[i]), c.values[i]) << kAllFields[i];
    }
}

std::shared_ptr<HostCtl::Adv::AdvancedOption> Int(const char* path, uint32_t value, uint32_t def,
                                                  uint32_t min, uint32_t max) {
    return std::make_shared<IntOption>(path, value, def, min, max);
}
std::shared_ptr<HostCtl::Adv::AdvancedOption> Str(const char* path, const char* value,
                                                  const char* def, const char* valid) {
    return std::make_shared<StringOption>(path, value, def, valid);
}
std::shared_ptr<HostCtl::Adv::AdvancedOption> Bare(const char* path, int type) {
    return std::make_shared<BareOption>(path, type);
}

const RowCase kRows[] = {
    {"IntegerAtDefault",
     Int("/A/I", 5, 5, 0, 9),
     false,
     true,
     {"/A/I", "integer", "5", "5", "0", "9", "", "", "", "about /A/I"}},
    {"IntegerAtDefaultWithDelta",
     Int("/A/I", 5, 5, 0, 9),
     true,
     false,
     {"/A/I", "integer", "5", "5", "0", "9", "", "", "", "about /A/I"}},
    {"IntegerChangedWithDelta",
     Int("/A/I", 7, 5, 0, 9),
     true,
     true,
     {"/A/I", "integer", "7", "5", "0", "9", "", "", "", "about /A/I"}},
    {"IntegerWidensWithoutSign",
     Int("/A/Max", 4294967295U, 4294967295U, 0, 4294967295U),
     false,
     true,
     {"/A/Max", "integer", "4294967295", "4294967295", "0", "4294967295", "", "", "",
      "about /A/Max"}},
    {"StringAtDefaultWithDelta",
     Str("/A/S", "abc", "abc", "abc"),
     true,
     false,
     {"/A/S", "string", "null", "null", "null", "null", "abc", "abc", "abc", "about /A/S"}},
    {"StringCaseCountsWithDelta",
     Str("/A/S", "ABC", "abc", ""),
     true,
     true,
     {"/A/S", "string", "null", "null", "null", "null", "ABC", "abc", "", "about /A/S"}},
    {"StringPrefixDiffersWithDelta",
     Str("/A/S", "ab", "abc", ""),
     true,
     true,
     {"/A/S", "string", "null", "null", "null", "null", "ab", "abc", "", "about /A/S"}},
    {"IntegerWithoutView",
     Bare("/A/X", 0),
     false,
     true,
     {"/A/X", "integer", "-1", "-1", "-1", "-1", "ERROR getting value", "", "", "about /A/X"}},
    {"IntegerWithoutViewWithDelta",
     Bare("/A/X", 0),
     true,
     false,
     {"/A/X", "integer", "-1", "-1", "-1", "-1", "ERROR getting value", "", "", "about /A/X"}},
    {"StringWithoutView",
     Bare("/A/Y", 1),
     false,
     true,
     {"/A/Y", "string", "null", "null", "null", "null", "ERROR getting values", "", "",
      "about /A/Y"}},
    {"StringWithoutViewWithDelta",
     Bare("/A/Y", 1),
     true,
     false,
     {"/A/Y", "string", "null", "null", "null", "null", "ERROR getting values", "", "",
      "about /A/Y"}},
    // A string-typed option that only has an integer view cannot be read as a string.
    {"TypeCodeDecidesTheView",
     [] {
         auto option = std::make_shared<IntOption>("/A/Z", 1, 1, 0, 1);
         return std::shared_ptr<HostCtl::Adv::AdvancedOption>(option);
     }(),
     false,
     true,
     {"/A/Z", "integer", "1", "1", "0", "1", "", "", "", "about /A/Z"}},
};

INSTANTIATE_TEST_SUITE_P(Options, FormatOptionRows, testing::ValuesIn(kRows),
                         [](const testing::TestParamInfo<RowCase>& info) {
                             return info.param.name;
                         });

TEST(FormatOption, UnknownTypeHoldsOnlyPathTypeAndDescription) {
    BareOption option("/A/Odd", 7);
    for (const bool delta : {false, true}) {
        bool include = false;
        const auto row = FormatOption(option, delta, include);
        EXPECT_TRUE(include);
        EXPECT_EQ(FieldNames(*row), (std::vector<std::string>{"Path", "Type", "Description"}));
        EXPECT_EQ(Field(*row, "Type"), "");
        EXPECT_EQ(Field(*row, "Description"), "about /A/Odd");
    }
}

TEST(FormatOption, PlatformFailurePassesOut) {
    IntOption option("/A/I", 1, 1, 0, 1);
    option.failDescription = true;
    bool include = true;
    EXPECT_THROW(FormatOption(option, false, include), HostCtlException);
}

// A branch built in memory; options are made afresh on each call, as the platform does.
class Branch : public HostCtl::Adv::AdvancedOptionBranch {
  public:
    struct Spec {
        std::string name;
        std::vector<std::string> options;  // a leading '!' makes the option fail to read
        std::vector<Spec> branches;
        bool failOptions = false;
        bool failBranches = false;
        bool failOther = false;
    };
    explicit Branch(Spec spec) : spec_(std::move(spec)) {}

    std::vector<std::unique_ptr<HostCtl::Adv::AdvancedOption>> GetOptions() override {
        if (spec_.failOther) throw std::runtime_error("not a platform failure");
        if (spec_.failOptions) throw HostCtlException("options unavailable");
        std::vector<std::unique_ptr<HostCtl::Adv::AdvancedOption>> options;
        for (const auto& name : spec_.options) {
            const bool fail = name[0] == '!';
            const auto value = name == "changed" ? 2U : 1U;
            auto option = std::make_unique<IntOption>(fail ? name.substr(1) : name, value, 1, 0, 9);
            option->failDescription = fail;
            options.push_back(std::move(option));
        }
        return options;
    }
    std::vector<std::unique_ptr<HostCtl::Adv::AdvancedOptionBranch>> GetBranches() override {
        if (spec_.failBranches) throw HostCtlException("branches unavailable");
        std::vector<std::unique_ptr<HostCtl::Adv::AdvancedOptionBranch>> branches;
        for (const auto& child : spec_.branches)
            branches.push_back(std::make_unique<Branch>(child));
        return branches;
    }
    std::unique_ptr<HostCtl::Adv::AdvancedOptionBranch> GetBranch(const std::string&) override {
        return nullptr;
    }

  private:
    Spec spec_;
};

std::vector<std::string> Paths(const MetaObj::MetaList& list) {
    std::vector<std::string> paths;
    for (const auto& element : list.GetElements()) {
        paths.push_back(Field(static_cast<const MetaObj::MetaStruct&>(*element), "Path"));
    }
    return paths;
}

std::shared_ptr<MetaObj::MetaList> EmptyList() {
    return MetaObj::MetaList::New(MetaObj::META_STRUCT,
                                  MetaObj::MetaStruct::New("SettingsAdvancedOption"));
}

struct WalkCase {
    const char* name;
    Branch::Spec tree;
    bool delta;
    std::vector<std::string> paths;
};

// Test output names the row instead of dumping its bytes.
void PrintTo(const WalkCase& row, std::ostream* out) {
    *out << row.name;
}

OstrelCli::System::RowCallback AddTo(MetaObj::MetaList& list) {
    return [&list](std::shared_ptr<MetaObj::MetaStruct> row) { list.Add(std::move(row)); };
}

class FormatBranchWalk : public testing::TestWithParam<WalkCase> {};

TEST_P(FormatBranchWalk, VisitsPreOrder) {
    const auto& c = GetParam();
    Branch root(c.tree);
    auto list = EmptyList();
    FormatBranch(root, AddTo(*list), c.delta);
    EXPECT_EQ(Paths(*list), c.paths);
}

using Spec = Branch::Spec;

const WalkCase kWalks[] = {
    {"OwnOptionsBeforeSubBranches",
     Spec{"", {"a", "b"}, {Spec{"X", {"c"}, {Spec{"Y", {"d"}, {}}}}, Spec{"Z", {"e"}, {}}}},
     false,
     {"a", "b", "c", "d", "e"}},
    {"UnreadableOptionSkipped", Spec{"", {"a", "!b", "c"}, {}}, false, {"a", "c"}},
    {"FailingBranchSkippedWalkGoesOn",
     Spec{"", {"a"}, {Spec{"X", {}, {}, true}, Spec{"Z", {"e"}, {}}}},
     false,
     {"a", "e"}},
    {"RowsBeforeBranchFailureStay",
     Spec{"", {}, {Spec{"X", {"c"}, {Spec{"Y", {"d"}, {}}}, false, true}, Spec{"Z", {"e"}, {}}}},
     false,
     {"c", "e"}},
    {"DeltaKeepsChangedOnly",
     Spec{"", {"a", "changed"}, {Spec{"X", {"changed", "c"}, {}}}},
     true,
     {"changed", "changed"}},
};

INSTANTIATE_TEST_SUITE_P(Trees, FormatBranchWalk, testing::ValuesIn(kWalks),
                         [](const testing::TestParamInfo<WalkCase>& info) {
                             return info.param.name;
                         });

TEST(FormatBranch, RootFailureAndOtherExceptionsPassOut) {
    auto list = EmptyList();
    Branch failing(Spec{"", {}, {}, true});
    EXPECT_THROW(FormatBranch(failing, AddTo(*list), false), HostCtlException);

    Branch other(Spec{"", {"a"}, {Spec{"X", {}, {}, false, false, true}}});
    EXPECT_THROW(FormatBranch(other, AddTo(*list), false), std::runtime_error);
    EXPECT_EQ(Paths(*list), std::vector<std::string>{"a"});
}

}  // namespace

// system settings keyboard layout get / list / set against the simulated host.
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "support/CliJson.h"

namespace {

using BrixTest::Calls;
using BrixTest::Column;
using BrixTest::Json;
using nlohmann::json;

const std::vector<std::string> kGet = {"system", "settings", "keyboard", "layout", "get"};
const std::vector<std::string> kSet = {"system", "settings", "keyboard", "layout", "set"};
const std::vector<std::string> kListCmd = {"system", "settings", "keyboard", "layout", "list"};

std::vector<std::string> With(std::vector<std::string> base, std::vector<std::string> more) {
    base.insert(base.end(), more.begin(), more.end());
    return base;
}

class KeyboardLayout : public testing::Test {
  protected:
    BrixTest::TempHost host;
    const std::string prefix = "KernCtl::System::SystemInfoImpl::";
};

TEST_F(KeyboardLayout, GetAndList) {
    EXPECT_EQ(Json(host, kGet).out, "US Default");
    const auto layouts = Column(Json(host, kListCmd).out, "Layout");
    EXPECT_EQ(layouts.size(), 29U);
    EXPECT_EQ(layouts.front(), "Belgian");
    EXPECT_NE(std::find(layouts.begin(), layouts.end(), "US Default"), layouts.end());
    EXPECT_NE(std::find(layouts.begin(), layouts.end(), "German"), layouts.end());
}

TEST_F(KeyboardLayout, NoPersistLoadsWithoutStoring) {
    const auto run = Json(host, With(kSet, {"-l", "German", "--no-persist"}));
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, true);
    const std::vector<json> expected = {json::array({prefix + "LoadKeyboardMappings", "German"})};
    EXPECT_EQ(Calls(host, prefix), expected);
    EXPECT_EQ(Json(host, kGet).out, "US Default");
}

TEST_F(KeyboardLayout, PersistentChangeIsStoredBeforeItIsLoaded) {
    ASSERT_EQ(Json(host, With(kSet, {"--layout", "French"})).status, 0);
    EXPECT_EQ(Calls(host, prefix),
              (std::vector<json>{{prefix + "SetKeyboardLayout", "French"},
                                 {prefix + "LoadKeyboardMappings", "French"}}));
    EXPECT_EQ(Json(host, kGet).out, "French");
}

TEST_F(KeyboardLayout, WithoutLayoutOnlyReloads) {
    for (const auto& extra :
         {std::vector<std::string>{}, std::vector<std::string>{"--no-persist"}}) {
        ASSERT_EQ(Json(host, With(kSet, extra)).status, 0);
    }
    EXPECT_EQ(Calls(host, prefix), (std::vector<json>{{prefix + "LoadKeyboardMappings", ""},
                                                      {prefix + "LoadKeyboardMappings", ""}}));
    EXPECT_EQ(Json(host, kGet).out, "US Default");
}

TEST_F(KeyboardLayout, UnknownLayoutIsRefused) {
    const auto run = Json(host, With(kSet, {"-l", "Klingon"}));
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "Unknown keyboard layout 'Klingon'\n");
    EXPECT_TRUE(run.out.is_null());
    EXPECT_TRUE(Calls(host, prefix).empty());
    EXPECT_EQ(Json(host, kGet).out, "US Default");
}

TEST_F(KeyboardLayout, StoredLayoutStaysWhenLoadingFails) {
    host.Fault(prefix + "LoadKeyboardMappings", "console busy");
    const auto run = Json(host, With(kSet, {"-l", "Swedish"}));
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "console busy\n");
    EXPECT_EQ(Json(host, kGet).out, "Swedish");
}

TEST_F(KeyboardLayout, ReadFaults) {
    host.Fault(prefix + "GetKeyboardLayouts", "layout table unavailable");
    const auto run = Json(host, kListCmd);
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "layout table unavailable\n");
    EXPECT_TRUE(run.out.is_null());
}

}  // namespace

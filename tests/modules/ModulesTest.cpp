// system module get / list / load / set against the simulated host.
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "hostctl/HostCtlException.h"
#include "kernctl/Module.h"
#include "support/CliJson.h"

namespace {

using BrixTest::Calls;
using BrixTest::Column;
using BrixTest::Json;
using BrixTest::With;
using nlohmann::json;

const std::vector<std::string> kGet = {"system", "module", "get"};
const std::vector<std::string> kList = {"system", "module", "list"};
const std::vector<std::string> kLoad = {"system", "module", "load"};
const std::vector<std::string> kSet = {"system", "module", "set"};
const std::string kModuleOps = "KernCtl::System::ModuleImpl::";

class Modules : public testing::Test {
  protected:
    // The row of a module in the full list.
    json Row(const std::string& name) {
        for (const auto& row : Json(host, kList).out) {
            if (row["Name"] == name) return row;
        }
        return nullptr;
    }

    BrixTest::TempHost host;
};

TEST_F(Modules, ListFiltersByLoadedAndEnabled) {
    const auto all = Json(host, kList);
    ASSERT_EQ(all.status, 0) << all.err;
    EXPECT_GE(all.out.size(), 30U);

    struct Filter {
        std::vector<std::string> args;
        int loaded;  // -1: not filtered
        int enabled;
    };
    const Filter filters[] = {
        {{"-l", "true"}, 1, -1},
        {{"-l", "false"}, 0, -1},
        {{"-e", "yes"}, -1, 1},
        {{"--enabled", "no"}, -1, 0},
        {{"-l", "1", "-e", "1"}, 1, 1},
        {{"-l", "false", "-e", "true"}, 0, 1},
        {{"-l", "TRUE", "-e", "FALSE"}, 1, 0},
        {{"-l", "0", "-e", "0"}, 0, 0},
    };
    for (const auto& filter : filters) {
        json expected = json::array();
        for (const auto& row : all.out) {
            if (filter.loaded >= 0 && row["Is Loaded"] != (filter.loaded == 1)) continue;
            if (filter.enabled >= 0 && row["Is Enabled"] != (filter.enabled == 1)) continue;
            expected.push_back(row);
        }
        EXPECT_FALSE(expected.empty());
        EXPECT_EQ(Json(host, With(kList, filter.args)).out, expected) << filter.args[1];
    }

    EXPECT_EQ(Column(Json(host, With(kList, {"-l", "false", "-e", "true"})).out, "Name"),
              (std::vector<std::string>{"cpu_hotplug", "watchdog_hw", "e1k_compat", "ps2_input",
                                        "qln_nic25g", "hvs_fcoe", "klv_nvmeof"}));
}

TEST_F(Modules, GetShowsAllFieldsInJson) {
    const auto run = host.Cli({"--formatter=json", "system", "module", "get", "-m", "quillfs_drv"});
    ASSERT_EQ(run.status, 0) << run.err;
    const auto details = nlohmann::ordered_json::parse(run.out);
    std::vector<std::string> keys;
    for (const auto& item : details.items()) keys.push_back(item.key());
    EXPECT_EQ(keys, (std::vector<std::string>{
                        "Module", "Module File", "License", "Version", "Build Type", "File Version",
                        "Provided Namespaces", "Required Namespaces", "Signed Status",
                        "Signature Issuer", "Signature Digest", "Signature FingerPrint",
                        "Containing QPK", "QPK Acceptance Level"}));
    EXPECT_EQ(json::parse(run.out), json::parse(R"js({
        "Module": "quillfs_drv",
        "Module File": "/usr/lib/brix/kmod/quillfs_drv",
        "License": "Ostrel",
        "Version": "1.0.7",
        "Build Type": "release",
        "File Version": "1.0.7-8.0.412",
        "Provided Namespaces": "ostrel.fs.quill@1.0",
        "Required Namespaces": ["ostrel.kapi.base@2.1", "ostrel.kapi.storage@1.4",
                                "ostrel.kapi.storage@1.5"],
        "Signed Status": "Unsigned",
        "Signature Issuer": "",
        "Signature Digest": "0000 0000 0000 0000 0000 0000 0000 0000 0000 0000 0000 0000 0000 0000 0000",
        "Signature FingerPrint": "0000 0000 0000 0000 0000 0000 0000 0000",
        "Containing QPK": "brix-base",
        "QPK Acceptance Level": "BrixCertified"})js"));
    EXPECT_EQ(details["Signature Digest"].get<std::string>().size(), 74U);
    EXPECT_EQ(details["Signature FingerPrint"].get<std::string>().size(), 39U);

    // The provided namespace shows only with a version; the first version counts.
    EXPECT_EQ(Json(host, With(kGet, {"-m", "heapmon"})).out["Provided Namespaces"], "");
    EXPECT_EQ(Json(host, With(kGet, {"-m", "kapi_base"})).out["Provided Namespaces"],
              "ostrel.kapi.base@2.0");
    EXPECT_EQ(Json(host, With(kGet, {"-m", "kapi_base"})).out["Required Namespaces"],
              json::array());
}

TEST_F(Modules, GetSimpleViewShowsTheHintedFieldsInOrder) {
    const auto run = host.Cli({"system", "module", "get", "-m", "qln_nic10g"});
    ASSERT_EQ(run.status, 0) << run.err;
    size_t at = 0;
    for (const char* label :
         {"Module", "Module File", "License", "Version", "Build Type", "Provided Namespaces",
          "Required Namespaces", "Containing QPK", "QPK Acceptance Level"}) {
        const auto found = run.out.find(label, at);
        ASSERT_NE(found, std::string::npos) << label << " in\n" << run.out;
        at = found + 1;
    }
    for (const char* hidden : {"File Version", "Signed Status", "Signature", "0000"}) {
        EXPECT_EQ(run.out.find(hidden), std::string::npos) << hidden;
    }
}

TEST_F(Modules, GetUnknownModule) {
    for (const std::string name : {"nosuch", "", "qlnic"}) {
        const auto run = Json(host, With(kGet, {"-m", name}));
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, "unknown module '" + name + "'\n");
        EXPECT_TRUE(run.out.is_null());
    }
}

// The platform keeps the rule too, for any caller that asks it directly.
TEST_F(Modules, PlatformRefusesADisabledModuleWithoutForce) {
    KernCtl::System::ModuleImpl module("hvs_nvme_tcp");
    try {
        module.Load("", false);
        FAIL() << "loaded";
    } catch (const HostCtl::Lib::HostCtlException& error) {
        EXPECT_STREQ(error.what(), "Module 'hvs_nvme_tcp' is disabled");
    }
}

TEST_F(Modules, LoadDisabledModuleNeedsForce) {
    auto run = Json(host, With(kLoad, {"-m", "hvs_nvme_tcp"}));
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "module 'hvs_nvme_tcp' is disabled, use --force to load.\n");
    EXPECT_TRUE(Calls(host, kModuleOps).empty());
    EXPECT_EQ(Row("hvs_nvme_tcp")["Is Loaded"], false);

    run = Json(host, With(kLoad, {"-m", "hvs_nvme_tcp", "--force"}));
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, true);
    EXPECT_EQ(Row("hvs_nvme_tcp"), json::parse(R"({"Name": "hvs_nvme_tcp", "Is Loaded": true,
                                                   "Is Enabled": false})"));

    run = Json(host, With(kLoad, {"-m", "watchdog_hw"}));
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(Calls(host, kModuleOps),
              (std::vector<json>{json::array({kModuleOps + "Load", "hvs_nvme_tcp", "", true}),
                                 json::array({kModuleOps + "Load", "watchdog_hw", "", false})}));
}

class ModuleLoadRefusals : public BrixTest::RefusalTest {};

TEST_P(ModuleLoadRefusals, ReportAndLoadNothing) {
    ExpectRefused(kLoad, "KernCtl::System::ModuleImpl::Load");
}

const BrixTest::Refusal kLoadRefusals[] = {
    {"EmptyName", {"-m", ""}, "Module name cannot be empty."},
    {"EmptyNameForced", {"-m", "", "-f"}, "Module name cannot be empty."},
    {"Unknown", {"-m", "warp_drive"}, "unknown module 'warp_drive'"},
    {"AliasIsNotAName", {"-m", "nvme"}, "unknown module 'nvme'"},
    {"UnknownForcedGoesToThePlatform", {"-m", "warp_drive", "-f"}, "Module 'warp_drive' not found"},
    {"AlreadyLoaded", {"-m", "kapi_base"}, "Module 'kapi_base' is already loaded"},
    {"AliasForcedAlreadyLoaded",
     {"-m", "qlnic", "--force"},
     "Module 'qln_nic10g' is already loaded"},
    {"MissingNamespace",
     {"-m", "qln_rdma", "-f"},
     "Unable to load module 'qln_rdma': required namespace qln.nic25g@2.0 is not provided by "
     "any loaded module"},
};

INSTANTIATE_TEST_SUITE_P(Messages, ModuleLoadRefusals, testing::ValuesIn(kLoadRefusals),
                         BrixTest::RefusalName);

TEST_F(Modules, LoadMeetsRequirementsOnceProvided) {
    ASSERT_EQ(Json(host, With(kLoad, {"-m", "qln_nic25g"})).status, 0);
    const auto run = Json(host, With(kLoad, {"-m", "qln_rdma", "-f"}));
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(Row("qln_rdma")["Is Loaded"], true);
}

TEST_F(Modules, SetEnablesAndDisables) {
    auto run = Json(host, With(kSet, {"-m", "crypto_fips", "-e", "true"}));
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, true);
    EXPECT_EQ(Row("crypto_fips")["Is Enabled"], true);
    ASSERT_EQ(Json(host, With(kSet, {"-m", "pvnet", "--enabled", "false"})).status, 0);
    EXPECT_EQ(Row("pvnet"), json::parse(R"({"Name": "pvnet", "Is Loaded": true,
                                            "Is Enabled": false})"));

    // An alias is not a module name, but force lets it through to the platform.
    run = Json(host, With(kSet, {"-m", "ahci", "-e", "false"}));
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "unknown module 'ahci'\n");
    EXPECT_EQ(Row("ahci_lite")["Is Enabled"], true);
    run = Json(host, With(kSet, {"-m", "ahci", "-e", "false", "-f"}));
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(Row("ahci_lite")["Is Enabled"], false);

    EXPECT_EQ(Calls(host, kModuleOps),
              (std::vector<json>{json::array({kModuleOps + "SetEnabled", "crypto_fips", true}),
                                 json::array({kModuleOps + "SetEnabled", "pvnet", false}),
                                 json::array({kModuleOps + "SetEnabled", "ahci", false})}));
}

TEST_F(Modules, SetRefusals) {
    const std::vector<std::pair<std::vector<std::string>, std::string>> cases = {
        {{"-m", "", "-e", "true", "-f"}, "Module name cannot be empty."},
        {{"-m", "warp_drive", "-e", "true"}, "unknown module 'warp_drive'"},
        {{"-m", "warp_drive", "-e", "true", "-f"}, "Module 'warp_drive' not found"},
    };
    for (const auto& [args, message] : cases) {
        const auto run = Json(host, With(kSet, args));
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, message + "\n");
    }
    EXPECT_TRUE(Calls(host, kModuleOps).empty());
    // "enabled" is required.
    EXPECT_EQ(Json(host, With(kSet, {"-m", "pvnet"})).status, 2);
}

TEST_F(Modules, PlatformFaults) {
    const std::vector<std::pair<std::string, std::vector<std::string>>> cases = {
        {"KernCtl::System::SystemInfoImpl::GetModules", kList},
        {"KernCtl::System::ModuleImpl::IsLoaded", kList},
        {"KernCtl::System::ModuleImpl::IsValidName", With(kGet, {"-m", "pvnet"})},
        {"KernCtl::System::ModuleImpl::GetRequiredNamespaces", With(kGet, {"-m", "pvnet"})},
        {"KernCtl::System::ModuleImpl::GetEnabled", With(kLoad, {"-m", "watchdog_hw"})},
        {"KernCtl::System::ModuleImpl::Load", With(kLoad, {"-m", "watchdog_hw"})},
        {"KernCtl::System::ModuleImpl::SetEnabled", With(kSet, {"-m", "pvnet", "-e", "0"})},
    };
    for (const auto& [operation, args] : cases) {
        host.Sim({"fault", "clear"});
        host.Fault(operation, "kernel busy: " + operation);
        const auto run = Json(host, args);
        EXPECT_EQ(run.status, 1) << operation;
        EXPECT_EQ(run.err, "kernel busy: " + operation + "\n");
        EXPECT_TRUE(run.out.is_null()) << operation;
    }
    host.Sim({"fault", "clear"});
    EXPECT_TRUE(Calls(host, kModuleOps).empty());
    EXPECT_EQ(Row("watchdog_hw")["Is Loaded"], false);
}

}  // namespace

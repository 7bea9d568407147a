// system module parameters list / set / copy.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "cmdkit/CallSpec.h"
#include "modules/ModuleParametersCopy.h"
#include "support/CliJson.h"

namespace {

using BrixTest::Calls;
using BrixTest::Column;
using BrixTest::Json;
using nlohmann::json;

const std::vector<std::string> kList = {"system", "module", "parameters", "list"};
const std::vector<std::string> kSet = {"system", "module", "parameters", "set"};
const std::vector<std::string> kCopy = {"system", "module", "parameters", "copy"};
const std::string kOps = "KernCtl::System::ModuleImpl::";

std::vector<std::string> With(std::vector<std::string> base, std::vector<std::string> more) {
    base.insert(base.end(), more.begin(), more.end());
    return base;
}

class ModuleParameters : public testing::Test {
  protected:
    // The configured values of a module's declared parameters, in declaration order.
    std::vector<std::string> Values(const std::string& module) {
        const auto run = Json(host, With(kList, {"-m", module}));
        EXPECT_EQ(run.status, 0) << run.err;
        return Column(run.out, "Value");
    }

    BrixTest::TempHost host;
};

TEST_F(ModuleParameters, ListShowsDeclaredParametersWithConfiguredValues) {
    const auto run = Json(host, With(kList, {"-m", "qln_nic10g"}));
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, json::parse(R"js([
        {"Name": "rss_queues", "Type": "int", "Value": "8",
         "Description": "Number of receive-side scaling queues per port (1-16)"},
        {"Name": "mtu_max", "Type": "uint", "Value": "",
         "Description": "Largest MTU the ports accept"},
        {"Name": "link_flap_guard", "Type": "bool", "Value": "",
         "Description": "Hold a flapping link down for 30 seconds"},
        {"Name": "debug_mask", "Type": "uint", "Value": "0x0",
         "Description": "Bit mask of debug message classes"}])js"));

    // A configured key the module does not declare is not shown; quotes are not part of a value.
    EXPECT_EQ(Column(Json(host, With(kList, {"-m", "hvs_sas12"})).out, "Name"),
              (std::vector<std::string>{"queue_depth", "log_verbosity", "fw_check"}));
    EXPECT_EQ(Values("hvs_sas12"), (std::vector<std::string>{"128", "", ""}));
    EXPECT_EQ(Values("serial_8250"), (std::vector<std::string>{"115200", "com1 com2"}));
    EXPECT_EQ(Json(host, With(kList, {"-m", "kapi_base"})).out, json::array());
}

TEST_F(ModuleParameters, ListUnknownModule) {
    for (const std::string name : {"warp_drive", "qlnic", "QLN_NIC10G"}) {
        const auto run = Json(host, With(kList, {"-m", name}));
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, "unknown module '" + name + "'\n");
        EXPECT_TRUE(run.out.is_null());
    }
}

TEST_F(ModuleParameters, SetReplacesAndAppendExtends) {
    ASSERT_EQ(Json(host, With(kSet, {"-m", "nvme_core", "-p", "io_queues=4"})).status, 0);
    EXPECT_EQ(Values("nvme_core"), (std::vector<std::string>{"4", "", ""}));

    const auto run = Json(
        host, With(kSet, {"-m", "nvme_core", "-a", "-p", "poll_mode=1  admin_timeout_ms=900"}));
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, true);
    EXPECT_EQ(Values("nvme_core"), (std::vector<std::string>{"4", "1", "900"}));

    // A later value for the same key wins.
    ASSERT_EQ(Json(host, With(kSet, {"-m", "nvme_core", "--append", "-p", "io_queues=6"})).status,
              0);
    EXPECT_EQ(Values("nvme_core"), (std::vector<std::string>{"6", "1", "900"}));

    // An empty string clears the parameters.
    ASSERT_EQ(Json(host, With(kSet, {"-m", "nvme_core", "-p", ""})).status, 0);
    EXPECT_EQ(Values("nvme_core"), (std::vector<std::string>{"", "", ""}));

    EXPECT_EQ(Calls(host, kOps),
              (std::vector<json>{
                  json::array({kOps + "SetParameterString", "nvme_core", "io_queues=4", false}),
                  json::array({kOps + "AppendParameterString", "nvme_core",
                               "poll_mode=1  admin_timeout_ms=900", false}),
                  json::array({kOps + "AppendParameterString", "nvme_core", "io_queues=6", false}),
                  json::array({kOps + "SetParameterString", "nvme_core", "", false})}));
}

TEST_F(ModuleParameters, SetThroughAnAliasNeedsForce) {
    auto run = Json(host, With(kSet, {"-m", "qlnic", "-p", "mtu_max=9000"}));
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "Module 'qlnic' not found\n");
    run = Json(host, With(kSet, {"-m", "qlnic", "-p", "mtu_max=9000", "-a", "-f"}));
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(Values("qln_nic10g"), (std::vector<std::string>{"8", "9000", "", "0x0"}));
}

TEST_F(ModuleParameters, SetRefusals) {
    const std::vector<std::pair<std::vector<std::string>, std::string>> cases = {
        {{"-m", "", "-p", "a=1", "-f"}, "Module name cannot be empty."},
        {{"-m", "warp_drive", "-p", "a=1"}, "Module 'warp_drive' not found"},
        {{"-m", "nvme_core", "-p", "io_queues=\"4"},
         "Invalid parameter string 'io_queues=\"4': unterminated quote"},
        {{"-m", "nvme_core", "-p", "=4", "-a"},
         "Invalid parameter string '=4': a parameter needs a name"},
    };
    for (const auto& [args, message] : cases) {
        const auto run = Json(host, With(kSet, args));
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, message + "\n");
        EXPECT_TRUE(run.out.is_null());
    }
    EXPECT_TRUE(Calls(host, kOps).empty());
    EXPECT_EQ(Values("nvme_core"), (std::vector<std::string>{"", "1", ""}));
}

TEST_F(ModuleParameters, CopyCopiesOnlyTheListedKeys) {
    ASSERT_EQ(Json(host, With(kSet, {"-m", "qln_nic25g", "-p", "debug_mask=0x4"})).status, 0);
    const auto run =
        Json(host, With(kCopy, {"-s", "qln_nic10g", "-t", "qln_nic25g", "-p", "rss_queues"}));
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, true);
    EXPECT_EQ(Values("qln_nic25g"), (std::vector<std::string>{"8", "0x4"}));

    // Several keys, and a key already set in the target is replaced.
    ASSERT_EQ(Json(host, With(kCopy, {"-s", "qln_nic10g", "-t", "qln_nic25g", "-p", "debug_mask",
                                      "-p", "rss_queues"}))
                  .status,
              0);
    EXPECT_EQ(Values("qln_nic25g"), (std::vector<std::string>{"8", "0x0"}));
    EXPECT_EQ(Calls(host, kOps + "Copy"),
              (std::vector<json>{json::array({kOps + "CopyParameters", "qln_nic10g", "qln_nic25g",
                                              json::array({"rss_queues"}), false}),
                                 json::array({kOps + "CopyParameters", "qln_nic10g", "qln_nic25g",
                                              json::array({"debug_mask", "rss_queues"}), false})}));
}

TEST_F(ModuleParameters, CopyRefusals) {
    const std::vector<std::pair<std::vector<std::string>, std::string>> cases = {
        {{"-s", "", "-t", "nvme_core", "-p", "x"}, "Module names cannot be empty."},
        {{"-s", "nvme_core", "-t", "", "-p", "x"}, "Module names cannot be empty."},
        {{"-s", "a", "-t", "a", "-p", "x"}, "Module names have to be different."},
        // Names that differ only in case are different names.
        {{"-s", "a", "-t", "A", "-p", "x"}, "Module 'A' not found"},
        {{"-s", "warp_drive", "-t", "nvme_core", "-p", "x"}, "Module 'warp_drive' not found"},
        {{"-s", "warp_drive", "-t", "nvme_core", "-p", "x", "-f"},
         "Parameter 'x' is not configured for module 'warp_drive'"},
        {{"-s", "qln_nic10g", "-t", "qln_nic25g", "-p", "rss_queues", "-p", "mtu_max"},
         "Parameter 'mtu_max' is not configured for module 'qln_nic10g'"},
    };
    for (const auto& [args, message] : cases) {
        const auto run = Json(host, With(kCopy, args));
        EXPECT_EQ(run.status, 1) << message;
        EXPECT_EQ(run.err, message + "\n");
    }
    EXPECT_TRUE(Calls(host, kOps).empty());
    EXPECT_EQ(Values("qln_nic25g"), (std::vector<std::string>{"", ""}));
}

// The key list cannot be empty on the command line; the command still checks it, after the
// names.
TEST(ModuleParametersCopyChecks, OrderOfChecks) {
    const auto run = [](const std::string& source, const std::string& target) {
        auto input = CmdKit::CallSpec::Input::New();
        input->AddValue("source", source);
        input->AddValue("target", target);
        auto output = CmdKit::CallSpec::Output::New();
        OstrelCli::System::ModuleParametersCopy::New()->Execute(input, output);
        EXPECT_FALSE(output->IsComplete());
        EXPECT_EQ(output->GetRootObject(), nullptr);
        return output->GetErrorMessages();
    };
    EXPECT_EQ(run("", "b"), std::vector<std::string>{"Module names cannot be empty."});
    EXPECT_EQ(run("a", "a"), std::vector<std::string>{"Module names have to be different."});
    EXPECT_EQ(run("a", "b"),
              std::vector<std::string>{"Selection of paramter keys to copy cannot be empty."});
}

TEST_F(ModuleParameters, PlatformFaults) {
    host.Fault("KernCtl::System::ModuleImpl::GetParameters", "parameter table unreadable");
    auto run = Json(host, With(kList, {"-m", "nvme_core"}));
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "parameter table unreadable\n");
    host.Sim({"fault", "clear"});
    host.Fault("HostCtl::System::SystemInfo::GetModule", "host unreachable");
    run = Json(host, With(kSet, {"-m", "nvme_core", "-p", "io_queues=2"}));
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "host unreachable\n");
    EXPECT_TRUE(Calls(host, kOps).empty());
}

}  // namespace

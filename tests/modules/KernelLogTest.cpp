// The kernel log-level commands: built, but reachable from no path of the tree; exercised here
// in-process.
#include <gtest/gtest.h>

#include <csignal>
#include <functional>
#include <string>
#include <utility>
#include <vector>

#include "brixcli/SystemPlugin.h"
#include "cmdkit/AutoCli.h"
#include "modules/KernelLogList.h"
#include "modules/KernelLogSetLevel.h"
#include "os/HostOs.h"
#include "support/CliJson.h"

namespace {

namespace CallSpec = CmdKit::CallSpec;
namespace MetaObj = CmdKit::MetaObj;
using BrixTest::Calls;
using nlohmann::json;

using Args = std::vector<std::pair<std::string, std::string>>;

std::shared_ptr<CallSpec::Output> Invoke(CmdKit::AutoCli::Command& command, const Args& args) {
    auto input = CallSpec::Input::New();
    for (const auto& [name, value] : args) input->AddValue(name, value);
    auto output = CallSpec::Output::New();
    command.Execute(input, output);
    return output;
}

// The rows of a LogLevel list as [name, current, default].
json Levels(const CallSpec::Output& output) {
    json rows = json::array();
    const auto list = std::dynamic_pointer_cast<MetaObj::MetaList>(output.GetRootObject());
    if (!list) return nullptr;
    for (const auto& element : list->GetElements()) {
        const auto& row = static_cast<const MetaObj::MetaStruct&>(*element);
        const auto number = [&](const char* field) {
            return std::static_pointer_cast<MetaObj::MetaInt>(row.GetField(field))->GetValue();
        };
        rows.push_back(
            {std::static_pointer_cast<MetaObj::MetaString>(row.GetField("Name"))->GetValue(),
             number("Current Level"), number("Default Level")});
    }
    return rows;
}

class KernelLog : public testing::Test {
  protected:
    json List(const Args& args) {
        const auto output = Invoke(*list, args);
        EXPECT_TRUE(output->GetErrorMessages().empty());
        return Levels(*output);
    }
    std::vector<std::string> Set(const Args& args) {
        const auto output = Invoke(*set, args);
        if (output->GetErrorMessages().empty()) {
            EXPECT_TRUE(output->IsComplete());
            const auto result =
                std::dynamic_pointer_cast<MetaObj::MetaBool>(output->GetRootObject());
            EXPECT_TRUE(result && result->GetValue());
        } else {
            EXPECT_FALSE(output->IsComplete());
            EXPECT_EQ(output->GetRootObject(), nullptr);
        }
        return output->GetErrorMessages();
    }

    BrixTest::TempHost host;
    std::shared_ptr<OstrelCli::System::KernelLogList> list =
        OstrelCli::System::KernelLogList::New();
    std::shared_ptr<OstrelCli::System::KernelLogSetLevel> set =
        OstrelCli::System::KernelLogSetLevel::New();
};

TEST_F(KernelLog, ListsCoreAndModuleLevels) {
    const auto core = List({});
    EXPECT_EQ(core.size(), 14U);
    EXPECT_EQ(core[0], json::array({"Init", 1, 1}));
    EXPECT_EQ(List({{"level-name", "ScsiPath"}}), json::parse(R"([["ScsiPath", 2, 1]])"));
    EXPECT_EQ(List({{"level-name", "scsipath"}}), json::array());
    EXPECT_EQ(List({{"module", "dsfs3"}}), json::parse(R"([["dsfs", 0, 0], ["dsfsLock", 0, 0]])"));
    EXPECT_EQ(List({{"module", "dsfs3"}, {"level-name", "dsfsLock"}}),
              json::parse(R"([["dsfsLock", 0, 0]])"));
    EXPECT_EQ(List({{"module", "kapi_base"}}), json::array());
}

TEST_F(KernelLog, ListOfMissingModule) {
    for (const std::string name : {"warp_drive", "qlnic"}) {
        const auto output = Invoke(*list, {{"module", name}});
        EXPECT_EQ(output->GetErrorMessages(),
                  std::vector<std::string>{"Could not find module with the name '" + name + "'"});
        EXPECT_EQ(output->GetRootObject(), nullptr);
    }
}

TEST_F(KernelLog, SetAndReset) {
    EXPECT_TRUE(Set({{"level-name", "Net"}, {"level", "3"}}).empty());
    EXPECT_TRUE(
        Set({{"level-name", "qln_nic10gDbg"}, {"module", "qln_nic10g"}, {"level", "5"}}).empty());
    // Only the presence of "default" counts.
    EXPECT_TRUE(Set({{"level-name", "ScsiPath"}, {"default", "false"}}).empty());
    EXPECT_TRUE(
        Set({{"level-name", "hvs_sas"}, {"module", "hvs_sas"}, {"default", "true"}}).empty());

    EXPECT_EQ(List({{"level-name", "Net"}}), json::parse(R"([["Net", 3, 0]])"));
    EXPECT_EQ(List({{"level-name", "ScsiPath"}}), json::parse(R"([["ScsiPath", 1, 1]])"));
    EXPECT_EQ(List({{"module", "qln_nic10g"}}),
              json::parse(R"([["qln_nic10g", 0, 0], ["qln_nic10gDbg", 5, 0]])"));

    const std::string sys = "KernCtl::System::SystemInfoImpl::";
    const std::string mod = "KernCtl::System::ModuleImpl::";
    EXPECT_EQ(
        Calls(host, "KernCtl::System::"),
        (std::vector<json>{json::array({sys + "SetLogLevel", "Net", 3}),
                           json::array({mod + "SetLogLevel", "qln_nic10g", "qln_nic10gDbg", 5}),
                           json::array({sys + "SetDefaultLogLevel", "ScsiPath"}),
                           json::array({mod + "SetDefaultLogLevel", "hvs_sas", "hvs_sas"})}));
}

TEST_F(KernelLog, LevelsDoNotSurviveARestart) {
    EXPECT_TRUE(Set({{"level-name", "Net"}, {"level", "3"}}).empty());
    EXPECT_TRUE(Set({{"level-name", "dsfs"}, {"module", "dsfs3"}, {"level", "4"}}).empty());
    EXPECT_EQ(List({{"level-name", "Net"}}), json::parse(R"([["Net", 3, 0]])"));
    ASSERT_EQ(HostOs::kill(1, SIGUSR2), 0);  // powered off, and on again
    EXPECT_EQ(List({{"level-name", "Net"}}), json::parse(R"([["Net", 0, 0]])"));
    EXPECT_EQ(List({{"level-name", "ScsiPath"}}), json::parse(R"([["ScsiPath", 1, 1]])"));
    EXPECT_EQ(List({{"module", "dsfs3"}, {"level-name", "dsfs"}}),
              json::parse(R"([["dsfs", 0, 0]])"));
    EXPECT_TRUE(Set({{"level-name", "Net"}, {"level", "2"}}).empty());
    EXPECT_EQ(List({{"level-name", "Net"}}), json::parse(R"([["Net", 2, 0]])"));
}

TEST_F(KernelLog, SetRefusals) {
    const std::vector<std::pair<Args, std::string>> cases = {
        {{{"level-name", "Net"}, {"default", "true"}, {"level", "2"}},
         "cant specify default with level"},
        {{{"level-name", "Net"}, {"default", "false"}, {"level", "2"}},
         "cant specify default with level"},
        {{{"level-name", "Net"}}, "must specify default or level"},
        {{{"level-name", "Net"}, {"module", "pvnet"}}, "must specify default or level"},
        {{{"level-name", "NoSuchLevel"}, {"level", "1"}}, "Unknown log level 'NoSuchLevel'"},
        {{{"level-name", "net"}, {"default", "true"}}, "Unknown log level 'net'"},
        {{{"level-name", "nvme"}, {"module", "warp_drive"}, {"level", "1"}},
         "Module 'warp_drive' not found"},
        {{{"level-name", "Net"}, {"module", "nvme_core"}, {"level", "1"}},
         "Unknown log level 'Net' of module 'nvme_core'"},
    };
    for (const auto& [args, message] : cases) {
        EXPECT_EQ(Set(args), std::vector<std::string>{message});
    }
    EXPECT_TRUE(Calls(host, "KernCtl::System::").empty());
    EXPECT_EQ(List({{"level-name", "Net"}}), json::parse(R"([["Net", 0, 0]])"));
}

TEST_F(KernelLog, Faults) {
    host.Fault("KernCtl::System::SystemInfoImpl::GetAllLogLevels", "log levels unavailable");
    const auto output = Invoke(*list, {});
    EXPECT_EQ(output->GetErrorMessages(), std::vector<std::string>{"log levels unavailable"});
    EXPECT_EQ(output->GetRootObject(), nullptr);
}

TEST(KernelLogRegistration, NotReachableFromTheTree) {
    auto root = CmdKit::AutoCli::Namespace::New();
    AutoCli_RegisterNamespaces(root);
    size_t commands = 0;
    std::function<void(const std::shared_ptr<CmdKit::AutoCli::NamespaceNode>&)> walk =
        [&](const std::shared_ptr<CmdKit::AutoCli::NamespaceNode>& node) {
            EXPECT_EQ(std::dynamic_pointer_cast<OstrelCli::System::KernelLogList>(node), nullptr);
            EXPECT_EQ(std::dynamic_pointer_cast<OstrelCli::System::KernelLogSetLevel>(node),
                      nullptr);
            if (node->GetType() == CmdKit::AutoCli::NodeType::Command) ++commands;
            for (const auto& child : node->GetNamespaceNodes()) walk(child);
        };
    walk(root);
    EXPECT_GT(commands, 15U);
}

}  // namespace

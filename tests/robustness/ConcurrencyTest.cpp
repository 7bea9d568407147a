// Many brixcli processes at once, each changing a different setting of the same host (advanced
// options, module parameters, settings of the one SNMP file, host name and domain, ...): every
// acknowledged change is there afterwards. BRIX_ROBUST_ROUNDS (default 3) sets how often.
#include <gtest/gtest.h>

#include <functional>
#include <latch>
#include <map>
#include <nlohmann/json.hpp>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "Robustness.h"
#include "kernctl/DnsConfig.h"
#include "support/TestHost.h"

namespace {

using BrixRobust::Words;
using BrixTest::RunResult;
using BrixTest::TempHost;
using nlohmann::json;

// One setting: its value for a key (distinct keys give distinct values, up to ten), the
// command line that sets a value, the getter that shows it and where in the getter's JSON the
// value is. Settings with several writers have them race each other too.
struct Setting {
    std::function<std::string(int)> value;
    std::function<std::string(const std::string&)> set;
    std::string get;
    std::function<std::string(const json&)> pick;
    int writers = 1;
};

Setting Racing(Setting setting, int writers) {
    setting.writers = writers;
    return setting;
}

std::function<std::string(const json&)> Field(const std::string& name) {
    return [name](const json& document) {
        const auto& value = document.at(name);
        return value.is_string() ? value.get<std::string>() : value.dump();
    };
}

// The `field` of the row whose `key` is `name`.
std::function<std::string(const json&)> Row(const std::string& key, const std::string& name,
                                            const std::string& field) {
    return [=](const json& rows) {
        for (const auto& row : rows) {
            if (row.at(key) == name) {
                const auto& value = row.at(field);
                return value.is_string() ? value.get<std::string>() : value.dump();
            }
        }
        return std::string("(no row " + name + ")");
    };
}

std::function<std::string(int)> Numbered(const std::string& prefix, int base = 0) {
    return [=](int key) { return prefix + std::to_string(base + key % 10); };
}

std::function<std::string(int)> Alternating(const std::string& even, const std::string& odd) {
    return [=](int key) { return key % 2 == 0 ? even : odd; };
}

std::function<std::string(const std::string&)> Command(const std::string& line) {
    return [line](const std::string& value) { return line + " " + value; };
}

Setting AdvancedInt(const std::string& path, int base) {
    return {Numbered("", base), Command("system settings advanced set -o " + path + " -i"),
            "system settings advanced list", Row("Path", path, "Int Value")};
}

Setting ModuleParameter(const std::string& module, const std::string& parameter, int base) {
    return {Numbered("", base),
            [=](const std::string& value) {
                return "system module parameters set -m " + module + " -p " + parameter + "=" +
                       value;
            },
            "system module parameters list -m " + module, Row("Name", parameter, "Value")};
}

Setting Snmp(const std::string& option, std::function<std::string(int)> value,
             const std::string& field) {
    return {std::move(value), Command("system snmp set --" + option), "system snmp get",
            Field(field)};
}

std::vector<Setting> Settings() {
    return {
        AdvancedInt("/Cpu/IdleSpinUs", 20),
        AdvancedInt("/Cpu/MigrationCostUs", 4000),
        AdvancedInt("/Cpu/CreditAgeMs", 2000),
        AdvancedInt("/Disk/MaxLun", 500),
        AdvancedInt("/Disk/SchedQuantum", 10),
        AdvancedInt("/Dump/CompressionLevel", 0),
        AdvancedInt("/Irq/MaxIrqsPerVector", 2),
        AdvancedInt("/UserVars/SshSessionLimit", 40),
        {Numbered("hint"), Command("system settings advanced set -o /Dump/DumpDatastoreHint -s"),
         "system settings advanced list", Row("Path", "/Dump/DumpDatastoreHint", "String Value")},
        ModuleParameter("nvme_core", "io_queues", 4),
        ModuleParameter("qln_nic10g", "rss_queues", 2),
        ModuleParameter("qln_nic25g", "rss_queues", 6),
        Racing(Snmp("syslocation", Numbered("hall-"), "syslocation"), 3),
        Snmp("syscontact", Numbered("desk-"), "syscontact"),
        {Numbered("pub"), Command("system snmp set --communities"), "system snmp get",
         [](const json& agent) { return agent.at("communities").at(0).get<std::string>(); }},
        {Numbered("trap", 1),
         [](const std::string& value) {
             return "system snmp set --targets 127.0.0.1@6162/" + value;
         },
         "system snmp get",
         [](const json& agent) {
             const std::string target = agent.at("targets").at(0).get<std::string>();
             return target.substr(target.find('/') + 1);
         }},
        Snmp("loglevel", Alternating("debug", "error"), "loglevel"),
        Snmp("hwsrc", Alternating("sensors", "indications"), "hwsrc"),
        Snmp("largestorage", Alternating("false", "true"), "largestorage"),
        Racing({Numbered("node-"), Command("system hostname set --host"), "system hostname get",
                Field("Host Name")},
               3),
        Racing({Numbered("zone-"), Command("system hostname set --domain"), "system hostname get",
                Field("Domain Name")},
               3),
        {Numbered("", 6000), Command("system wbem set --port"), "system wbem get", Field("Port")},
        {Alternating("debug", "error"), Command("system wbem set --loglevel"), "system wbem get",
         Field("Log level")},
        {Alternating("false", "true"), Command("system wbem provider set -n brix_storage -e"),
         "system wbem provider list", Row("Name", "brix_storage", "Enabled")},
        {Numbered("", 1), Command("system settings kernel set -s acpiDebugLevel -v"),
         "system settings kernel list", Row("Name", "acpiDebugLevel", "Configured")},
        {Numbered("Welcome-"), Command("system welcomemsg set -m"), "system welcomemsg get",
         [](const json& message) { return message.get<std::string>(); }},
        {Alternating("Danish", "Finnish"), Command("system settings keyboard layout set -l"),
         "system settings keyboard layout get",
         [](const json& layout) { return layout.get<std::string>(); }},
        {Alternating("audit", "disabled"), Command("system secpolicy domain set -n hostDaemons -l"),
         "system secpolicy domain list", Row("Domain Name", "hostDaemons", "Enforcement Level")},
    };
}

TEST(Concurrency, EveryAcknowledgedChangeOfConcurrentProcessesStays) {
    TempHost host;
    ASSERT_EQ(host.Cli({"system", "uuid", "get"}).status, 0);  // seeds the host
    const auto settings = Settings();
    const int rounds = BrixRobust::EnvCount("BRIX_ROBUST_ROUNDS", 3);

    struct Writer {
        size_t setting;
        std::string value;
        RunResult result;
    };
    for (int round = 1; round <= rounds; ++round) {
        SCOPED_TRACE("round " + std::to_string(round));
        std::vector<Writer> writers;
        for (size_t i = 0; i < settings.size(); ++i) {
            for (int w = 0; w < settings[i].writers; ++w) {
                writers.push_back({i, settings[i].value(round * settings[i].writers + w), {}});
            }
        }
        ASSERT_GE(writers.size(), 16u);

        // All writers at once, each from its own thread, released together.
        std::vector<std::thread> threads;
        std::latch start(static_cast<std::ptrdiff_t>(writers.size()));
        for (auto& writer : writers) {
            threads.emplace_back([&] {
                const auto words = Words(settings[writer.setting].set(writer.value));
                start.arrive_and_wait();
                writer.result = host.Cli(words);
            });
        }
        for (auto& thread : threads) thread.join();

        // Each setting holds an acknowledged value: one of its writers' when they raced.
        std::vector<std::set<std::string>> acknowledged(settings.size());
        for (const auto& writer : writers) {
            SCOPED_TRACE(settings[writer.setting].set(writer.value));
            // Every change is acknowledged: the store waits for a busy writer.
            EXPECT_EQ(writer.result.status, 0) << writer.result.err;
            if (writer.result.status == 0) acknowledged[writer.setting].insert(writer.value);
        }
        std::map<std::string, json> shown;  // each getter runs once
        for (size_t i = 0; i < settings.size(); ++i) {
            if (acknowledged[i].empty()) continue;
            const auto& setting = settings[i];
            if (!shown.count(setting.get)) {
                auto words = Words(setting.get);
                words.insert(words.begin(), "--formatter=json");
                const auto run = host.Cli(words);
                ASSERT_EQ(run.status, 0) << run.err;
                shown[setting.get] = json::parse(run.out);
            }
            const std::string value = setting.pick(shown[setting.get]);
            EXPECT_TRUE(acknowledged[i].count(value))
                << setting.set(*acknowledged[i].begin()) << ": holds " << value
                << ", a change was lost";
        }
    }
}

// The interleaving the processes above can hit, made deterministic: two configuration objects
// read the names, each changes a different one, both save.
TEST(Concurrency, SavingTheHostNameKeepsADomainSavedMeanwhile) {
    TempHost host;
    KernCtl::Network::DnsConfigImpl first("defaultTcpipStack");
    KernCtl::Network::DnsConfigImpl second("defaultTcpipStack");
    first.SetHostname("node-a", false);
    second.SetDomain("zone-b.example", false);
    second.SaveConfig();
    first.SaveConfig();
    KernCtl::Network::DnsConfigImpl stored("defaultTcpipStack");
    EXPECT_EQ(stored.GetFqdn(), "node-a.zone-b.example");
    EXPECT_EQ(first.GetFqdn(), "node-a.zone-b.example");  // the object now holds what it saved
}

}  // namespace

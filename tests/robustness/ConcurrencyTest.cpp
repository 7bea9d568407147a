// Many brixcli processes at once, each changing a different setting of the same host (advanced
// options, module parameters, settings of the one SNMP file, host name and domain, ...): every
// acknowledged change is there afterwards. BRIX_ROBUST_ROUNDS (default 3) sets how often.
#include <gtest/gtest.h>

#include <functional>
#include <map>
#include <nlohmann/json.hpp>
#include <string>
#include <thread>
#include <vector>

#include "Robustness.h"
#include "support/TestHost.h"

namespace {

using BrixRobust::Words;
using BrixTest::RunResult;
using BrixTest::TempHost;
using nlohmann::json;

// One setting: the command line that gives it the value of a round, the getter that shows it,
// and where in the getter's JSON the value is.
struct Setting {
    std::function<std::string(int)> value;
    std::function<std::string(const std::string&)> set;  // the command line for a value
    std::string get;
    std::function<std::string(const json&)> pick;
};

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
    return [=](int round) { return prefix + std::to_string(base + round); };
}

std::function<std::string(int)> Alternating(const std::string& even, const std::string& odd) {
    return [=](int round) { return round % 2 == 0 ? even : odd; };
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
        AdvancedInt("/Dump/CompressionLevel", 1),
        AdvancedInt("/Irq/MaxIrqsPerVector", 2),
        AdvancedInt("/UserVars/SshSessionLimit", 40),
        {Numbered("hint"), Command("system settings advanced set -o /Dump/DumpDatastoreHint -s"),
         "system settings advanced list", Row("Path", "/Dump/DumpDatastoreHint", "String Value")},
        ModuleParameter("nvme_core", "io_queues", 4),
        ModuleParameter("qln_nic10g", "rss_queues", 2),
        ModuleParameter("qln_nic25g", "rss_queues", 6),
        Snmp("syslocation", Numbered("hall-"), "syslocation"),
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
        {Numbered("node-"), Command("system hostname set --host"), "system hostname get",
         Field("Host Name")},
        {Numbered("zone-", 0), Command("system hostname set --domain"), "system hostname get",
         Field("Domain Name")},
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
    ASSERT_GE(settings.size(), 16u);
    const int rounds = BrixRobust::EnvCount("BRIX_ROBUST_ROUNDS", 3);

    for (int round = 1; round <= rounds; ++round) {
        SCOPED_TRACE("round " + std::to_string(round));
        // All writers at once, each from its own thread.
        std::vector<RunResult> results(settings.size());
        std::vector<std::thread> writers;
        for (size_t i = 0; i < settings.size(); ++i) {
            writers.emplace_back([&, i] {
                results[i] = host.Cli(Words(settings[i].set(settings[i].value(round))));
            });
        }
        for (auto& writer : writers) writer.join();

        std::map<std::string, json> shown;  // each getter runs once
        for (size_t i = 0; i < settings.size(); ++i) {
            const auto& setting = settings[i];
            const std::string line = setting.set(setting.value(round));
            SCOPED_TRACE(line);
            // Every change is acknowledged: the store waits for a busy writer.
            EXPECT_EQ(results[i].status, 0) << results[i].err;
            if (results[i].status != 0) continue;
            if (!shown.count(setting.get)) {
                auto words = Words(setting.get);
                words.insert(words.begin(), "--formatter=json");
                const auto run = host.Cli(words);
                ASSERT_EQ(run.status, 0) << run.err;
                shown[setting.get] = json::parse(run.out);
            }
            EXPECT_EQ(setting.pick(shown[setting.get]), setting.value(round)) << "change lost";
        }
    }
}

}  // namespace

// `system snmp get` and `system snmp set` against a fresh simulated host: the stored file, the
// commands' own checks and messages, and the limits the configuration store enforces.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <pugixml.hpp>

#include "SnmpSupport.h"

namespace {

using namespace SnmpTest;

constexpr const char* kSeededEngineId = "8000b7e5046334643765386139623133";
constexpr const char* kMd5Hash = "526f5eed9fcce26f8964c2930787d82b";
constexpr const char* kShaHash = "6695febc9288e36282235fc7151f128497b38f3f";

json SeededConfig() {
    return json::parse(R"({
        "enable": false, "port": 161, "communities": [], "targets": [], "notraps": [],
        "hwsrc": "indications", "engineid": "8000b7e5046334643765386139623133",
        "syslocation": "Lindenhall DC, hall 2, rack C14",
        "syscontact": "Brix operations <noc@lindenhall.example>", "loglevel": "info",
        "authentication": "", "privacy": "", "users": [], "remote-users": [], "v3targets": [],
        "largestorage": true})");
}

TEST(SnmpConfig, SeededHostAnswersTheWholeStructureInOrder) {
    BrixTest::TempHost host;
    const auto run = Snmp(host, {"get"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.err, "");
    EXPECT_EQ(json::parse(run.out).dump(), SeededConfig().dump());

    struct stat info {};
    ASSERT_EQ(stat(ConfigFile(host).c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 0777, 0600u) << "the file holds key hashes";
}

TEST(SnmpConfig, SetStoresEverySettingAndGetReadsItBack) {
    BrixTest::TempHost host;
    const std::string user = std::string("ops/") + kShaHash + "/-/auth";
    const std::string remote =
        std::string("trapper/SHA1/") + kShaHash + "/none/-/0x8000b7e5040102030405";
    const auto set = Snmp(host, {"set",
                                 "-e",
                                 "yes",
                                 "-p",
                                 "1161",
                                 "-c",
                                 " public , ops ",
                                 "-t",
                                 "192.0.2.10/public,monitor.example@1162/ops",
                                 "-y",
                                 "sensors",
                                 "-L",
                                 "Row 7",
                                 "-C",
                                 "noc@example.net",
                                 "-l",
                                 "warning",
                                 "-n",
                                 "1.3.6.1.4.1.47077.0.1,1.3.6.1.6.3.1.1.5.1",
                                 "-E",
                                 "0x8000b7e5040102030405",
                                 "-a",
                                 "SHA1",
                                 "-x",
                                 "none",
                                 "-u",
                                 user,
                                 "-R",
                                 remote,
                                 "-i",
                                 "198.51.100.7/trapper/auth/trap",
                                 "-s",
                                 "false"});
    ASSERT_EQ(set.status, 0) << set.err;
    EXPECT_EQ(set.out, "true\n");

    auto expected = json::parse(R"({
        "enable": true, "port": 1161, "communities": ["public", "ops"],
        "targets": ["192.0.2.10/public", "monitor.example@1162/ops"],
        "notraps": ["1.3.6.1.4.1.47077.0.1", "1.3.6.1.6.3.1.1.5.1"], "hwsrc": "sensors",
        "engineid": "8000b7e5040102030405", "syslocation": "Row 7",
        "syscontact": "noc@example.net", "loglevel": "warning", "authentication": "SHA1",
        "privacy": "none", "v3targets": ["198.51.100.7/trapper/auth/trap"],
        "largestorage": false})");
    expected["users"] = {user};
    expected["remote-users"] = {remote};
    const json got = Config(host);
    for (auto& [key, value] : expected.items()) EXPECT_EQ(got[key], value) << key;

    // The store keeps the suppressed trap oids ";"-separated, in a well-formed file.
    pugi::xml_document document;
    ASSERT_TRUE(document.load_file(ConfigFile(host).c_str()));
    EXPECT_EQ(
        std::string(document.select_node("//option[@key='EventFilter']").node().child_value()),
        "1.3.6.1.4.1.47077.0.1;1.3.6.1.6.3.1.1.5.1");
}

TEST(SnmpConfig, EngineIdNormalisation) {
    struct Case {
        const char* given;
        const char* stored;   // null when refused
        const char* message;  // the refusal
    };
    const Case cases[] = {
        {"0x0123456789", "0123456789", nullptr},
        {"0X1:2:3:4:5", "0102030405", nullptr},
        {"12345:6789a", "123456789a", nullptr},
        {"0x8000:b7e5:04:1:2:3", "8000b7e504010203", nullptr},
        {"aa::bb", nullptr, "Option engineid minimum length is 10 characters."},
        {"012345678", nullptr, "Option engineid minimum length is 10 characters."},
        {"0x1:2:3:4", nullptr, "Option engineid minimum length is 10 characters."},
        {"012345678901234567890123456789012", nullptr,
         "Option engineid maximum length is 32 characters."},
        {"0123456789a", nullptr,
         "Engine id '0123456789a' must be 10 to 32 hexadecimal digits, an even number of them."},
    };
    BrixTest::TempHost host;
    for (const auto& c : cases) {
        const std::string before = Config(host)["engineid"];
        const auto run = Snmp(host, {"set", "--engineid", c.given});
        EXPECT_EQ(run.out, "true\n") << c.given << ": a failed set still answers true";
        if (c.stored) {
            EXPECT_EQ(run.status, 0) << c.given << run.err;
            EXPECT_EQ(Config(host)["engineid"], c.stored) << c.given;
        } else {
            EXPECT_EQ(run.status, 1) << c.given;
            EXPECT_EQ(run.err, std::string(c.message) + "\n") << c.given;
            EXPECT_EQ(Config(host)["engineid"], before) << c.given;
        }
    }
    // The regex constraint refuses other characters before the command runs.
    const auto refused = Snmp(host, {"set", "--engineid", "0x12345678zz"});
    EXPECT_EQ(refused.status, 2);
    EXPECT_EQ(refused.out, "");
}

TEST(SnmpConfig, PortRangeAndNothingCommittedOnFailure) {
    BrixTest::TempHost host;
    const std::string portMessage =
        "Port must be in range 0 - 65535 and not be already in use by another application.\n";
    // 4294967296 is 0 when cut to 32 bits: it is checked whole.
    for (const char* port : {"65536", "-1", "4294967296", "18446744073709551615"}) {
        const auto run = Snmp(host, {"set", "--enable", "true", "--port", port});
        if (std::string(port) == "18446744073709551615") {
            EXPECT_EQ(run.status, 2) << "not a signed 64-bit integer";
            continue;
        }
        EXPECT_EQ(run.status, 1) << port;
        EXPECT_EQ(run.out, "true\n");
        EXPECT_EQ(run.err, portMessage);
    }
    EXPECT_EQ(Config(host)["enable"], false) << "the enable of a failed call is discarded";
    EXPECT_TRUE(Calls(host, kCommit).empty());

    const auto zero = Snmp(host, {"set", "--port", "0"});
    EXPECT_EQ(zero.status, 1);
    EXPECT_EQ(zero.err, "The agent cannot be polled on port 0: use 1 - 65535.\n");

    const auto top = Snmp(host, {"set", "--port", "65535"});
    EXPECT_EQ(top.status, 0) << top.err;
    EXPECT_EQ(Config(host)["port"], 65535);
}

TEST(SnmpConfig, EmptyCallLargeStorageAndReset) {
    BrixTest::TempHost host;
    const auto empty = Snmp(host, {"set"});
    EXPECT_EQ(empty.status, 1);
    EXPECT_EQ(empty.out, "true\n");
    EXPECT_EQ(empty.err, "Specify what to set or --help\n");
    EXPECT_TRUE(Calls(host, kCommit).empty());

    const auto storage = Snmp(host, {"set", "--largestorage", "false"});
    EXPECT_EQ(storage.status, 0) << storage.err;
    EXPECT_EQ(Config(host)["largestorage"], false);
    auto commits = Calls(host, kCommit);
    ASSERT_EQ(commits.size(), 1u);
    EXPECT_EQ(commits[0]["args"], json({"largestorage"}));

    const auto reset = Snmp(host, {"set", "--reset", "--port", "1161"});
    EXPECT_EQ(reset.status, 0) << reset.err;
    auto defaults = SeededConfig();
    defaults["port"] = 1161;
    defaults["syslocation"] = "";
    defaults["syscontact"] = "";
    EXPECT_EQ(Config(host).dump(), defaults.dump());
    commits = Calls(host, kCommit);
    ASSERT_EQ(commits.size(), 2u);
    // Relative to the defaults, only the port differs.
    EXPECT_EQ(commits[1]["args"], json({"reset", "port"}));
}

TEST(SnmpConfig, ListsAreTrimmedSplitAndEmptiedWithAnEmptyValue) {
    BrixTest::TempHost host;
    ASSERT_EQ(Snmp(host, {"set", "-c", "  alpha,,beta  "}).status, 0);
    EXPECT_EQ(Config(host)["communities"], json({"alpha", "beta"}));
    ASSERT_EQ(Snmp(host, {"set", "-c", ""}).status, 0);
    EXPECT_EQ(Config(host)["communities"], json::array());

    ASSERT_EQ(Snmp(host, {"set", "-n", "1.3.6.1.4.1.1, 1.3.6.1.4.1.2"}).status, 0);
    EXPECT_EQ(Config(host)["notraps"], json({"1.3.6.1.4.1.1", "1.3.6.1.4.1.2"}));
    ASSERT_EQ(Snmp(host, {"set", "-n", "reset"}).status, 0);
    EXPECT_EQ(Config(host)["notraps"], json::array());
}

TEST(SnmpConfig, StoreLimitsAndFormats) {
    const std::string name33(33, 'n');
    const std::string md5 = kMd5Hash;
    struct Case {
        std::vector<std::string> args;
        std::string message;
    };
    const std::vector<Case> cases = {
        {{"-c", "a,b,c,d,e,f,g,h,i,j,k"}, "At most 10 communities can be set; 11 were given."},
        {{"-c", std::string(65, 'c')},
         "Community '" + std::string(65, 'c') + "' is longer than 64 characters."},
        {{"-t", "a/x,b/x,c/x,d/x"}, "At most 3 targets can be set; 4 were given."},
        {{"-t", "nohost"}, "Target 'nohost' is not of the form ip-or-hostname[@port]/community."},
        {{"-t", "h@0/c"}, "Target 'h@0/c' is not of the form ip-or-hostname[@port]/community."},
        {{"-t", "h@65536/c"},
         "Target 'h@65536/c' is not of the form ip-or-hostname[@port]/community."},
        {{"-y", "ipmi"}, "Invalid hwsrc 'ipmi': use one of indications, sensors."},
        {{"-l", "verbose"}, "Invalid loglevel 'verbose': use one of debug, info, warning, error."},
        {{"-a", "md5"}, "Invalid authentication protocol 'md5': use one of none, MD5, SHA1."},
        {{"-x", "AES"}, "Invalid privacy protocol 'AES': use one of none, AES128."},
        {{"-x", "AES128"},
         "Privacy protocol AES128 needs authentication MD5 or SHA1: set --authentication."},
        {{"-L", std::string(256, 'l')}, "Option syslocation is longer than 255 characters."},
        {{"-C", std::string(256, 'c')}, "Option syscontact is longer than 255 characters."},
        {{"-n", "1.3.x"},
         "Invalid trap oid '1.3.x' in notraps: give dotted numbers such as 1.3.6.1.6.3.1.1.5.1."},
        {{"-u", "a/-/-/none,b/-/-/none,c/-/-/none,d/-/-/none,e/-/-/none,f/-/-/none"},
         "At most 5 users can be set; 6 were given."},
        {{"-u", name33 + "/-/-/none"},
         "User name '" + name33 + "' in '" + name33 + "/-/-/none' is longer than 32 characters."},
        {{"-u", "bob/-/none"},
         "User 'bob/-/none' is not of the form user/-|auth-hash/-|priv-hash/model."},
        {{"-u", "bob/abc/-/auth"},
         "User 'bob': a hash is '-' or 32 or 40 hexadecimal digits as 'system snmp hash' gives "
         "it."},
        {{"-u", "bob/-/-/auth"}, "User 'bob': model auth needs an authentication hash."},
        {{"-u", "bob/" + md5 + "/-/priv"}, "User 'bob': model priv needs a privacy hash."},
        {{"-u", "bob/-/-/full"}, "User 'bob': model 'full' is not one of none, auth, priv."},
        {{"-u", "bob/-/-/none,bob/-/-/none"}, "User 'bob' is given twice."},
        {{"-R", "r/MD5/" + md5 + "/none/-"},
         "Remote user 'r/MD5/" + md5 +
             "/none/-' is not of the form "
             "user/auth-proto/-|auth-hash/priv-proto/-|priv-hash/engine-id."},
        {{"-R", "r/SHA256/-/none/-/0x0102030405"},
         "Remote user 'r': auth-proto 'SHA256' is not one of none, MD5, SHA1."},
        {{"-R", "r/SHA1/" + md5 + "/none/-/0x0102030405"},
         "Remote user 'r': auth-proto SHA1 needs a 40-digit authentication hash."},
        {{"-R", "r/MD5/" + md5 + "/AES128/-/0x0102030405"},
         "Remote user 'r': priv-proto 'AES128' is not one of none, AES."},
        {{"-R", "r/MD5/" + md5 + "/AES/-/0x0102030405"},
         "Remote user 'r': priv-proto AES needs a privacy hash."},
        {{"-R", "r/none/-/AES/" + md5 + "/0x0102030405"},
         "Remote user 'r': privacy needs an authentication protocol."},
        {{"-R", "r/MD5/" + md5 + "/none/-/0x01020304"},
         "Remote user 'r': engine-id '0x01020304' must be 10 to 32 hexadecimal digits (an even "
         "number), optionally after 0x."},
        {{"-i", "192.0.2.1/nobody/auth/trap"},
         "V3 target '192.0.2.1/nobody/auth/trap' names remote user 'nobody', which is not "
         "configured: add it with --remote-users."},
        {{"-i", "192.0.2.1/nobody/secret/trap"},
         "V3 target '192.0.2.1/nobody/secret/trap': security level 'secret' is not one of none, "
         "auth, priv."},
        {{"-i", "192.0.2.1/nobody/none/notify"},
         "V3 target '192.0.2.1/nobody/none/notify': 'notify' is neither trap nor inform."},
        {{"-R", "r/MD5/" + md5 + "/none/-/0x0102030405", "-i", "192.0.2.1/r/priv/inform"},
         "V3 target '192.0.2.1/r/priv/inform' asks for priv, but remote user 'r' has no privacy "
         "protocol."},
    };
    BrixTest::TempHost host;
    const json stored = Config(host);
    for (const auto& c : cases) {
        std::vector<std::string> args{"set"};
        args.insert(args.end(), c.args.begin(), c.args.end());
        const auto run = Snmp(host, args);
        EXPECT_EQ(run.status, 1) << c.message;
        EXPECT_EQ(run.out, "true\n") << c.message;
        EXPECT_EQ(run.err, c.message + "\n");
    }
    EXPECT_EQ(Config(host).dump(), stored.dump()) << "no refused setting reached the store";
    EXPECT_TRUE(Calls(host, kCommit).empty());
}

TEST(SnmpConfig, UnknownStoredOptionIsReportedBesideTheWholeStructure) {
    BrixTest::TempHost host;
    Config(host);  // seeds the host
    std::string xml = ReadFile(ConfigFile(host));
    const std::string anchor = "<options>";
    xml.insert(xml.find(anchor) + anchor.size(), "<option key=\"foo\">bar</option>");
    WriteFile(ConfigFile(host), xml);

    const auto run = Snmp(host, {"get"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "Unknown option foo value 'bar'\n");
    EXPECT_EQ(json::parse(run.out).dump(), SeededConfig().dump());
}

TEST(SnmpConfig, FileThatIsNotXml) {
    BrixTest::TempHost host;
    Config(host);
    WriteFile(ConfigFile(host), "<snmpAgent><port>161</snmpAgent>");

    const auto get = Snmp(host, {"get"});
    EXPECT_EQ(get.status, 1);
    EXPECT_EQ(get.out, "");
    EXPECT_EQ(
        get.err,
        "Configuration file, /etc/ostrel/snmp.xml, is not valid xml. Repair or replace it.\n");

    const std::string storeMessage =
        "The SNMP agent configuration /etc/ostrel/snmp.xml is not valid xml: repair it, or "
        "replace it with 'system snmp set --reset'.\n";
    for (const std::vector<std::string>& words : {std::vector<std::string>{"set", "-L", "x"},
                                                  {"test"},
                                                  {"hash", "-r", "-A", "maplesyrup"}}) {
        const auto run = Snmp(host, words);
        EXPECT_EQ(run.status, 1) << words[0];
        EXPECT_EQ(run.err, storeMessage) << words[0];
    }
    EXPECT_EQ(ReadFile(ConfigFile(host)), "<snmpAgent><port>161</snmpAgent>");

    const auto reset = Snmp(host, {"set", "--reset", "-L", "rebuilt"});
    EXPECT_EQ(reset.status, 0) << reset.err;
    EXPECT_EQ(Config(host)["syslocation"], "rebuilt");
}

TEST(SnmpConfig, MissingFileMeansFactoryDefaults) {
    BrixTest::TempHost host;
    Config(host);
    std::filesystem::remove(ConfigFile(host));
    auto defaults = SeededConfig();
    defaults["syslocation"] = "";
    defaults["syscontact"] = "";
    EXPECT_EQ(Config(host).dump(), defaults.dump());
    ASSERT_EQ(Snmp(host, {"set", "-C", "me"}).status, 0);
    EXPECT_EQ(Config(host)["syscontact"], "me");
}

TEST(SnmpConfig, BootStateIsRemovedOnlyWhenTheEngineIdChanges) {
    BrixTest::TempHost host;
    Config(host);
    const auto boot = host.Root() / "var/tmp/snmp_boot.txt";
    ASSERT_TRUE(std::filesystem::exists(boot));
    ASSERT_EQ(Snmp(host, {"set", "-L", "elsewhere"}).status, 0);
    EXPECT_TRUE(std::filesystem::exists(boot));

    ASSERT_EQ(Snmp(host, {"set", "-L", "again", "-E", "0x0102030405"}).status, 0);
    EXPECT_FALSE(std::filesystem::exists(boot));
    // The unlink comes before the commit; a missing file is no error.
    std::vector<std::string> kinds;
    for (const auto& record : host.Journal()) {
        if (record["kind"] == "unlink")
            kinds.push_back("unlink " + record["path"].get<std::string>());
        if (record["kind"] == "call" && record["op"] == kCommit) kinds.push_back("commit");
    }
    EXPECT_EQ(kinds,
              (std::vector<std::string>{"commit", "unlink /var/tmp/snmp_boot.txt", "commit"}));
    EXPECT_EQ(Snmp(host, {"set", "-E", "0x0102030406"}).status, 0);

    // A set refused at its commit keeps the boots of the engine id that stays.
    std::ofstream(boot) << "engineBoots 12\n";
    const auto refused =
        Snmp(host, {"set", "-E", "0x0102030407", "-i", "192.0.2.1/nobody/auth/trap"});
    EXPECT_EQ(refused.status, 1) << refused.err;
    std::ostringstream state;
    state << std::ifstream(boot).rdbuf();
    EXPECT_EQ(state.str(), "engineBoots 12\n");
    EXPECT_EQ(Config(host)["engineid"], "0102030406");
}

// A set that fails on the way leaves the stored configuration as it was.
TEST(SnmpConfig, PlatformFaultsChangeNothing) {
    struct Case {
        const char* operation;
        std::vector<std::string> words;
        const char* out;
    };
    const Case cases[] = {
        {"HostCtl::System::SnmpAgentConfigFactory", {"set", "-L", "x"}, "true\n"},
        {"HostCtl::System::SnmpAgentConfig::SetOptions", {"set", "-L", "x"}, "true\n"},
        {"HostCtl::System::SnmpAgentConfig::ResetToDefaults", {"set", "-r"}, "true\n"},
        {"HostCtl::System::SnmpAgentConfig::Commit", {"set", "-L", "x"}, "true\n"},
    };
    for (const auto& c : cases) {
        BrixTest::TempHost host;
        host.Fault(c.operation, "agent store unavailable");
        const auto run = Snmp(host, c.words);
        EXPECT_EQ(run.status, 1) << c.operation;
        EXPECT_EQ(run.out, c.out) << c.operation;
        EXPECT_EQ(run.err, "agent store unavailable\n") << c.operation;
        host.ClearFaults();
        EXPECT_EQ(Config(host)["syslocation"], "Lindenhall DC, hall 2, rack C14") << c.operation;
    }
}

}  // namespace

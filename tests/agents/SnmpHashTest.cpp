// `system snmp hash` and `system snmp test`: localized keys from the stored engine id, secrets
// read from host files, user checks and the test notification's report.
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include "SnmpSupport.h"

namespace {

using namespace SnmpTest;

constexpr const char* kRfcEngineId = "000000000000000000000002";
constexpr const char* kMd5Kul = "526f5eed9fcce26f8964c2930787d82b";
constexpr const char* kShaKul = "6695febc9288e36282235fc7151f128497b38f3f";

void Configure(const BrixTest::TempHost& host, std::vector<std::string> words) {
    words.insert(words.begin(), "set");
    const auto run = Snmp(host, words);
    ASSERT_EQ(run.status, 0) << run.err;
}

// A loopback UDP port with nobody listening, kept bound so nobody else takes it.
class QuietPort {
  public:
    QuietPort() {
        fd_ = socket(AF_INET, SOCK_DGRAM, 0);
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        bind(fd_, reinterpret_cast<sockaddr*>(&address), sizeof address);
        socklen_t size = sizeof address;
        getsockname(fd_, reinterpret_cast<sockaddr*>(&address), &size);
        port_ = ntohs(address.sin_port);
    }
    ~QuietPort() { close(fd_); }
    std::string Port() const { return std::to_string(port_); }

  private:
    int fd_ = -1;
    int port_ = 0;
};

TEST(SnmpHash, LocalizesWithTheStoredEngineId) {
    BrixTest::TempHost host;
    Configure(host, {"--engineid", kRfcEngineId, "--authentication", "MD5"});
    auto run = Snmp(host, {"hash", "-r", "-A", "maplesyrup"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(json::parse(run.out), json({{"auth-hash", kMd5Kul}, {"priv-hash", ""}}));
    // The simple view prints the hash as it is to be pasted into --users.
    run = host.Cli({"system", "snmp", "hash", "-r", "-A", "maplesyrup"});
    EXPECT_NE(run.out.find(kMd5Kul), std::string::npos) << run.out;

    Configure(host, {"--authentication", "SHA1", "--privacy", "AES128"});
    run = Snmp(host, {"hash", "-r", "-A", "maplesyrup", "-X", "maplesyrup"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(json::parse(run.out),
              json({{"auth-hash", kShaKul}, {"priv-hash", std::string(kShaKul).substr(0, 32)}}));
    EXPECT_EQ(run.out.find("maplesyrup"), std::string::npos);
}

TEST(SnmpHash, DefaultEngineIdComesFromTheHostUuid) {
    BrixTest::TempHost host;
    Configure(host, {"--authentication", "MD5"});
    const auto defaultId = Snmp(host, {"hash", "-r", "-A", "maplesyrup"});
    Configure(host, {"--engineid", "8000b7e5046334643765386139623133"});
    const auto explicitId = Snmp(host, {"hash", "-r", "-A", "maplesyrup"});
    ASSERT_EQ(defaultId.status, 0) << defaultId.err;
    EXPECT_EQ(defaultId.out, explicitId.out);
}

TEST(SnmpHash, ChecksInOrder) {
    struct Case {
        std::vector<std::string> setup;  // `set` words, may be empty
        std::vector<std::string> args;
        std::string message;
    };
    const std::vector<Case> cases = {
        {{},
         {"-r", "-A", "", "-X", "maplesyrup"},
         "Must specify --auth-hash when using --priv-hash"},
        {{},
         {"-r", "-A", "short"},
         "Authentication secret must be at least eight(8) characters in length"},
        {{},
         {"-r", "-A", "maplesyrup", "-X", "1234567"},
         "Privacy secret must be at least eight(8) characters in length"},
        {{},
         {"-r", "-A", "maplesyrup"},
         "Must specify set authentication protocol via set --authentication"},
        // The authentication protocol is asked for first, also when privacy lacks one too.
        {{},
         {"-r", "-A", "maplesyrup", "-X", "maplesyrup"},
         "Must specify set authentication protocol via set --authentication"},
        {{"-a", "MD5"},
         {"-r", "-A", "maplesyrup", "-X", "maplesyrup"},
         "Must first set privacy protocol via set --privacy"},
        {{"-a", "none"},
         {"-r", "-A", "maplesyrup"},
         "The authentication protocol is none, so there is no key to localize: set "
         "--authentication MD5 or SHA1 first."},
        {{"-a", "MD5", "-x", "none"},
         {"-r", "-A", "maplesyrup", "-X", "maplesyrup"},
         "The privacy protocol is none, so there is no privacy key to localize: set --privacy "
         "AES128 first."},
        {{},
         {"-A", "/tmp/s.txt"},
         "File name '/tmp/s.txt' could not be read, No such file or directory"},
        {{}, {"-A", "/etc/ostrel"}, "File name '/etc/ostrel' could not be read, Is a directory"},
        {{},
         {"-A", "../../outside"},
         "File name '../../outside' could not be read, Permission denied"},
    };
    for (const auto& c : cases) {
        BrixTest::TempHost host;
        if (!c.setup.empty()) Configure(host, c.setup);
        std::vector<std::string> words{"hash"};
        words.insert(words.end(), c.args.begin(), c.args.end());
        const auto run = Snmp(host, words);
        EXPECT_EQ(run.status, 1) << c.message;
        EXPECT_EQ(run.out, "") << c.message;
        EXPECT_EQ(run.err, c.message + "\n");
        EXPECT_EQ(run.err.find("maplesyrup"), std::string::npos);
    }
}

TEST(SnmpHash, SecretFilesAreHostFilesReadByTheirFirstLine) {
    BrixTest::TempHost host;
    Configure(host, {"--engineid", kRfcEngineId, "--authentication", "MD5", "--privacy", "AES128"});
    WriteFile(host.Root() / "root/auth.txt", "  maplesyrup \t\nsecond line\n");
    WriteFile(host.Root() / "root/priv.txt", "maplesyrup");
    WriteFile(host.Root() / "root/seven.txt", " 1234567 \nmore");
    WriteFile(host.Root() / "root/blank.txt", "   \nmaplesyrup\n");
    WriteFile(host.Root() / "root/empty.txt", "");

    auto run = Snmp(host, {"hash", "-A", "/root/auth.txt", "-X", "/root/priv.txt"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(json::parse(run.out)["auth-hash"], kMd5Kul);
    EXPECT_EQ(json::parse(run.out)["priv-hash"], kMd5Kul);

    run = Snmp(host, {"hash", "-A", "/root/seven.txt"});
    EXPECT_EQ(run.err, "Authentication secret must be at least eight(8) characters in length\n");

    // A blank first line ends the command without a word.
    run = Snmp(host, {"hash", "-A", "/root/blank.txt"});
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.out, "");
    EXPECT_EQ(run.err, "");

    run = Snmp(host, {"hash", "-A", "/root/empty.txt"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "File name '/root/empty.txt' could not be read, Success\n");
}

TEST(SnmpTestCommand, CountsTargetsAndRequestsTheWarmStart) {
    QuietPort quiet;
    const std::string at = "127.0.0.1@" + quiet.Port();
    struct Case {
        std::vector<std::string> setup;
        std::string line;
        size_t sent;
    };
    const std::vector<Case> cases = {
        {{}, "There are 0 target configured", 0},
        {{"-t", at + "/public"}, "There is 1 target configured", 1},
        {{"-t", at + "/public," + at + "/ops", "-R",
          std::string("trapper/MD5/") + kMd5Kul + "/none/-/0x" + kRfcEngineId, "-i",
          at + "/trapper/auth/trap", "-E", kRfcEngineId},
         "There are 3 targets configured",
         3},
    };
    for (const auto& c : cases) {
        BrixTest::TempHost host;
        if (!c.setup.empty()) Configure(host, c.setup);
        const auto run = Snmp(host, {"test"});
        ASSERT_EQ(run.status, 0) << run.err;
        EXPECT_EQ(
            json::parse(run.out),
            json({{"comments", {c.line, "send warmStart requested", "test completed normally."}}}));
        const auto calls = Calls(host, kSendWarmStart);
        ASSERT_EQ(calls.size(), 1u);
        EXPECT_EQ(calls[0]["args"].size(), c.sent + 1) << calls[0].dump();
        EXPECT_EQ(calls[0]["args"][0], "");
        if (c.sent == 3) {
            EXPECT_EQ(calls[0]["args"][1], "v1 trap to " + at);
            EXPECT_EQ(calls[0]["args"][3], "v3 trap to " + at + " as trapper");
        }
    }
}

TEST(SnmpTestCommand, DeliveryFailuresAreReported) {
    QuietPort quiet;
    const std::string at = "127.0.0.1@" + quiet.Port();
    BrixTest::TempHost host;
    // Keys localized for another engine than the agent's, and a receiver that never answers.
    Configure(host,
              {"-E", "0x0102030405", "-R",
               std::string("trapper/MD5/") + kMd5Kul + "/none/-/0x" + kRfcEngineId, "-i",
               at + "/trapper/auth/trap," + at + "/trapper/none/inform", "-t", at + "/public"});
    const auto run = Snmp(host, {"test"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(json::parse(run.out), json({{"comments", json::array()}}));
    EXPECT_EQ(run.err, "warmStart could not be delivered to 2 of 3 targets: v3 trap to " + at +
                           " as trapper: remote user 'trapper' is localized for engine id " +
                           kRfcEngineId +
                           ", but traps are sent from this agent's engine id 0102030405; v3 "
                           "inform to " +
                           at + " as trapper: no answer to the engine id discovery\n");
    const auto calls = Calls(host, kSendWarmStart);
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_EQ(calls[0]["args"], json({"", "v1 trap to " + at}));
}

TEST(SnmpTestCommand, UserChecks) {
    BrixTest::TempHost host;
    Configure(host, {"-E", kRfcEngineId, "-a", "MD5", "-x", "AES128"});
    const auto hash = Snmp(host, {"hash", "-r", "-A", "maplesyrup", "-X", "privsecret"});
    ASSERT_EQ(hash.status, 0) << hash.err;
    const std::string authHash = json::parse(hash.out)["auth-hash"];
    const std::string privHash = json::parse(hash.out)["priv-hash"];
    Configure(host,
              {"-u", "alice/" + authHash + "/" + privHash + "/priv,carl/" + authHash + "/-/auth",
               "-R", "rita/SHA1/" + std::string(kShaKul) + "/none/-/" + kRfcEngineId});
    WriteFile(host.Root() / "root/auth.txt", "maplesyrup\n");

    struct Case {
        std::vector<std::string> args;
        std::string verdict;
    };
    const std::vector<Case> cases = {
        {{"-u", "alice"}, "User 'alice' exists (model priv)."},
        {{"-u", "alice", "-r", "-A", "maplesyrup", "-X", "privsecret"},
         "User 'alice' exists (model priv): authentication secret matches; privacy secret "
         "matches."},
        {{"-u", "alice", "-A", "/root/auth.txt"},
         "User 'alice' exists (model priv): authentication secret matches."},
        {{"-u", "alice", "-r", "-A", "maplesyrop", "-X", "privsecret"},
         "User 'alice' exists (model priv): authentication secret does not match the stored hash; "
         "privacy secret matches."},
        {{"-u", "carl", "-r", "-X", "privsecret"},
         "User 'carl' exists (model auth): the user has no privacy hash."},
        {{"-u", "rita", "-r", "-A", "maplesyrup"},
         std::string("Remote user 'rita' exists (engine id ") + kRfcEngineId +
             "): authentication secret matches."},
        {{"-u", "nobody"},
         "User 'nobody' is not configured: add it with 'system snmp set --users'."},
    };
    for (const auto& c : cases) {
        std::vector<std::string> words{"test"};
        words.insert(words.end(), c.args.begin(), c.args.end());
        const auto run = Snmp(host, words);
        ASSERT_EQ(run.status, 0) << run.err;
        EXPECT_EQ(json::parse(run.out),
                  json({{"comments", {"Testing SNMPv3 user '" + c.args[1] + "'", c.verdict}}}));
    }
    EXPECT_TRUE(Calls(host, kSendWarmStart).empty()) << "a user test sends nothing";
}

TEST(SnmpTestCommand, SecretsNeedAUserAndTheReportStaysShaped) {
    BrixTest::TempHost host;
    for (const std::vector<std::string>& words :
         {std::vector<std::string>{"test", "-A", "x"}, {"test", "-X", "y", "-r"}}) {
        const auto run = Snmp(host, words);
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, "auth/priv secret requires a user name to be specified.\n");
        EXPECT_EQ(json::parse(run.out), json({{"comments", json::array()}}));
    }
    const auto missing = Snmp(host, {"test", "-u", "alice", "-A", "/nowhere.txt"});
    EXPECT_EQ(missing.status, 1);
    EXPECT_EQ(missing.err,
              "File name '/nowhere.txt' could not be read, No such file or directory\n");
    EXPECT_EQ(json::parse(missing.out), json({{"comments", json::array()}}));
    EXPECT_TRUE(Calls(host, kSendWarmStart).empty());
}

}  // namespace

// `system snmp test` against net-snmp's snmptrapd on loopback: an independent receiver decodes
// our SNMPv1 trap, authenticates and decrypts our SNMPv3 traps with users it derived itself from
// the same passwords and engine id, and answers our SNMPv3 inform.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <signal.h>
#include <spawn.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdlib>
#include <thread>

#include "SnmpSupport.h"
#include "hostsim/agents/snmp/UsmKeys.h"

extern char** environ;

namespace {

using namespace SnmpTest;
namespace Usm = BrixSim::Snmp;

constexpr const char* kTrapd = "/usr/sbin/snmptrapd";
constexpr const char* kAgentEngineId = "8000b7e5040102030405";
// snmptrapd's own engine id for "engineID brixtrapd": net-snmp's enterprise, text format.
constexpr const char* kTrapdEngineId = "80001f8804627269787472617064";

int FreeUdpPort() {
    const int fd = socket(AF_INET, SOCK_DGRAM, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    bind(fd, reinterpret_cast<sockaddr*>(&address), sizeof address);
    socklen_t size = sizeof address;
    getsockname(fd, reinterpret_cast<sockaddr*>(&address), &size);
    close(fd);
    return ntohs(address.sin_port);
}

// snmptrapd in the foreground, logging what it receives to a file; stopped with the test.
class Trapd {
  public:
    Trapd(const std::filesystem::path& dir, const std::string& users) : dir_(dir) {
        port_ = FreeUdpPort();
        WriteFile(dir / "trapd.conf",
                  "disableAuthorization yes\n"
                  "engineID brixtrapd\n" +
                      users +
                      "format1 V1TRAP %P %N %W %q\\n\n"
                      "format2 V2TRAP %P %v\\n\n");
        std::filesystem::create_directories(dir / "persist");
        const std::string listen = "udp:127.0.0.1:" + std::to_string(port_);
        const std::string conf = (dir / "trapd.conf").string();
        std::vector<std::string> argv{kTrapd, "-f", "-Lo", "-On", "-C", "-c", conf, listen};
        std::vector<std::string> env{"MIBS=", "MIBDIRS=/nonexistent",
                                     "SNMP_PERSISTENT_DIR=" + (dir / "persist").string()};
        for (char** entry = environ; *entry; ++entry) {
            const std::string text = *entry;
            if (text.rfind("MIB", 0) != 0 && text.rfind("SNMP", 0) != 0) env.push_back(text);
        }
        std::vector<char*> args;
        for (auto& arg : argv) args.push_back(arg.data());
        args.push_back(nullptr);
        std::vector<char*> envp;
        for (auto& entry : env) envp.push_back(entry.data());
        envp.push_back(nullptr);
        posix_spawn_file_actions_t actions;
        posix_spawn_file_actions_init(&actions);
        const std::string log = (dir / "trapd.log").string();
        posix_spawn_file_actions_addopen(&actions, 1, log.c_str(), O_WRONLY | O_CREAT | O_APPEND,
                                         0644);
        posix_spawn_file_actions_adddup2(&actions, 1, 2);
        const int spawned = posix_spawn(&pid_, kTrapd, &actions, nullptr, args.data(), envp.data());
        posix_spawn_file_actions_destroy(&actions);
        if (spawned != 0) pid_ = -1;
    }
    ~Trapd() {
        if (pid_ > 0) {
            kill(pid_, SIGTERM);
            waitpid(pid_, nullptr, 0);
        }
    }
    Trapd(const Trapd&) = delete;
    Trapd& operator=(const Trapd&) = delete;

    bool Started() const { return pid_ > 0 && WaitFor("NET-SNMP version", 1); }
    std::string At() const { return "127.0.0.1@" + std::to_string(port_); }
    std::string Log() const { return ReadFile(dir_ / "trapd.log"); }

    // Waits until `text` occurs `count` times in the log.
    bool WaitFor(const std::string& text, size_t count) const {
        const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10);
        while (std::chrono::steady_clock::now() < deadline) {
            if (Count(text) >= count) return true;
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        return false;
    }
    size_t Count(const std::string& text) const {
        const std::string log = Log();
        size_t found = 0;
        for (size_t at = log.find(text); at != std::string::npos; at = log.find(text, at + 1)) {
            ++found;
        }
        return found;
    }

  private:
    std::filesystem::path dir_;
    int port_ = 0;
    pid_t pid_ = -1;
};

std::string Hash(const char* protocol, const std::string& secret, const char* engineIdHex,
                 size_t bytes = 0) {
    std::string key =
        Usm::LocalizedKey(*Usm::ParseAuthProtocol(protocol), secret, *Usm::FromHex(engineIdHex));
    if (bytes != 0) key.resize(bytes);
    return Usm::ToHex(key);
}

void Set(const BrixTest::TempHost& host, std::vector<std::string> words) {
    words.insert(words.begin(), "set");
    const auto run = Snmp(host, words);
    ASSERT_EQ(run.status, 0) << run.err;
}

void ExpectTestPasses(const BrixTest::TempHost& host, const std::string& count) {
    const auto run = Snmp(host, {"test"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(
        json::parse(run.out),
        json({{"comments", {count, "send warmStart requested", "test completed normally."}}}));
}

TEST(SnmpTrapd, WarmStartsReachAnIndependentReceiver) {
    if (access(kTrapd, X_OK) != 0) GTEST_SKIP() << kTrapd << " is not installed";
    BrixTest::TempHost host;
    const auto dir = host.Root().parent_path() / (host.Root().filename().string() + "-trapd");
    std::filesystem::create_directories(dir);
    const std::string agent = std::string("0x") + kAgentEngineId;
    Trapd trapd(dir, "createUser -e " + agent +
                         " alice SHA authpass123 AES privpass123\n"
                         "createUser -e " +
                         agent +
                         " bob MD5 bobsecret99\n"
                         "createUser -e " +
                         agent +
                         " dave SHA davesecret1\n"
                         "createUser -e " +
                         agent +
                         " erin SHA erinsecret1 AES erinprivacy\n"
                         "createUser carol SHA carolauth1 AES carolpriv1\n"
                         "createUser -e " +
                         agent +
                         " frank\n"
                         "createUser gina\n");
    ASSERT_TRUE(trapd.Started()) << trapd.Log();

    // The agent's own hashes for alice and bob come from `system snmp hash`.
    Set(host, {"-E", agent, "-a", "SHA1", "-x", "AES128"});
    auto run = Snmp(host, {"hash", "-r", "-A", "authpass123", "-X", "privpass123"});
    ASSERT_EQ(run.status, 0) << run.err;
    const json alice = json::parse(run.out);
    Set(host, {"-a", "MD5", "-x", "none"});
    run = Snmp(host, {"hash", "-r", "-A", "bobsecret99"});
    ASSERT_EQ(run.status, 0) << run.err;
    const std::string bobHash = json::parse(run.out)["auth-hash"];

    const std::string remoteUsers =
        "alice/SHA1/" + alice["auth-hash"].get<std::string>() + "/AES/" +
        alice["priv-hash"].get<std::string>() + "/" + kAgentEngineId + ",bob/MD5/" + bobHash +
        "/none/-/" + kAgentEngineId + ",carol/SHA1/" + Hash("SHA1", "carolauth1", kTrapdEngineId) +
        "/AES/" + Hash("SHA1", "carolpriv1", kTrapdEngineId, 16) + "/" + kTrapdEngineId;
    Set(host, {"-t", trapd.At() + "/public", "-R", remoteUsers, "-i",
               trapd.At() + "/alice/priv/trap," + trapd.At() + "/bob/auth/trap," + trapd.At() +
                   "/carol/priv/inform"});
    ExpectTestPasses(host, "There are 4 targets configured");

    ASSERT_TRUE(trapd.WaitFor("V2TRAP", 3)) << trapd.Log();
    ASSERT_TRUE(trapd.WaitFor("V1TRAP", 1)) << trapd.Log();
    const std::string log = trapd.Log();
    EXPECT_NE(
        log.find("V1TRAP TRAP, SNMP v1, community public .1.3.6.1.4.1.47077.1.1 Warm Start 0"),
        std::string::npos)
        << log;
    const std::string warmStart = ".1.3.6.1.6.3.1.1.4.1.0 = OID: .1.3.6.1.6.3.1.1.5.2";
    for (const char* line :
         {"V2TRAP TRAP2, SNMP v3, user alice, context  .1.3.6.1.2.1.1.3.0 = Timeticks:",
          "V2TRAP TRAP2, SNMP v3, user bob, context  .1.3.6.1.2.1.1.3.0 = Timeticks:",
          "V2TRAP INFORM, SNMP v3, user carol, context  .1.3.6.1.2.1.1.3.0 = Timeticks:"}) {
        const auto at = log.find(line);
        ASSERT_NE(at, std::string::npos) << line << "\n" << log;
        EXPECT_NE(log.substr(at, log.find('\n', at) - at).find(warmStart), std::string::npos)
            << line;
    }

    // The receiver really checks: a wrong authentication key and a wrong privacy key are dropped,
    // while a right one still passes.
    Set(host, {"-t", "", "-i", "", "-R",
               "dave/SHA1/" + Hash("SHA1", "notdavespass", kAgentEngineId) + "/none/-/" +
                   kAgentEngineId + ",erin/SHA1/" + Hash("SHA1", "erinsecret1", kAgentEngineId) +
                   "/AES/" + Hash("SHA1", "notherprivacy", kAgentEngineId, 16) + "/" +
                   kAgentEngineId + ",alice/SHA1/" + alice["auth-hash"].get<std::string>() +
                   "/AES/" + alice["priv-hash"].get<std::string>() + "/" + kAgentEngineId});
    Set(host, {"-i", trapd.At() + "/dave/auth/trap," + trapd.At() + "/erin/priv/trap," +
                         trapd.At() + "/alice/priv/trap"});
    ExpectTestPasses(host, "There are 3 targets configured");
    ASSERT_TRUE(trapd.WaitFor("user alice", 2)) << trapd.Log();
    std::this_thread::sleep_for(std::chrono::milliseconds(200));
    EXPECT_EQ(trapd.Count("user dave"), 0u) << trapd.Log();
    EXPECT_EQ(trapd.Count("user erin"), 0u) << trapd.Log();

    // Without authentication no key is localized, so the engine id a user names is moot.
    Set(host, {"-R", "frank/none/-/none/-/0102030405,gina/none/-/none/-/0102030405", "-i",
               trapd.At() + "/frank/none/trap," + trapd.At() + "/gina/none/inform"});
    ExpectTestPasses(host, "There are 2 targets configured");
    EXPECT_TRUE(trapd.WaitFor("TRAP2, SNMP v3, user frank", 1)) << trapd.Log();
    EXPECT_TRUE(trapd.WaitFor("INFORM, SNMP v3, user gina", 1)) << trapd.Log();
}

}  // namespace

// system hostname get|set against the host name service of the default network stack.
#include "HostStateTesting.h"

namespace {

using namespace HostStateTesting;

constexpr const char* kSave = "KernCtl::Network::DnsConfigImpl::SaveConfig";

json Names(const std::string& host, const std::string& domain, const std::string& fqdn) {
    return json{
        {"Host Name", host}, {"Domain Name", domain}, {"Fully Qualified Domain Name", fqdn}};
}

const json kSeeded = Names("bx-node07", "lab.example.net", "bx-node07.lab.example.net");

TEST(Hostname, GetShowsAllThreeNamesInOrder) {
    BrixTest::TempHost host;
    auto run = Json(host, {"system", "hostname", "get"});
    EXPECT_EQ(Parsed(run), kSeeded);
    // Keys in the order of the structure.
    EXPECT_LT(run.out.find("Host Name"), run.out.find("Domain Name"));
    EXPECT_LT(run.out.find("Domain Name"), run.out.find("Fully Qualified"));
}

struct Change {
    std::vector<std::string> options;
    json names;                      // what get shows afterwards
    std::vector<std::string> saved;  // arguments of the one SaveConfig call
};

TEST(Hostname, SetChangesAndSavesOnce) {
    const Change cases[] = {
        {{"--host", "edge-2"},
         Names("edge-2", "lab.example.net", "edge-2.lab.example.net"),
         {"defaultTcpipStack", "edge-2", "lab.example.net"}},
        {{"-H", "Node-9", "-d", "prod.example"},
         Names("Node-9", "prod.example", "Node-9.prod.example"),
         {"defaultTcpipStack", "Node-9", "prod.example"}},
        {{"-d", "other.example."},
         Names("bx-node07", "other.example", "bx-node07.other.example"),
         {"defaultTcpipStack", "bx-node07", "other.example"}},
        {{"--fqdn", "x1.rack4.dc.example"},
         Names("x1", "rack4.dc.example", "x1.rack4.dc.example"),
         {"defaultTcpipStack", "x1", "rack4.dc.example"}},
        {{"-f", "solo"}, Names("solo", "", "solo"), {"defaultTcpipStack", "solo", ""}},
        // The longest label there may be.
        {{"-H", std::string(63, 'h')},
         Names(std::string(63, 'h'), "lab.example.net", std::string(63, 'h') + ".lab.example.net"),
         {"defaultTcpipStack", std::string(63, 'h'), "lab.example.net"}},
    };
    for (const auto& change : cases) {
        SCOPED_TRACE(change.options[1].substr(0, 20));
        BrixTest::TempHost host;
        JournalMark mark(host);
        std::vector<std::string> words{"system", "hostname", "set"};
        words.insert(words.end(), change.options.begin(), change.options.end());
        EXPECT_EQ(Parsed(Json(host, words)), json(true));
        auto calls = mark.Calls(kSave);
        ASSERT_EQ(calls.size(), 1u);
        EXPECT_EQ(calls[0]["args"], json(change.saved));
        EXPECT_EQ(Parsed(Json(host, {"system", "hostname", "get"})), change.names);
    }
}

struct Refusal {
    std::vector<std::string> options;
    std::string message;
};

// Nothing is saved for any refused request, also when an earlier name was accepted.
TEST(Hostname, RefusedRequestsSaveNothing) {
    const std::string badHost =
        ". A host name is 1 to 63 letters, digits and '-', and cannot begin or end with '-'.";
    const std::string badDomain =
        ". A domain name is labels of 1 to 63 letters, digits and '-' separated by '.'.";
    // 242 characters of valid labels.
    const std::string label(59, 'd');
    const std::string longDomain = label + "." + label + "." + label + "." + label + ".ab";
    const Refusal cases[] = {
        {{}, "You must specify at least one of: --host, --domain, --fqdn"},
        {{"--fqdn", "a.example", "--host", "a"},
         "You may not specify --host or --domain with --fqdn"},
        {{"-f", "a.example", "-d", "example"},
         "You may not specify --host or --domain with --fqdn"},
        {{"-H", "bad_name"}, "Invalid host name 'bad_name': character '_' not allowed" + badHost},
        {{"-H", "a.b"}, "Invalid host name 'a.b': a host name cannot contain '.'" + badHost},
        {{"-H", "-lead"}, "Invalid host name '-lead': label begins or ends with '-'" + badHost},
        {{"-H", std::string(64, 'h')},
         "Invalid host name '" + std::string(64, 'h') + "': label longer than 63 characters" +
             badHost},
        {{"-H", "fine", "-d", "bad..example"},
         "Invalid domain name 'bad..example': empty label" + badDomain},
        {{"-f", "ok.-bad.example"},
         "Invalid domain name '-bad.example': label begins or ends with '-'" + badDomain},
        {{"-f", std::string(20, 'h') + "." + longDomain},
         "Invalid fully qualified domain name '" + std::string(20, 'h') + "." + longDomain +
             "': longer than 253 characters."},
        {{"-H", std::string(20, 'h'), "-d", longDomain},
         "Invalid fully qualified domain name '" + std::string(20, 'h') + "." + longDomain +
             "': longer than 253 characters."},
    };
    BrixTest::TempHost host;
    for (const auto& refusal : cases) {
        SCOPED_TRACE(refusal.message);
        JournalMark mark(host);
        std::vector<std::string> words{"system", "hostname", "set"};
        words.insert(words.end(), refusal.options.begin(), refusal.options.end());
        ExpectRefused(host.Cli(words), refusal.message);
        EXPECT_TRUE(mark.Calls(kSave).empty());
    }
    EXPECT_EQ(Parsed(Json(host, {"system", "hostname", "get"})), kSeeded);
}

// The option checks come after the service is opened and before any setter is called.
TEST(Hostname, OrderOfChecksAndCalls) {
    BrixTest::TempHost host;
    host.Fault("KernCtl::Network::DnsConfigImpl::SetFqdn", "setter reached");
    ExpectRefused(host.Cli({"system", "hostname", "set", "-f", "a.example", "-H", "a"}),
                  "You may not specify --host or --domain with --fqdn");
    host.ClearFaults();

    host.Fault("KernCtl::Network::DnsConfigImpl::DnsConfigImpl", "no network stack");
    ExpectRefused(host.Cli({"system", "hostname", "set"}), "no network stack");
    ExpectRefused(host.Cli({"system", "hostname", "get"}), "no network stack");
    host.ClearFaults();

    // A failing domain after an accepted host name: the host name is not saved either.
    host.Fault("KernCtl::Network::DnsConfigImpl::SetDomain", "domain refused");
    JournalMark mark(host);
    ExpectRefused(host.Cli({"system", "hostname", "set", "-H", "new", "-d", "new.example"}),
                  "domain refused");
    host.ClearFaults();

    host.Fault(kSave, "resolver configuration is read-only");
    ExpectRefused(host.Cli({"system", "hostname", "set", "-H", "new"}),
                  "resolver configuration is read-only");
    host.ClearFaults();
    EXPECT_TRUE(mark.Calls(kSave).empty());
    EXPECT_EQ(Parsed(Json(host, {"system", "hostname", "get"})), kSeeded);

    host.Fault("KernCtl::Network::DnsConfigImpl::GetFqdn", "fqdn unavailable");
    ExpectRefused(host.Cli({"system", "hostname", "get"}), "fqdn unavailable");
}

}  // namespace

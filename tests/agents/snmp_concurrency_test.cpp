// Two processes changing different SNMP settings at the same time: every acknowledged change
// survives, and readers only ever see a whole, well-formed configuration file.
#include <gtest/gtest.h>

#include <chrono>
#include <future>
#include <pugixml.hpp>

#include "snmp_support.h"

namespace {

using namespace SnmpTest;

constexpr int kRounds = 50;

BrixTest::RunResult Loop(const std::string& option, const std::string& prefix) {
    const std::string script = "for i in $(seq 1 " + std::to_string(kRounds) +
                               "); do \"$0\" system snmp set " + option + " " + prefix +
                               "$i >/dev/null || exit 1; done";
    return BrixTest::Run({"/bin/sh", "-c", script, BRIX_BIN_DIR "/brixcli"});
}

// The number after `prefix` in the option `key` of a stored file, 0 when absent.
int Round(const pugi::xml_document& document, const std::string& key, const std::string& prefix) {
    const auto node = document.select_node(("//option[@key='" + key + "']").c_str()).node();
    const std::string value = node.child_value();
    return value.rfind(prefix, 0) == 0 ? std::stoi(value.substr(prefix.size())) : 0;
}

TEST(SnmpConcurrency, ConcurrentSetsOfDifferentSettingsAllSurvive) {
    BrixTest::TempHost host;
    Config(host);  // seeds the host before the writers start
    auto locations = std::async(std::launch::async, Loop, "--syslocation", "loc");
    auto contacts = std::async(std::launch::async, Loop, "--syscontact", "contact");

    // Watch the file while they run: always well-formed, and no value ever goes back.
    int reads = 0;
    int lastLocation = 0;
    int lastContact = 0;
    auto running = [](auto& future) {
        return future.wait_for(std::chrono::milliseconds(0)) != std::future_status::ready;
    };
    while (running(locations) || running(contacts)) {
        const std::string text = ReadFile(ConfigFile(host));
        pugi::xml_document document;
        ASSERT_TRUE(document.load_string(text.c_str())) << "torn file:\n" << text;
        const int location = Round(document, "syslocation", "loc");
        const int contact = Round(document, "syscontact", "contact");
        EXPECT_GE(location, lastLocation) << "a location update was lost";
        EXPECT_GE(contact, lastContact) << "a contact update was lost";
        lastLocation = location;
        lastContact = contact;
        ++reads;
    }
    const auto locationRun = locations.get();
    const auto contactRun = contacts.get();
    ASSERT_EQ(locationRun.status, 0) << locationRun.err;
    ASSERT_EQ(contactRun.status, 0) << contactRun.err;
    EXPECT_GT(reads, 0);

    const json config = Config(host);
    EXPECT_EQ(config["syslocation"], "loc" + std::to_string(kRounds));
    EXPECT_EQ(config["syscontact"], "contact" + std::to_string(kRounds));
    EXPECT_EQ(Calls(host, kCommit).size(), 2u * kRounds);
}

}  // namespace

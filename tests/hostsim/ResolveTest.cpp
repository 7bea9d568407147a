// Host paths stay inside the host root: "..", absolute and symbolic-link escapes are refused.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>

#include "hostsim/core/Store.h"
#include "support/TestHost.h"

namespace {

namespace fs = std::filesystem;
using BrixSim::Store;

TEST(Resolve, ConfinesPathsToTheRoot) {
    BrixTest::TempHost host;
    const fs::path root = Store::Get().Root();
    fs::create_directories(root / "etc/ostrel");
    fs::create_directories(root / "datastores/ds1");
    fs::create_symlink("/etc", root / "etc/outside");             // absolute, leaves the root
    fs::create_symlink("../../..", root / "datastores/up");       // climbs out of the root
    fs::create_symlink("ds1", root / "datastores/datastore1");    // stays inside
    fs::create_symlink("/etc/passwd", root / "etc/passwd-link");  // a file link that leaves
    fs::create_symlink("ostrel", root / "etc/ostrel-link");
    fs::create_symlink("loop-b", root / "loop-a");
    fs::create_symlink("loop-a", root / "loop-b");

    struct Case {
        const char* hostPath;
        const char* expected;  // below the root; nullptr when refused
    };
    const Case cases[] = {
        {"/etc/ostrel/snmp.xml", "etc/ostrel/snmp.xml"},
        {"etc/ostrel/snmp.xml", "etc/ostrel/snmp.xml"},  // relative paths start at "/"
        {"//etc///ostrel/./snmp.xml", "etc/ostrel/snmp.xml"},
        {"/var/tmp/snmp_boot.txt", "var/tmp/snmp_boot.txt"},  // missing folders are fine
        {"/etc/ostrel/../hosts", "etc/hosts"},
        {"/a/b/../../c", "c"},
        {"/", ""},
        {"/..", nullptr},
        {"/../etc/passwd", nullptr},
        {"../x", nullptr},
        {"/etc/../../x", nullptr},
        {"/etc/outside/passwd", nullptr},
        {"/etc/outside", nullptr},
        {"/datastores/up/etc/passwd", nullptr},
        {"/datastores/datastore1/dump.1", "datastores/ds1/dump.1"},
        {"/etc/passwd-link", nullptr},
        {"/etc/ostrel-link", "etc/ostrel-link"},  // the link itself, which stays inside
        {"/loop-a/x", nullptr},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.hostPath);
        const auto resolved = Store::Get().Resolve(c.hostPath);
        if (!c.expected) {
            EXPECT_FALSE(resolved.has_value()) << resolved->string();
        } else {
            ASSERT_TRUE(resolved.has_value());
            EXPECT_EQ(*resolved, *c.expected ? root / c.expected : root);
        }
    }
    EXPECT_FALSE(Store::Get().Resolve(std::string_view("/etc\0/x", 7)).has_value());
}

}  // namespace

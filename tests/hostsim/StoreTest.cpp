// The store: seeding, write transactions, the journal, faults checked in-process, and writers
// in several processes at once.
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <stdexcept>
#include <thread>

#include "hostbase/HostBase.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/core/Store.h"
#include "support/TestHost.h"

namespace {

// An operation of the tests' own.
const BrixSim::Operation kSetThing{"Area::SetThing"};

using BrixSim::Store;
using BrixTest::TempHost;

TEST(Store, NewRootIsCreatedAndSeededOnFirstUse) {
    TempHost host;
    auto& store = Store::Get();
    EXPECT_EQ(store.Root(), std::filesystem::canonical(host.Root()));
    EXPECT_TRUE(std::filesystem::exists(host.Root() / "host.db"));
    auto features = store.Prepare("SELECT count(*), sum(state) FROM features");
    ASSERT_TRUE(features.Step());
    EXPECT_EQ(features.Int(0), 256);
    EXPECT_EQ(features.Int(1), 0);
    EXPECT_EQ(store.GetInt("clock.offset", 99), 0);
    auto mode = store.Prepare("PRAGMA journal_mode");
    ASSERT_TRUE(mode.Step());
    EXPECT_EQ(mode.Text(0), "wal");
}

TEST(Store, ValuesSurviveReopening) {
    TempHost host;
    Store::Get().SetValue("test.name", "alpha");
    Store::Get().SetInt("test.count", -42);
    Store::Close();
    EXPECT_EQ(Store::Get().GetValue("test.name", "none"), "alpha");
    EXPECT_EQ(Store::Get().GetInt("test.count", 0), -42);
    EXPECT_FALSE(Store::Get().GetValue("test.missing").has_value());
    Store::Get().SetValue("test.bad", "12x");
    EXPECT_EQ(Store::Get().GetInt("test.bad", 7), 7);
}

TEST(Store, WriteRollsBackWhenWorkThrows) {
    TempHost host;
    auto& store = Store::Get();
    store.SetValue("k", "before");
    EXPECT_THROW(store.Write([&] {
        store.SetValue("k", "during");
        store.Journal("syslog", {{"priority", int64_t{6}}, {"text", "lost"}});
        throw std::runtime_error("stop");
    }),
                 std::runtime_error);
    EXPECT_EQ(store.GetValue("k", ""), "before");
    EXPECT_TRUE(host.Journal().empty());

    // A failing nested write undoes only its own part when the outer one carries on.
    store.Write([&] {
        store.SetValue("outer", "1");
        try {
            store.Write([&] {
                store.SetValue("inner", "1");
                throw std::runtime_error("inner");
            });
        } catch (const std::runtime_error&) {
        }
    });
    EXPECT_EQ(store.GetValue("outer", ""), "1");
    EXPECT_FALSE(store.GetValue("inner").has_value());

    // The store keeps working after a rollback.
    store.Write([&] { store.SetValue("k", "after"); });
    EXPECT_EQ(store.GetValue("k", ""), "after");
}

TEST(Store, JournalKeepsOrderAndFieldOrder) {
    TempHost host;
    auto& store = Store::Get();
    store.Write([&] {
        store.JournalCall(kSetThing, {std::string("name"), int64_t{-3}, true, nullptr,
                                      std::vector<std::string>{"a", "b"}});
        store.Journal("event", {{"format", "evt.%s"}, {"text", "evt.x"}});
    });
    store.Journal("sleep", {{"seconds", int64_t{2}}});
    const auto journal = host.Journal();
    ASSERT_EQ(journal.size(), 3u);
    EXPECT_EQ(journal[0].dump(),
              R"({"args":["name",-3,true,null,["a","b"]],"kind":"call","op":"Area::SetThing"})");
    EXPECT_EQ(journal[1]["kind"], "event");
    EXPECT_EQ(journal[2]["kind"], "sleep");
    // Raw lines keep "kind" first.
    const auto raw = host.Sim({"journal"});
    EXPECT_EQ(raw.out.substr(0, raw.out.find('\n')),
              R"({"kind":"call","op":"Area::SetThing","args":["name",-3,true,null,["a","b"]]})");
    EXPECT_EQ(host.Sim({"journal", "--clear"}).status, 0);
    EXPECT_TRUE(host.Journal().empty());
}

TEST(Store, CheckThrowsArmedFaultsWithDetail) {
    TempHost host;
    auto& store = Store::Get();
    EXPECT_NO_THROW(store.Check(BrixSim::Operation::Named("HostCtl::HostFactory::GetHost")));
    host.Fault("HostCtl::HostFactory::GetHost", "Host is unreachable", 2, "timed out");
    for (int call = 0; call < 2; ++call) {
        try {
            store.Check(BrixSim::Operation::Named("HostCtl::HostFactory::GetHost"));
            FAIL() << "no fault on call " << call;
        } catch (const HostCtl::Lib::HostCtlException& e) {
            EXPECT_STREQ(e.what(), "Host is unreachable");
            EXPECT_EQ(e.GetDetailedMessage(), "Host is unreachable (timed out)");
        }
    }
    EXPECT_NO_THROW(store.Check(BrixSim::Operation::Named("HostCtl::HostFactory::GetHost")));
    EXPECT_EQ(host.Sim({"fault", "list"}).out, "");
}

TEST(Store, CountedFaultFiringInsideARolledBackWriteStillCounts) {
    TempHost host;
    auto& store = Store::Get();
    host.Fault("KernCtl::Util::Sysinfo::Get", "busy", 2);
    for (int call = 0; call < 2; ++call) {
        EXPECT_THROW(store.Write([&] {
            store.SetValue("k", "v");
            store.Check(BrixSim::Operation::Named("KernCtl::Util::Sysinfo::Get"));
        }),
                     HostCtl::Lib::HostCtlException);
    }
    EXPECT_NO_THROW(store.Write(
        [&] { store.Check(BrixSim::Operation::Named("KernCtl::Util::Sysinfo::Get")); }));
    EXPECT_FALSE(store.GetValue("k").has_value());
}

TEST(Store, FeatureSwitchesReachFeatureList) {
    TempHost host;
    ASSERT_EQ(FeatureState_Init(), 0);
    EXPECT_EQ(*FeatureList[120], 0);
    ASSERT_EQ(host.Sim({"feature", "set", "120", "on"}).status, 0);
    EXPECT_EQ(host.Sim({"feature", "get", "120"}).out, "on\n");
    EXPECT_EQ(host.Sim({"feature", "get", "121"}).out, "off\n");
    ASSERT_EQ(FeatureState_Init(), 0);
    EXPECT_NE(*FeatureList[120], 0);
    EXPECT_EQ(*FeatureList[119], 0);
    ASSERT_EQ(host.Sim({"feature", "set", "120", "off"}).status, 0);
    ASSERT_EQ(FeatureState_Init(), 0);
    EXPECT_EQ(*FeatureList[120], 0);
}

TEST(Store, PreferenceInitIsJournaled) {
    TempHost host;
    EXPECT_EQ(Preference_Init(), 0);
    const auto journal = host.Journal();
    ASSERT_EQ(journal.size(), 1u);
    EXPECT_EQ(journal[0]["op"], "Preference_Init");
    EXPECT_EQ(journal[0]["args"], nlohmann::json::array());
}

// Several processes increment their own key and one shared key, each in its own transaction:
// every increment arrives.
TEST(Store, ConcurrentProcessesLoseNoWrite) {
    TempHost host;
    Store::Get();  // seeded before the writers start
    Store::Close();
    constexpr int kWriters = 4;
    constexpr int kRounds = 40;
    std::vector<pid_t> children;
    for (int writer = 0; writer < kWriters; ++writer) {
        const pid_t pid = fork();
        ASSERT_GE(pid, 0);
        if (pid == 0) {
            try {
                auto& store = Store::Get();
                const std::string own = "count." + std::to_string(writer);
                for (int round = 0; round < kRounds; ++round) {
                    store.Write([&] {
                        store.SetInt(own, store.GetInt(own, 0) + 1);
                        store.SetInt("count.all", store.GetInt("count.all", 0) + 1);
                    });
                }
                _exit(0);
            } catch (...) {
                _exit(1);
            }
        }
        children.push_back(pid);
    }
    for (pid_t pid : children) {
        int status = 0;
        ASSERT_EQ(waitpid(pid, &status, 0), pid);
        EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
    }
    auto& store = Store::Get();
    for (int writer = 0; writer < kWriters; ++writer) {
        EXPECT_EQ(store.GetInt("count." + std::to_string(writer), 0), kRounds);
    }
    EXPECT_EQ(store.GetInt("count.all", 0), kWriters * kRounds);
}

// Processes that start together on a missing root seed it exactly once.
TEST(Store, ConcurrentFirstUseSeedsOnce) {
    TempHost host;
    std::vector<std::thread> threads;
    std::vector<BrixTest::RunResult> results(4);
    for (size_t i = 0; i < results.size(); ++i) {
        threads.emplace_back([&, i] { results[i] = host.Sim({"feature", "get", "120"}); });
    }
    for (auto& thread : threads) thread.join();
    for (const auto& result : results) {
        EXPECT_EQ(result.status, 0) << result.err;
        EXPECT_EQ(result.out, "off\n");
    }
    auto count = Store::Get().Prepare("SELECT count(*) FROM features");
    ASSERT_TRUE(count.Step());
    EXPECT_EQ(count.Int(0), 256);
}

}  // namespace

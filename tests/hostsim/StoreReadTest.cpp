// The store's read side: kept statements, read transactions and the one a command runs in.
#include <gtest/gtest.h>
#include <sqlite3.h>

#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>

#include "cmdkit/Cli.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/core/Store.h"
#include "support/TestHost.h"

namespace {

using BrixSim::Store;
using BrixTest::TempHost;

// Another process's view of the host: its own connection, writing at once.
void WriteElsewhere(const TempHost& host, const std::string& sql) {
    sqlite3* db = nullptr;
    ASSERT_EQ(sqlite3_open((host.Root() / "host.db").c_str(), &db), SQLITE_OK);
    sqlite3_busy_timeout(db, 10000);
    char* error = nullptr;
    const int rc = sqlite3_exec(db, sql.c_str(), nullptr, nullptr, &error);
    const std::string message = error ? error : "";
    sqlite3_free(error);
    sqlite3_close(db);
    ASSERT_EQ(rc, SQLITE_OK) << message;
}

TEST(StoreRead, KeptStatementsAreResetAndOneInUseIsNotShared) {
    TempHost host;
    auto& store = Store::Get();
    store.SetValue("read.a", "1");
    store.SetValue("read.b", "2");
    const char* sql = "SELECT key FROM host WHERE key LIKE 'read.%' ORDER BY key";
    {
        auto outer = store.Prepare(sql);
        ASSERT_TRUE(outer.Step());
        EXPECT_EQ(outer.Text(0), "read.a");
        auto inner = store.Prepare(sql);  // the kept one is busy: a statement of its own
        ASSERT_TRUE(inner.Step());
        EXPECT_EQ(inner.Text(0), "read.a");
        ASSERT_TRUE(outer.Step());
        EXPECT_EQ(outer.Text(0), "read.b");
    }
    // Given back half-read and bound: the next user starts from the first row, unbound.
    auto again = store.Prepare(sql);
    ASSERT_TRUE(again.Step());
    EXPECT_EQ(again.Text(0), "read.a");
    { store.Prepare("SELECT ?").Bind(1, int64_t{7}); }
    auto unbound = store.Prepare("SELECT ?");
    ASSERT_TRUE(unbound.Step());
    EXPECT_TRUE(unbound.IsNull(0));
}

TEST(StoreRead, ReadSeesOneStateUntilAWriteEndsIt) {
    TempHost host;
    auto& store = Store::Get();
    store.SetValue("read.k", "before");
    EXPECT_EQ(store.ReadSnapshot(), 0u);
    uint64_t first = 0, second = 0;
    store.Read([&] {
        first = store.ReadSnapshot();
        EXPECT_NE(first, 0u);
        EXPECT_EQ(store.GetValue("read.k", ""), "before");
        WriteElsewhere(host, "UPDATE host SET value = 'after' WHERE key = 'read.k'");
        EXPECT_EQ(store.GetValue("read.k", ""), "before");
        store.Read([&] { EXPECT_EQ(store.ReadSnapshot(), first); });  // nested: the same one
        store.Write([&] {
            EXPECT_EQ(store.ReadSnapshot(), 0u);
            store.SetValue("read.mine", "x");
        });
        second = store.ReadSnapshot();
        EXPECT_NE(second, 0u);
        EXPECT_NE(second, first);
        EXPECT_EQ(store.GetValue("read.k", ""), "after");
    });
    EXPECT_EQ(store.ReadSnapshot(), 0u);
    EXPECT_EQ(store.GetValue("read.mine", ""), "x");

    // A failing reader ends its transaction too: the next write is not refused.
    EXPECT_THROW(store.Read([] { throw std::runtime_error("boom"); }), std::runtime_error);
    EXPECT_EQ(store.ReadSnapshot(), 0u);
    EXPECT_NO_THROW(store.SetValue("read.k", "later"));
}

TEST(StoreRead, FaultsAreReadOncePerTransactionAndFiredOnesCount) {
    TempHost host;
    auto& store = Store::Get();
    const std::string op = "HostCtl::HostFactory::GetHost";
    store.Read([&] {
        EXPECT_NO_THROW(store.Check(BrixSim::Operation::Named(op)));
        WriteElsewhere(host, "INSERT INTO faults VALUES ('" + op + "', 'Gone', NULL, NULL)");
        EXPECT_NO_THROW(
            store.Check(BrixSim::Operation::Named(op)));  // armed after this transaction began
    });
    EXPECT_THROW(store.Check(BrixSim::Operation::Named(op)), HostCtl::Lib::HostCtlException);

    host.Fault(op, "Twice", 2);
    int fired = 0;
    store.Read([&] {
        for (int call = 0; call < 4; ++call) {
            try {
                store.Check(BrixSim::Operation::Named(op));
            } catch (const HostCtl::Lib::HostCtlException& e) {
                EXPECT_EQ(std::string(e.what()), "Twice");
                ++fired;
            }
        }
    });
    EXPECT_EQ(fired, 2);
    EXPECT_EQ(host.Sim({"fault", "list"}).out, "");
}

// Records the read transaction it executes in.
class SnapshotCommand : public virtual CmdKit::AutoCli::Command {
  public:
    static std::shared_ptr<SnapshotCommand> Make() {
        return AdoptSelf(std::shared_ptr<SnapshotCommand>(new SnapshotCommand));
    }
    uint64_t seen = 0;

  protected:
    std::shared_ptr<CmdKit::CallSpec::InputSpec> GetInputSpecInternal() override {
        return CmdKit::CallSpec::InputSpec::New();
    }
    std::shared_ptr<CmdKit::CallSpec::OutputSpec> GetOutputSpecInternal() override {
        return CmdKit::CallSpec::OutputSpec::New();
    }
    void ExecuteInternal(std::shared_ptr<CmdKit::CallSpec::Input>,
                         std::shared_ptr<CmdKit::CallSpec::Output> output) override {
        seen = Store::Get().ReadSnapshot();
        output->SetComplete();
    }

  private:
    SnapshotCommand() = default;
};

TEST(StoreRead, EachCommandExecutesInItsOwnReadTransaction) {
    TempHost host;
    auto root = CmdKit::AutoCli::Namespace::New();
    auto command = SnapshotCommand::Make();
    root->RegisterNamespaceNode(command, "snap");
    std::ostringstream out, err;
    ASSERT_EQ(CmdKit::AutoCli::RunCli(root, {"snap"}, out, err), 0) << err.str();
    const uint64_t first = command->seen;
    EXPECT_NE(first, 0u);
    EXPECT_EQ(Store::Get().ReadSnapshot(), 0u);
    ASSERT_EQ(CmdKit::AutoCli::RunCli(root, {"snap"}, out, err), 0) << err.str();
    EXPECT_NE(command->seen, 0u);
    EXPECT_NE(command->seen, first);
}

// A listing printed after its command returned reads the state its command began in: a hold
// taken inside a read keeps that read open, and another process's write stays out of it.
TEST(StoreRead, AHoldKeepsTheReadItWasTakenInOpen) {
    TempHost host;
    auto& store = Store::Get();
    store.SetValue("hold.key", "before");
    std::unique_ptr<Store::ReadHold> hold;
    uint64_t snapshot = 0;
    store.Read([&] {
        hold = std::make_unique<Store::ReadHold>(store);
        snapshot = store.ReadSnapshot();
        EXPECT_EQ(store.GetValue("hold.key", ""), "before");
    });
    EXPECT_EQ(store.ReadSnapshot(), snapshot);
    WriteElsewhere(host, "UPDATE host SET value = 'after' WHERE key = 'hold.key'");
    EXPECT_EQ(store.GetValue("hold.key", ""), "before");
    store.Read([&] { EXPECT_EQ(store.ReadSnapshot(), snapshot); });  // nested: the same one
    hold.reset();
    EXPECT_EQ(store.ReadSnapshot(), 0u);
    EXPECT_EQ(store.GetValue("hold.key", ""), "after");
}

}  // namespace

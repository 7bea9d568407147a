// In-process costs of one invocation: building the tree, resolving a path, parsing arguments,
// executing against the store, and formatting results of growing size.
#include <benchmark/benchmark.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <map>
#include <sstream>

#include "brixcli/SystemPlugin.h"
#include "cmdkit/Cli.h"
#include "hostsim/core/Registry.h"
#include "hostsim/core/Store.h"

namespace {

using namespace CmdKit;

// Benchmarks run against private host roots so they never touch the user's default host: a
// seeded one, and ones grown with the keys of `brixsim init --scale`.
struct BenchHosts {
    BenchHosts() {
        top = std::filesystem::temp_directory_path() /
              ("brix-bench-" + std::to_string(static_cast<long>(getpid())));
        Use("default", {});
    }
    ~BenchHosts() {
        BrixSim::Store::Close();
        std::error_code ignored;
        std::filesystem::remove_all(top, ignored);
    }
    // Makes the process's store the host `name`, created with these table sizes on first use.
    void Use(const std::string& name, const std::map<std::string, int64_t>& scale) {
        const auto root = top / name;
        const bool fresh = !std::filesystem::exists(root);
        BrixSim::Store::Close();
        setenv("BRIX_HOST_ROOT", root.c_str(), 1);
        auto& store = BrixSim::Store::Get();
        if (!fresh || scale.empty()) return;
        store.Write([&] {
            for (const auto& [key, count] : scale) {
                BrixSim::RegisteredScaleKeys().at(key).grow(store, count);
            }
        });
    }
    std::filesystem::path top;
};
BenchHosts& Hosts() {
    static BenchHosts hosts;
    return hosts;
}

std::shared_ptr<AutoCli::NamespaceNode> Tree() {
    std::shared_ptr<AutoCli::NamespaceNode> root = AutoCli::Namespace::New();
    AutoCli_RegisterNamespaces(root);
    return root;
}

void RegisterWholeTree(benchmark::State& state) {
    for (auto _ : state) benchmark::DoNotOptimize(Tree());
}
BENCHMARK(RegisterWholeTree);

void ResolvePath(benchmark::State& state) {
    auto root = Tree();
    const std::vector<std::string> words{"system", "stats", "installtime", "get"};
    for (auto _ : state) {
        size_t consumed = 0;
        benchmark::DoNotOptimize(root->ResolveNode(words, consumed));
    }
}
BENCHMARK(ResolvePath);

void ParseArguments(benchmark::State& state) {
    auto spec = CallSpec::InputSpec::New();
    for (const char* name : {"alpha", "beta", "gamma"}) {
        spec->AddParameter(CallSpec::ParameterSpec::New(name, CallSpec::PARAM_STRING));
    }
    auto number = CallSpec::ParameterSpec::New("count", CallSpec::PARAM_INT);
    auto range = CallSpec::ParameterConstraint::New(CallSpec::CONSTRAINT_INT_RANGE);
    range->SetIntRange(0, 65535);
    number->SetConstraint(range);
    spec->AddParameter(number);
    const std::vector<std::string> args{"--alpha", "a", "--beta=b", "--count", "42"};
    for (auto _ : state) benchmark::DoNotOptimize(AutoCli::ParseArguments(*spec, args));
}
BENCHMARK(ParseArguments);

void ExecuteGetter(benchmark::State& state) {
    Hosts().Use("default", {});
    auto root = Tree();
    std::ostringstream out, err;
    for (auto _ : state) {
        out.str("");
        AutoCli::RunCli(root, {"system", "uuid", "get"}, out, err);
    }
}
BENCHMARK(ExecuteGetter);

// A getter on a host with 100,000 worlds: its cost should not depend on the host's size.
void ExecuteGetterLargeHost(benchmark::State& state) {
    Hosts().Use("worlds-100000", {{"worlds", 100000}});
    auto root = Tree();
    std::ostringstream out, err;
    for (auto _ : state) {
        out.str("");
        AutoCli::RunCli(root, {"system", "uuid", "get"}, out, err);
    }
}
BENCHMARK(ExecuteGetterLargeHost);

// A batch of 2,000 getters (four kinds in turn) read from a file, per line: what a line costs
// once the process has started.
void BatchOfGetters(benchmark::State& state) {
    Hosts().Use("default", {});
    auto root = Tree();
    const auto file = Hosts().top / "getters.batch";
    {
        std::ofstream lines(file);
        const char* getters[] = {"system uuid get", "system hostname get", "system time get",
                                 "system stats uptime get"};
        for (int i = 0; i < 2000; ++i) lines << getters[i % 4] << '\n';
    }
    std::ostringstream out, err;
    for (auto _ : state) {
        out.str("");
        AutoCli::RunCli(root, {"--batch", file.string()}, out, err);
    }
    state.SetItemsProcessed(state.iterations() * 2000);
}
BENCHMARK(BatchOfGetters)->Unit(benchmark::kMillisecond);

// Whole listings against the store: reading, building the rows and formatting them as a table.
void ExecuteListing(benchmark::State& state, const char* key, const char* command) {
    std::vector<std::string> words;
    std::istringstream split(command);
    for (std::string word; split >> word;) words.push_back(word);
    const int64_t count = state.range(0);
    Hosts().Use(std::string(key) + "-" + std::to_string(count), {{key, count}});
    auto root = Tree();
    std::ostringstream out, err;
    for (auto _ : state) {
        out.str("");
        AutoCli::RunCli(root, words, out, err);
    }
    state.SetItemsProcessed(state.iterations() * count);
}
BENCHMARK_CAPTURE(ExecuteListing, process_list, "worlds", "system process list")
    ->Arg(1000)
    ->Arg(10000)
    ->Arg(100000)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(ExecuteListing, advanced_list, "options", "system settings advanced list")
    ->Arg(1000)
    ->Arg(10000)
    ->Unit(benchmark::kMillisecond);

std::shared_ptr<MetaObj::MetaList> Rows(int64_t count) {
    auto prototype = MetaObj::MetaStruct::New("Row");
    auto list = MetaObj::MetaList::New(MetaObj::META_STRUCT, prototype);
    list->Reserve(count);
    for (int64_t i = 0; i < count; ++i) {
        auto row = MetaObj::MetaStruct::New("Row");
        row->SetField("Id", static_cast<long>(i), MetaObj::MetaStruct::_docEmpty);
        row->SetField("Name", "world-" + std::to_string(i), MetaObj::MetaStruct::_docEmpty);
        row->SetField("Enabled", i % 2 == 0, MetaObj::MetaStruct::_docEmpty);
        list->Add(row);
    }
    return list;
}

// A command that answers a prepared list, so formatting is measured on its own.
class ListCommand : public virtual AutoCli::Command {
  public:
    static std::shared_ptr<ListCommand> Make(std::shared_ptr<MetaObj::MetaList> rows) {
        auto command = AdoptSelf(std::shared_ptr<ListCommand>(new ListCommand));
        command->rows_ = std::move(rows);
        command->SetDefaultOutputFormatter("table");
        return command;
    }

  protected:
    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override {
        return CallSpec::InputSpec::New();
    }
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override {
        auto spec = CallSpec::OutputSpec::New();
        spec->SetRootObject(rows_);
        return spec;
    }
    void ExecuteInternal(std::shared_ptr<CallSpec::Input>,
                         std::shared_ptr<CallSpec::Output> output) override {
        output->SetRootObject(rows_);
        output->SetComplete();
    }

  private:
    ListCommand() = default;
    std::shared_ptr<MetaObj::MetaList> rows_;
};

void Format(benchmark::State& state, const char* formatter) {
    std::shared_ptr<AutoCli::NamespaceNode> root = AutoCli::Namespace::New();
    root->RegisterNamespaceNode(ListCommand::Make(Rows(state.range(0))), "rows");
    const std::vector<std::string> args{std::string("--formatter=") + formatter, "rows"};
    std::ostringstream out, err;
    for (auto _ : state) {
        out.str("");
        AutoCli::RunCli(root, args, out, err);
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}
BENCHMARK_CAPTURE(Format, simple, "simple")->Arg(10)->Arg(1000)->Arg(100000);
BENCHMARK_CAPTURE(Format, table, "table")->Arg(10)->Arg(1000)->Arg(100000);
BENCHMARK_CAPTURE(Format, json, "json")->Arg(10)->Arg(1000)->Arg(100000);

}  // namespace

BENCHMARK_MAIN();

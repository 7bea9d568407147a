// In-process costs of one invocation: building the tree, resolving a path, parsing arguments,
// executing against the store, and formatting results of growing size.
#include <benchmark/benchmark.h>

#include <cstdlib>
#include <filesystem>
#include <sstream>

#include "brixcli/SystemPlugin.h"
#include "cmdkit/Cli.h"

namespace {

using namespace CmdKit;

// Benchmarks run against a private host root so they never touch the user's default host.
struct BenchHost {
    BenchHost() {
        root = std::filesystem::temp_directory_path() / "brix-bench-host";
        setenv("BRIX_HOST_ROOT", root.c_str(), 1);
    }
    std::filesystem::path root;
};
const BenchHost benchHost;

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
    auto root = Tree();
    std::ostringstream out, err;
    for (auto _ : state) {
        out.str("");
        AutoCli::RunCli(root, {"system", "uuid", "get"}, out, err);
    }
}
BENCHMARK(ExecuteGetter);

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

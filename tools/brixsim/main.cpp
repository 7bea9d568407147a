// brixsim: makes and seeds a simulated host, arms faults, reads the journal, exports and imports
// the host's state, and switches feature entries.
#include <stdlib.h>

#include <algorithm>
#include <charconv>
#include <cstdio>
#include <fstream>
#include <iostream>
#include <iterator>
#include <map>
#include <nlohmann/json.hpp>
#include <optional>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include "ToolOutput.h"
#include "hostsim/core/Registry.h"
#include "hostsim/core/StateTransfer.h"
#include "hostsim/core/Store.h"

namespace {

namespace fs = std::filesystem;
using Args = std::vector<std::string>;

constexpr const char* kUsage =
    "Usage: brixsim [--root DIR] COMMAND [ARGUMENTS]\n"
    "       brixsim --version\n"
    "\n"
    "The host root is DIR, else $BRIX_HOST_ROOT, else\n"
    "${XDG_STATE_HOME:-$HOME/.local/state}/brixsim/default.\n"
    "\n"
    "Commands:\n"
    "  init [--force] [--scale KEY=N,...]  create and seed the host (--force: start afresh;\n"
    "                                      --scale: grow tables to N rows for load tests)\n"
    "  fault set OPERATION MESSAGE [--detail TEXT] [--times N]\n"
    "                                      make OPERATION fail with MESSAGE (N times, or until\n"
    "                                      cleared)\n"
    "  fault clear [OPERATION]             disarm one fault, or all\n"
    "  fault list                          the armed faults, as JSON lines\n"
    "  fault ops                           every operation that can be made to fail\n"
    "  journal [--clear]                   print the journal as JSON lines (--clear: empty it)\n"
    "  export                              print the whole host (tables and files) as JSON\n"
    "  import FILE                         make the host what FILE holds (- for standard input)\n"
    "  feature set ENTRY on|off            switch a feature entry (0-255)\n"
    "  feature get ENTRY                   print on or off\n";

// The usage with the keys of init --scale, as the areas registered them.
std::string Usage() {
    std::string usage = kUsage;
    usage += "\nKeys of init --scale:\n";
    for (const auto& [key, scale] : BrixSim::RegisteredScaleKeys()) {
        usage += "  " + key + std::string(key.size() < 36 ? 36 - key.size() : 1, ' ') + scale.what +
                 "\n";
    }
    return usage;
}

// A wrong invocation: the message and the usage go to standard error, exit status 2.
struct UsageError : std::runtime_error {
    using std::runtime_error::runtime_error;
};

int64_t ParseInt(const std::string& text, const std::string& what) {
    size_t used = 0;
    int64_t value = 0;
    try {
        value = std::stoll(text, &used, 10);
    } catch (const std::exception&) {
        used = 0;
    }
    if (used == 0 || used != text.size()) throw UsageError(what + " must be an integer: " + text);
    return value;
}

int FeatureEntry(const std::string& text) {
    const int64_t entry = ParseInt(text, "ENTRY");
    if (entry < 0 || entry > 255) throw UsageError("ENTRY must be between 0 and 255: " + text);
    return static_cast<int>(entry);
}

// ---------------------------------------------------------------------------------------------

// Largest N of init --scale: a host of this size still fits in a few hundred megabytes.
constexpr int64_t kMaxScale = 10'000'000;

// "worlds=100000,options=10000" -> {{"worlds", 100000}, {"options", 10000}}, checked against
// the registered keys before anything is created.
std::map<std::string, int64_t> ParseScale(const std::string& spec) {
    std::map<std::string, int64_t> counts;
    std::stringstream items(spec);
    std::string item;
    while (std::getline(items, item, ',')) {
        const auto equals = item.find('=');
        if (equals == std::string::npos) {
            throw UsageError("init --scale: expected KEY=N, got \"" + item + "\"");
        }
        const std::string key = item.substr(0, equals);
        const std::string number = item.substr(equals + 1);
        if (BrixSim::RegisteredScaleKeys().count(key) == 0) {
            throw UsageError("init --scale: unknown key \"" + key + "\"");
        }
        int64_t count = 0;
        const auto parsed = std::from_chars(number.data(), number.data() + number.size(), count);
        if (parsed.ec != std::errc() || parsed.ptr != number.data() + number.size() || count < 1 ||
            count > kMaxScale) {
            throw UsageError("init --scale: " + key + " must be a whole number from 1 to " +
                             std::to_string(kMaxScale) + ", got \"" + number + "\"");
        }
        if (!counts.emplace(key, count).second) {
            throw UsageError("init --scale: " + key + " given twice");
        }
    }
    if (counts.empty() || spec.back() == ',') {
        throw UsageError("init --scale: expected KEY=N,..., got \"" + spec + "\"");
    }
    return counts;
}

int Init(const Args& args) {
    bool force = false;
    std::map<std::string, int64_t> scale;
    for (size_t i = 0; i < args.size(); ++i) {
        if (args[i] == "--force") {
            force = true;
        } else if (args[i] == "--scale") {
            if (i + 1 >= args.size()) throw UsageError("init: --scale needs KEY=N,...");
            scale = ParseScale(args[++i]);
        } else if (args[i] == "--root" && i + 1 < args.size() && !args[i + 1].empty()) {
            setenv("BRIX_HOST_ROOT", args[++i].c_str(), 1);
        } else {
            throw UsageError("init: unexpected argument " + args[i]);
        }
    }
    BrixSim::Store::Close();
    const fs::path root = BrixSim::Store::DefaultRoot();
    if (const auto entries = BrixSim::Store::HostEntries(root)) {
        if (!force) {
            std::cerr << "brixsim: a host already exists at " << root.string()
                      << "; use init --force to recreate it\n";
            return 1;
        }
        // What the host made goes; anything else in the folder stays where it is.
        for (const auto& name : *entries) fs::remove_all(root / name);
        BrixSim::Store::AdoptFolder();
    }
    BrixSim::Store& store = BrixSim::Store::Get();
    if (!scale.empty()) {
        store.Write([&] {
            for (const auto& [key, count] : scale) {
                BrixSim::RegisteredScaleKeys().at(key).grow(store, count);
            }
        });
    }
    std::cout << "Seeded host at " << BrixSim::Store::Get().Root().string() << "\n";
    return 0;
}

int FaultSet(const Args& args) {
    std::vector<std::string> positional;
    std::optional<std::string> detail;
    std::optional<int64_t> times;
    bool optionsDone = false;
    for (size_t i = 0; i < args.size(); ++i) {
        const std::string& arg = args[i];
        if (!optionsDone && arg == "--") {
            optionsDone = true;
        } else if (!optionsDone && (arg == "--detail" || arg == "--times")) {
            if (i + 1 >= args.size()) throw UsageError("fault set: " + arg + " needs a value");
            if (arg == "--detail") {
                detail = args[++i];
            } else {
                times = ParseInt(args[++i], "--times");
                if (*times < 1) throw UsageError("fault set: --times must be at least 1");
            }
        } else if (!optionsDone && arg.size() > 2 && arg.rfind("--", 0) == 0) {
            throw UsageError("fault set: unknown option " + arg);
        } else {
            positional.push_back(arg);
        }
    }
    if (positional.size() != 2) throw UsageError("fault set: needs OPERATION and MESSAGE");
    const auto operations = BrixSim::Operation::All();
    if (!std::binary_search(operations.begin(), operations.end(), positional[0])) {
        std::cerr << "brixsim: unknown operation " << positional[0]
                  << " (brixsim fault ops lists them)\n";
        return 1;
    }
    auto& store = BrixSim::Store::Get();
    store.Write([&] {
        auto insert = store.Prepare("INSERT OR REPLACE INTO faults VALUES (?, ?, ?, ?)");
        insert.Bind(1, positional[0]).Bind(2, positional[1]);
        if (detail) {
            insert.Bind(3, *detail);
        } else {
            insert.BindNull(3);
        }
        if (times) {
            insert.Bind(4, *times);
        } else {
            insert.BindNull(4);
        }
        insert.Run();
    });
    return 0;
}

int Fault(const Args& args) {
    if (args.empty()) throw UsageError("fault: needs set, clear, list or ops");
    const Args rest(args.begin() + 1, args.end());
    if (args[0] == "set") return FaultSet(rest);
    if (args[0] == "clear") {
        if (rest.size() > 1) throw UsageError("fault clear: takes at most one OPERATION");
        auto& store = BrixSim::Store::Get();
        if (rest.empty()) {
            store.Exec("DELETE FROM faults");
        } else {
            store.Prepare("DELETE FROM faults WHERE op = ?").Bind(1, rest[0]).Run();
        }
        return 0;
    }
    if (args[0] == "list") {
        if (!rest.empty()) throw UsageError("fault list: takes no arguments");
        auto rows = BrixSim::Store::Get().Prepare(
            "SELECT op, message, detail, remaining FROM faults ORDER BY op");
        while (rows.Step()) {
            nlohmann::ordered_json fault;
            fault["op"] = rows.Text(0);
            fault["message"] = rows.Text(1);
            fault["detail"] =
                rows.IsNull(2) ? nlohmann::ordered_json() : nlohmann::ordered_json(rows.Text(2));
            fault["remaining"] =
                rows.IsNull(3) ? nlohmann::ordered_json() : nlohmann::ordered_json(rows.Int(3));
            std::cout << fault.dump() << "\n";
        }
        return 0;
    }
    if (args[0] == "ops") {
        if (!rest.empty()) throw UsageError("fault ops: takes no arguments");
        for (const auto& operation : BrixSim::Operation::All()) {
            std::cout << operation << "\n";
        }
        return 0;
    }
    throw UsageError("fault: unknown subcommand " + args[0]);
}

int Journal(const Args& args) {
    auto& store = BrixSim::Store::Get();
    if (args.size() == 1 && args[0] == "--clear") {
        store.Exec("DELETE FROM journal");
        return 0;
    }
    if (!args.empty()) throw UsageError("journal: unexpected argument " + args[0]);
    auto rows = store.Prepare("SELECT record FROM journal ORDER BY seq");
    while (rows.Step()) std::cout << rows.Text(0) << "\n";
    return 0;
}

int Export(const Args& args) {
    if (!args.empty()) throw UsageError("export: unexpected argument " + args[0]);
    std::cout << BrixSim::ExportState(BrixSim::Store::Get()) << "\n";
    return 0;
}

int Import(const Args& args) {
    if (args.size() != 1) throw UsageError("import: needs FILE (or - for standard input)");
    std::string text;
    if (args[0] == "-") {
        text.assign(std::istreambuf_iterator<char>(std::cin), std::istreambuf_iterator<char>());
    } else {
        std::ifstream in(args[0], std::ios::binary);
        if (!in) {
            std::cerr << "brixsim: cannot read " << args[0] << "\n";
            return 1;
        }
        text.assign(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
    const auto result = BrixSim::ImportState(text, BrixSim::Store::Get);
    switch (result.status) {
        case BrixSim::ImportResult::Status::Applied:
            return 0;
        case BrixSim::ImportResult::Status::NotJson:
            std::cerr << "brixsim: " << args[0] << " is not JSON: " << result.message << "\n";
            return 1;
        case BrixSim::ImportResult::Status::Failed:
            std::cerr << "brixsim: import failed, the tables are as they were, the files may be "
                         "partly the document's: "
                      << result.message << "\n";
            return 1;
        case BrixSim::ImportResult::Status::Refused:
            break;
    }
    std::cerr << "brixsim: import refused, nothing changed: " << result.message << "\n";
    return 1;
}

int Feature(const Args& args) {
    if (args.empty()) throw UsageError("feature: needs set or get");
    auto& store = BrixSim::Store::Get();
    if (args[0] == "set") {
        if (args.size() != 3) throw UsageError("feature set: needs ENTRY and on|off");
        const int entry = FeatureEntry(args[1]);
        if (args[2] != "on" && args[2] != "off") {
            throw UsageError("feature set: state must be on or off: " + args[2]);
        }
        store.Prepare("INSERT OR REPLACE INTO features VALUES (?, ?)")
            .Bind(1, entry)
            .Bind(2, args[2] == "on")
            .Run();
        return 0;
    }
    if (args[0] == "get") {
        if (args.size() != 2) throw UsageError("feature get: needs ENTRY");
        auto row = store.Prepare("SELECT state FROM features WHERE entry = ?");
        row.Bind(1, FeatureEntry(args[1]));
        std::cout << (row.Step() && row.Int(0) != 0 ? "on" : "off") << "\n";
        return 0;
    }
    throw UsageError("feature: unknown subcommand " + args[0]);
}

int Main(Args args) {
    while (!args.empty() && args[0] == "--root") {
        if (args.size() < 2 || args[1].empty()) throw UsageError("--root needs a folder");
        setenv("BRIX_HOST_ROOT", args[1].c_str(), 1);
        args.erase(args.begin(), args.begin() + 2);
    }
    if (args.empty()) throw UsageError("no command given");
    const std::string command = args[0];
    const Args rest(args.begin() + 1, args.end());
    if (command == "help" || command == "--help" || command == "-h") {
        std::cout << Usage();
        return 0;
    }
    if (command == "--version") {
        if (!rest.empty()) throw UsageError("--version: unexpected argument " + rest[0]);
        std::cout << "brixsim " BRIX_VERSION "\n";
        return 0;
    }
    if (command == "init") return Init(rest);
    if (command == "fault") return Fault(rest);
    if (command == "journal") return Journal(rest);
    if (command == "export") return Export(rest);
    if (command == "import") return Import(rest);
    if (command == "feature") return Feature(rest);
    throw UsageError("unknown command " + command);
}

int Run(const Args& args) {
    try {
        return Main(args);
    } catch (const UsageError& e) {
        std::cerr << "brixsim: " << e.what() << "\n\n" << Usage();
        return 2;
    } catch (const std::exception& e) {
        std::cerr << "brixsim: " << e.what() << "\n";
        return 1;
    }
}

}  // namespace

int main(int argc, char** argv) {
    BrixTools::HoldClosedStandardDescriptors();
    const auto& output = BrixTools::CaptureStandardOutput();
    return BrixTools::FinishOutput("brixsim", output, Run(Args(argv + 1, argv + argc)));
}

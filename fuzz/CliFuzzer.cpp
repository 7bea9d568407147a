// The tool's side of an invocation against the real `system` tree: global options, path
// resolution, help, the command list and the parsing of a command's arguments. Input: the words
// after the program name, one per line (or NUL-separated). Commands are never executed. Besides
// the status, checks that every message is a short line of valid UTF-8 without control
// characters, whatever the words hold.
#include <memory>
#include <sstream>

#include "FuzzSupport.h"
#include "brixcli/SystemPlugin.h"
#include "cmdkit/Cli.h"
#include "hostsim/core/Store.h"

namespace {

std::shared_ptr<CmdKit::AutoCli::NamespaceNode> tree;

}  // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
    BrixFuzz::TemporaryHostRoot();
    // The feature entry that attaches the optional coredump branch, so its commands are fuzzed
    // too.
    BrixSim::Store::Get().Prepare("INSERT OR REPLACE INTO features VALUES (120, 1)").Run();
    tree = CmdKit::AutoCli::Namespace::New();
    AutoCli_RegisterNamespaces(tree);
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const auto words = BrixFuzz::Words(BrixFuzz::Text(data, size));
    std::ostringstream out;
    std::ostringstream err;
    const int status = CmdKit::AutoCli::DryRunCli(tree, words, out, err);
    // 0 help, list or a command ready to run; 2 a refusal with its message. Anything else is a
    // failure inside the framework or a command's declarations.
    BRIX_FUZZ_CHECK(status == 0 || status == 2, err.str());
    BRIX_FUZZ_CHECK((status == 2) == !err.str().empty(), err.str());
    // Whatever the words hold, the messages are short lines of valid UTF-8 without control
    // characters: a word is quoted as an escaped excerpt.
    const std::string messages = err.str();
    BRIX_FUZZ_CHECK(BrixFuzz::ValidUtf8(messages), messages);
    size_t lineStart = 0;
    for (size_t i = 0; i < messages.size(); ++i) {
        const auto c = static_cast<unsigned char>(messages[i]);
        BRIX_FUZZ_CHECK((c >= 0x20 && c != 0x7F) || c == '\n', messages);
        if (c == '\n') {
            lineStart = i + 1;
            continue;
        }
        BRIX_FUZZ_CHECK(i - lineStart < 2048, messages);
    }
    return 0;
}

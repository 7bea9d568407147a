// The plug-in's entry: brixcli calls it once after loading the library.
#include <memory>

#include "HelloGreet.h"
#include "cmdkit/AutoCli.h"

extern "C" __attribute__((visibility("default"))) void AutoCli_RegisterNamespaces(
    const std::shared_ptr<CmdKit::AutoCli::NamespaceNode>& root) {
    auto hello = root->SubNamespace("hello");
    hello->SetDescription("Greetings, an example plug-in.");
    hello->RegisterNamespaceNode(HelloCli::HelloGreet::New(), "greet");
}

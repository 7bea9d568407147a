// The system plug-in's entry point, called once by brixcli after loading the library.
#pragma once

#include <memory>

#include "cmdkit/AutoCli.h"

extern "C" void AutoCli_RegisterNamespaces(
    const std::shared_ptr<CmdKit::AutoCli::NamespaceNode>& root);

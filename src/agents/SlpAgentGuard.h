// The SLP commands' error convention: the host's and the framework's exceptions both become the
// command's error message.
#pragma once

#include <utility>

#include "cmdkit/CmdKitException.h"
#include "frame/CommandKit.h"

namespace OstrelCli::System {

template <class Work>
void GuardSlp(CallSpec::Output& output, Work&& work) {
    try {
        Guard(output, std::forward<Work>(work));
    } catch (const CmdKit::CmdKitException& error) {
        output.AddErrorMessage(error.what());
    }
}

}  // namespace OstrelCli::System

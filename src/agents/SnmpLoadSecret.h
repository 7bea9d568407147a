// Reading SNMPv3 secrets from files, shared by `system snmp hash` and `system snmp test`.
#pragma once

#include <string>

namespace OstrelCli::System {

// The first line of the file `name`, without surrounding white space; empty for an empty name.
// Throws HostCtl::Lib::HostCtlException when the file cannot be read.
std::string LoadSecret(const std::string& name);

}  // namespace OstrelCli::System

// The SNMP agent's settings as "/etc/ostrel/snmp.xml" keeps them: the data, the factory defaults,
// the agent's limits and entry formats, and the XML form.
#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace BrixSim::Snmp {

struct Settings {
    bool enabled = false;
    int port = 161;
    bool largeStorage = true;
    std::vector<std::string> communities;
    std::vector<std::string> targets;  // SNMPv1 trap targets
    std::vector<std::string> users;
    std::vector<std::string> remoteUsers;
    std::vector<std::string> v3Targets;
    // Keyed options; "EventFilter" holds its trap oids separated by ";".
    std::map<std::string, std::string> options;

    bool operator==(const Settings&) const = default;
};

Settings FactoryDefaults();

// Parses the XML form; nullopt when the text is not well-formed XML. Values that cannot be read
// keep their defaults; unknown option keys are kept.
std::optional<Settings> ParseSettings(std::string_view xml);
std::string FormatSettings(const Settings& settings);

// Entry formats. Each Check* validates a whole list as a setter receives it and returns it
// without empty entries; a refusal throws HostCtl::Lib::HostCtlException with the reason.
std::vector<std::string> CheckCommunities(const std::vector<std::string>& entries);
std::vector<std::string> CheckTargets(const std::vector<std::string>& entries);
std::vector<std::string> CheckUsers(const std::vector<std::string>& entries);
std::vector<std::string> CheckRemoteUsers(const std::vector<std::string>& entries);
std::vector<std::string> CheckV3Targets(const std::vector<std::string>& entries);
// The stored form of one keyed option; nullopt removes the key. Throws for an unknown key or a
// refused value.
std::optional<std::string> CheckOption(const std::string& key, const std::string& value);
// Rules between settings: v3 targets name configured remote users able to give their security
// level, privacy needs authentication.
void CheckConsistency(const Settings& settings);

struct Endpoint {
    std::string host;
    uint16_t port = 162;
};
struct V1Target {
    Endpoint to;
    std::string community;
};
struct LocalUser {
    std::string name;
    std::string authHash;  // hexadecimal, empty for none
    std::string privHash;
    std::string model;  // none, auth or priv
};
struct RemoteUser {
    std::string name;
    std::string authProtocol;  // none, MD5 or SHA1
    std::string authHash;
    std::string privProtocol;  // none or AES
    std::string privHash;
    std::string engineId;  // hexadecimal, without 0x
};
struct V3Target {
    Endpoint to;
    std::string user;
    std::string level;  // none, auth or priv
    bool inform = false;
};

// Parsers of stored entries (already checked); they throw for an entry that does not parse.
V1Target ParseV1Target(const std::string& entry);
LocalUser ParseLocalUser(const std::string& entry);
RemoteUser ParseRemoteUser(const std::string& entry);
V3Target ParseV3Target(const std::string& entry);

}  // namespace BrixSim::Snmp

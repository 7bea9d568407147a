#include "hostsim/agents/snmp/SnmpSettings.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <pugixml.hpp>
#include <set>
#include <sstream>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/agents/snmp/Ber.h"

namespace BrixSim::Snmp {

namespace {

using HostCtl::Lib::HostCtlException;

constexpr size_t kMaxCommunities = 10;
constexpr size_t kMaxCommunityLength = 64;
constexpr size_t kMaxTargets = 3;
constexpr size_t kMaxUsers = 5;
constexpr size_t kMaxUserName = 32;
constexpr size_t kMaxV3Targets = 3;
constexpr size_t kMaxText = 255;

[[noreturn]] void Refuse(const std::string& message) {
    throw HostCtlException(message);
}

std::string Trim(std::string_view text) {
    const auto first = text.find_first_not_of(" \t\r\n");
    if (first == std::string_view::npos) return std::string();
    const auto last = text.find_last_not_of(" \t\r\n");
    return std::string(text.substr(first, last - first + 1));
}

std::vector<std::string> Split(std::string_view text, char separator) {
    std::vector<std::string> parts;
    size_t start = 0;
    while (true) {
        const size_t end = text.find(separator, start);
        parts.emplace_back(text.substr(start, end == std::string_view::npos ? end : end - start));
        if (end == std::string_view::npos) return parts;
        start = end + 1;
    }
}

std::vector<std::string> NonEmpty(const std::vector<std::string>& entries) {
    std::vector<std::string> kept;
    for (const auto& entry : entries) {
        std::string trimmed = Trim(entry);
        if (!trimmed.empty()) kept.push_back(std::move(trimmed));
    }
    return kept;
}

void CheckCount(size_t count, size_t limit, const char* what) {
    if (count > limit) {
        Refuse("At most " + std::to_string(limit) + " " + what + " can be set; " +
               std::to_string(count) + " were given.");
    }
}

bool IsHex(std::string_view text) {
    return std::all_of(text.begin(), text.end(),
                       [](char c) { return std::isxdigit(static_cast<unsigned char>(c)); });
}

bool OneOf(std::string_view value, std::initializer_list<std::string_view> allowed) {
    return std::find(allowed.begin(), allowed.end(), value) != allowed.end();
}

bool HasControl(std::string_view text) {
    return std::any_of(text.begin(), text.end(),
                       [](char c) { return static_cast<unsigned char>(c) < 0x20 || c == 0x7f; });
}

// "host[@port]"; nullopt when it does not parse.
std::optional<Endpoint> ParseEndpoint(std::string_view text) {
    Endpoint endpoint;
    const size_t at = text.rfind('@');
    std::string_view host = text.substr(0, at);
    if (at != std::string_view::npos) {
        const std::string_view port = text.substr(at + 1);
        unsigned value = 0;
        const auto [rest, error] = std::from_chars(port.data(), port.data() + port.size(), value);
        if (port.empty() || error != std::errc() || rest != port.data() + port.size() ||
            value == 0 || value > 65535) {
            return std::nullopt;
        }
        endpoint.port = static_cast<uint16_t>(value);
    }
    const bool hostOk = !host.empty() && std::all_of(host.begin(), host.end(), [](char c) {
        return std::isalnum(static_cast<unsigned char>(c)) || c == '.' || c == '-' || c == ':' ||
               c == '_' || c == '%';
    });
    if (!hostOk) return std::nullopt;
    endpoint.host = std::string(host);
    return endpoint;
}

bool ValidUserName(std::string_view name) {
    return !name.empty() && name.size() <= kMaxUserName &&
           std::all_of(name.begin(), name.end(), [](char c) {
               return std::isgraph(static_cast<unsigned char>(c)) && c != '/' && c != ',';
           });
}

void CheckUserName(const std::string& entry, std::string_view name) {
    if (name.size() > kMaxUserName) {
        Refuse("User name '" + CmdKit::MessageExcerpt(std::string(name)) + "' in '" +
               CmdKit::MessageExcerpt(entry) + "' is longer than 32 characters.");
    }
    if (!ValidUserName(name)) {
        Refuse("User name '" + CmdKit::MessageExcerpt(std::string(name)) + "' in '" +
               CmdKit::MessageExcerpt(entry) +
               "' must be 1 to 32 printable characters without blanks.");
    }
}

// "-" or the hexadecimal form of a localized key.
bool ValidHash(std::string_view hash) {
    return hash == "-" || ((hash.size() == 32 || hash.size() == 40) && IsHex(hash));
}

std::string HashOrEmpty(const std::string& field) {
    return field == "-" ? std::string() : field;
}

// An engine id as hexadecimal text, without its 0x; nullopt when it is not one.
std::optional<std::string> EngineIdHex(std::string_view text) {
    if (text.size() > 2 && text[0] == '0' && (text[1] == 'x' || text[1] == 'X'))
        text.remove_prefix(2);
    if (text.size() < 10 || text.size() > 32 || text.size() % 2 != 0 || !IsHex(text)) {
        return std::nullopt;
    }
    return std::string(text);
}

std::string Join(const std::vector<std::string>& parts, const char* separator) {
    std::string joined;
    for (const auto& part : parts) {
        if (!joined.empty()) joined += separator;
        joined += part;
    }
    return joined;
}

void CheckUnique(std::set<std::string>& seen, const std::string& name, const char* what) {
    if (!seen.insert(name).second)
        Refuse(std::string(what) + " '" + CmdKit::MessageExcerpt(name) + "' is given twice.");
}

}  // namespace

Settings FactoryDefaults() {
    Settings settings;
    settings.options = {{"EnvEventSource", "indications"}, {"loglevel", "info"}};
    return settings;
}

V1Target ParseV1Target(const std::string& entry) {
    const size_t slash = entry.find('/');
    const auto endpoint = ParseEndpoint(std::string_view(entry).substr(0, slash));
    if (slash == std::string::npos || !endpoint || slash + 1 == entry.size()) {
        Refuse("Target '" + CmdKit::MessageExcerpt(entry) +
               "' is not of the form ip-or-hostname[@port]/community.");
    }
    return {*endpoint, entry.substr(slash + 1)};
}

LocalUser ParseLocalUser(const std::string& entry) {
    const auto fields = Split(entry, '/');
    if (fields.size() != 4) {
        Refuse("User '" + CmdKit::MessageExcerpt(entry) +
               "' is not of the form user/-|auth-hash/-|priv-hash/model.");
    }
    CheckUserName(entry, fields[0]);
    if (!ValidHash(fields[1]) || !ValidHash(fields[2])) {
        Refuse("User '" + CmdKit::MessageExcerpt(fields[0]) +
               "': a hash is '-' or 32 or 40 hexadecimal digits as 'system snmp hash' gives it.");
    }
    if (!OneOf(fields[3], {"none", "auth", "priv"})) {
        Refuse("User '" + CmdKit::MessageExcerpt(fields[0]) + "': model '" +
               CmdKit::MessageExcerpt(fields[3]) + "' is not one of none, auth, priv.");
    }
    LocalUser user{fields[0], HashOrEmpty(fields[1]), HashOrEmpty(fields[2]), fields[3]};
    if (user.model != "none" && user.authHash.empty()) {
        Refuse("User '" + CmdKit::MessageExcerpt(user.name) + "': model " + user.model +
               " needs an authentication hash.");
    }
    if (user.model == "priv" && user.privHash.empty()) {
        Refuse("User '" + CmdKit::MessageExcerpt(user.name) +
               "': model priv needs a privacy hash.");
    }
    return user;
}

RemoteUser ParseRemoteUser(const std::string& entry) {
    const auto fields = Split(entry, '/');
    if (fields.size() != 6) {
        Refuse("Remote user '" + CmdKit::MessageExcerpt(entry) +
               "' is not of the form "
               "user/auth-proto/-|auth-hash/priv-proto/-|priv-hash/engine-id.");
    }
    CheckUserName(entry, fields[0]);
    RemoteUser user;
    user.name = fields[0];
    user.authProtocol = fields[1];
    user.privProtocol = fields[3];
    if (!OneOf(user.authProtocol, {"none", "MD5", "SHA1"})) {
        Refuse("Remote user '" + CmdKit::MessageExcerpt(user.name) + "': auth-proto '" +
               CmdKit::MessageExcerpt(user.authProtocol) + "' is not one of none, MD5, SHA1.");
    }
    if (!OneOf(user.privProtocol, {"none", "AES"})) {
        Refuse("Remote user '" + CmdKit::MessageExcerpt(user.name) + "': priv-proto '" +
               CmdKit::MessageExcerpt(user.privProtocol) + "' is not one of none, AES.");
    }
    if (!ValidHash(fields[2]) || !ValidHash(fields[4])) {
        Refuse("Remote user '" + CmdKit::MessageExcerpt(user.name) +
               "': a hash is '-' or 32 or 40 hexadecimal digits as 'system snmp hash' gives it.");
    }
    user.authHash = HashOrEmpty(fields[2]);
    user.privHash = HashOrEmpty(fields[4]);
    const auto engineId = EngineIdHex(fields[5]);
    if (!engineId) {
        Refuse("Remote user '" + CmdKit::MessageExcerpt(user.name) + "': engine-id '" +
               CmdKit::MessageExcerpt(fields[5]) +
               "' must be 10 to 32 hexadecimal digits (an even number), optionally after 0x.");
    }
    user.engineId = *engineId;
    if (user.authProtocol == "none") {
        if (user.privProtocol != "none") {
            Refuse("Remote user '" + CmdKit::MessageExcerpt(user.name) +
                   "': privacy needs an authentication protocol.");
        }
    } else if (user.authHash.empty() ||
               user.authHash.size() != 2 * (user.authProtocol == "MD5" ? 16 : 20)) {
        Refuse("Remote user '" + CmdKit::MessageExcerpt(user.name) + "': auth-proto " +
               user.authProtocol + " needs a " + (user.authProtocol == "MD5" ? "32" : "40") +
               "-digit authentication hash.");
    }
    if (user.privProtocol == "AES" && user.privHash.empty()) {
        Refuse("Remote user '" + CmdKit::MessageExcerpt(user.name) +
               "': priv-proto AES needs a privacy hash.");
    }
    return user;
}

V3Target ParseV3Target(const std::string& entry) {
    const auto fields = Split(entry, '/');
    const auto endpoint = fields.size() == 4 ? ParseEndpoint(fields[0]) : std::nullopt;
    if (!endpoint || fields[1].empty()) {
        Refuse("V3 target '" + CmdKit::MessageExcerpt(entry) +
               "' is not of the form ip-or-hostname[@port]/remote-user/security-level/"
               "trap|inform.");
    }
    if (!OneOf(fields[2], {"none", "auth", "priv"})) {
        Refuse("V3 target '" + CmdKit::MessageExcerpt(entry) + "': security level '" +
               CmdKit::MessageExcerpt(fields[2]) + "' is not one of none, auth, priv.");
    }
    if (!OneOf(fields[3], {"trap", "inform"})) {
        Refuse("V3 target '" + CmdKit::MessageExcerpt(entry) + "': '" +
               CmdKit::MessageExcerpt(fields[3]) + "' is neither trap nor inform.");
    }
    return {*endpoint, fields[1], fields[2], fields[3] == "inform"};
}

std::vector<std::string> CheckCommunities(const std::vector<std::string>& entries) {
    auto communities = NonEmpty(entries);
    CheckCount(communities.size(), kMaxCommunities, "communities");
    for (const auto& community : communities) {
        if (community.size() > kMaxCommunityLength) {
            Refuse("Community '" + CmdKit::MessageExcerpt(community) +
                   "' is longer than 64 characters.");
        }
        if (HasControl(community))
            Refuse("Community '" + CmdKit::MessageExcerpt(community) + "' has control characters.");
    }
    return communities;
}

std::vector<std::string> CheckTargets(const std::vector<std::string>& entries) {
    auto targets = NonEmpty(entries);
    CheckCount(targets.size(), kMaxTargets, "targets");
    for (const auto& target : targets) {
        const auto parsed = ParseV1Target(target);
        if (parsed.community.size() > kMaxCommunityLength) {
            Refuse("Target '" + CmdKit::MessageExcerpt(target) +
                   "': the community is longer than 64 characters.");
        }
    }
    return targets;
}

std::vector<std::string> CheckUsers(const std::vector<std::string>& entries) {
    auto users = NonEmpty(entries);
    CheckCount(users.size(), kMaxUsers, "users");
    std::set<std::string> seen;
    for (const auto& user : users) CheckUnique(seen, ParseLocalUser(user).name, "User");
    return users;
}

std::vector<std::string> CheckRemoteUsers(const std::vector<std::string>& entries) {
    auto users = NonEmpty(entries);
    CheckCount(users.size(), kMaxUsers, "remote users");
    std::set<std::string> seen;
    for (const auto& user : users) CheckUnique(seen, ParseRemoteUser(user).name, "Remote user");
    return users;
}

std::vector<std::string> CheckV3Targets(const std::vector<std::string>& entries) {
    auto targets = NonEmpty(entries);
    CheckCount(targets.size(), kMaxV3Targets, "v3 targets");
    for (const auto& target : targets) ParseV3Target(target);
    return targets;
}

std::optional<std::string> CheckOption(const std::string& key, const std::string& value) {
    auto checkEnum = [&](const char* name, std::initializer_list<std::string_view> allowed) {
        if (!OneOf(value, allowed)) {
            std::vector<std::string> names(allowed.begin(), allowed.end());
            Refuse("Invalid " + std::string(name) + " '" + CmdKit::MessageExcerpt(value) +
                   "': use one of " + Join(names, ", ") + ".");
        }
    };
    if (key == "EventFilter") {
        if (value == "reset") return std::nullopt;
        auto oids = NonEmpty(Split(value, ','));
        for (const auto& oid : oids) {
            const bool digits = std::all_of(oid.begin(), oid.end(), [](char c) {
                return std::isdigit(static_cast<unsigned char>(c)) || c == '.';
            });
            try {
                if (!digits) throw std::invalid_argument(oid);
                Ber::Oid(oid);
            } catch (const std::invalid_argument&) {
                Refuse("Invalid trap oid '" + CmdKit::MessageExcerpt(oid) +
                       "' in notraps: give dotted numbers such as 1.3.6.1.6.3.1.1.5.1.");
            }
        }
        if (oids.empty()) return std::nullopt;
        return Join(oids, ";");
    }
    if (key != "EnvEventSource" && key != "loglevel" && key != "authentication" &&
        key != "privacy" && key != "syslocation" && key != "syscontact" && key != "engineid") {
        Refuse("Unknown option '" + CmdKit::MessageExcerpt(key) + "'.");
    }
    if (value.empty()) return std::nullopt;
    if (key == "EnvEventSource") checkEnum("hwsrc", {"indications", "sensors"});
    if (key == "loglevel") checkEnum("loglevel", {"debug", "info", "warning", "error"});
    if (key == "authentication") checkEnum("authentication protocol", {"none", "MD5", "SHA1"});
    if (key == "privacy") checkEnum("privacy protocol", {"none", "AES128"});
    if (key == "syslocation" || key == "syscontact") {
        if (value.size() > kMaxText) Refuse("Option " + key + " is longer than 255 characters.");
        if (HasControl(value)) Refuse("Option " + key + " must not hold control characters.");
    }
    if (key == "engineid") {
        const auto hex = EngineIdHex(value);
        if (!hex) {
            Refuse("Engine id '" + CmdKit::MessageExcerpt(value) +
                   "' must be 10 to 32 hexadecimal digits, an even number of them.");
        }
        return hex;
    }
    return value;
}

void CheckConsistency(const Settings& settings) {
    auto option = [&](const char* key) {
        const auto found = settings.options.find(key);
        return found == settings.options.end() ? std::string() : found->second;
    };
    const std::string auth = option("authentication");
    if (option("privacy") == "AES128" && auth != "MD5" && auth != "SHA1") {
        Refuse("Privacy protocol AES128 needs authentication MD5 or SHA1: set --authentication.");
    }
    std::map<std::string, RemoteUser> remote;
    for (const auto& entry : settings.remoteUsers) {
        auto user = ParseRemoteUser(entry);
        remote.emplace(user.name, std::move(user));
    }
    for (const auto& entry : settings.v3Targets) {
        const auto target = ParseV3Target(entry);
        const auto user = remote.find(target.user);
        if (user == remote.end()) {
            Refuse("V3 target '" + CmdKit::MessageExcerpt(entry) + "' names remote user '" +
                   CmdKit::MessageExcerpt(target.user) +
                   "', which is not configured: add it with --remote-users.");
        }
        if (target.level != "none" && user->second.authProtocol == "none") {
            Refuse("V3 target '" + CmdKit::MessageExcerpt(entry) + "' asks for " + target.level +
                   ", but remote user '" + CmdKit::MessageExcerpt(target.user) +
                   "' has no authentication protocol.");
        }
        if (target.level == "priv" && user->second.privProtocol == "none") {
            Refuse("V3 target '" + CmdKit::MessageExcerpt(entry) +
                   "' asks for priv, but remote user '" + CmdKit::MessageExcerpt(target.user) +
                   "' has no privacy protocol.");
        }
    }
}

std::optional<Settings> ParseSettings(std::string_view xml) {
    pugi::xml_document document;
    if (!document.load_buffer(xml.data(), xml.size(),
                              pugi::parse_default | pugi::parse_ws_pcdata_single)) {
        return std::nullopt;
    }
    Settings settings = FactoryDefaults();
    const pugi::xml_node root = document.child("snmpAgent");
    if (!root) return settings;
    auto boolean = [&](const char* name, bool& out) {
        const std::string text = Trim(root.child_value(name));
        if (text == "true") out = true;
        if (text == "false") out = false;
    };
    boolean("enable", settings.enabled);
    boolean("largestorage", settings.largeStorage);
    const std::string port = Trim(root.child_value("port"));
    int value = 0;
    const auto [rest, error] = std::from_chars(port.data(), port.data() + port.size(), value);
    if (!port.empty() && error == std::errc() && rest == port.data() + port.size() && value > 0 &&
        value <= 65535) {
        settings.port = value;
    }
    auto list = [&](const char* name, const char* item, std::vector<std::string>& out) {
        if (!root.child(name)) return;
        out.clear();
        for (const auto node : root.child(name).children(item)) out.push_back(node.child_value());
    };
    list("communities", "community", settings.communities);
    list("targets", "target", settings.targets);
    list("users", "user", settings.users);
    list("remoteUsers", "remoteUser", settings.remoteUsers);
    list("v3targets", "v3target", settings.v3Targets);
    if (root.child("options")) {
        settings.options.clear();
        for (const auto node : root.child("options").children("option")) {
            settings.options[node.attribute("key").value()] = node.child_value();
        }
    }
    return settings;
}

std::string FormatSettings(const Settings& settings) {
    pugi::xml_document document;
    auto declaration = document.append_child(pugi::node_declaration);
    declaration.append_attribute("version") = "1.0";
    declaration.append_attribute("encoding") = "UTF-8";
    auto root = document.append_child("snmpAgent");
    root.append_child("enable").text() = settings.enabled ? "true" : "false";
    root.append_child("port").text() = settings.port;
    root.append_child("largestorage").text() = settings.largeStorage ? "true" : "false";
    auto list = [&](const char* name, const char* item, const std::vector<std::string>& values) {
        auto node = root.append_child(name);
        for (const auto& value : values) node.append_child(item).text() = value.c_str();
    };
    list("communities", "community", settings.communities);
    list("targets", "target", settings.targets);
    list("users", "user", settings.users);
    list("remoteUsers", "remoteUser", settings.remoteUsers);
    list("v3targets", "v3target", settings.v3Targets);
    auto options = root.append_child("options");
    for (const auto& [key, value] : settings.options) {
        auto option = options.append_child("option");
        option.append_attribute("key") = key.c_str();
        option.text() = value.c_str();
    }
    std::ostringstream out;
    document.save(out, "  ");
    // The writer leaves a carriage return in text as it is, and any reader turns a raw one into
    // a line feed: write it as a character reference so that the value reads back unchanged.
    std::string text = out.str();
    for (size_t at = text.find('\r'); at != std::string::npos; at = text.find('\r', at)) {
        text.replace(at, 1, "&#13;");
    }
    return text;
}

}  // namespace BrixSim::Snmp

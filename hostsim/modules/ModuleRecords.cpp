// Reading the module tables, and the parameter-string syntax: blank-separated key=value
// pairs, where a value may be quoted to hold blanks.
#include <cctype>
#include <string>
#include <vector>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/core/Store.h"
#include "hostsim/modules/ModuleStore.h"

namespace BrixSim::Modules {

const char kRecordColumns[] =
    "name, file, license, version, build_type, file_version, provides, provides_versions,"
    " package, acceptance, loaded, enabled";

std::unique_ptr<KernCtl::System::ModuleImpl::Record> ReadRecord(const Stmt& row) {
    auto record = std::make_unique<KernCtl::System::ModuleImpl::Record>();
    record->name = row.Text(0);
    record->file = row.Text(1);
    record->license = row.Text(2);
    record->version = row.Text(3);
    record->buildType = row.Text(4);
    record->fileVersion = row.Text(5);
    record->provides = row.Text(6);
    record->providesVersions = row.Text(7);
    record->package = row.Text(8);
    record->acceptance = row.Text(9);
    record->loaded = row.Int(10) != 0;
    record->enabled = row.Int(11) != 0;
    return record;
}

bool IsModule(Store& store, const std::string& name) {
    auto row = store.Prepare("SELECT 1 FROM modules WHERE name = ?");
    row.Bind(1, name);
    return row.Step();
}

std::optional<std::string> Resolve(Store& store, const std::string& name) {
    if (IsModule(store, name)) return name;
    auto row = store.Prepare("SELECT module FROM module_aliases WHERE alias = ?");
    row.Bind(1, name);
    if (row.Step()) return row.Text(0);
    return std::nullopt;
}

std::vector<std::string> SplitVersions(const std::string& commaSeparated) {
    std::vector<std::string> versions;
    std::string::size_type start = 0;
    while (start < commaSeparated.size()) {
        auto end = commaSeparated.find(',', start);
        if (end == std::string::npos) end = commaSeparated.size();
        if (end > start) versions.push_back(commaSeparated.substr(start, end - start));
        start = end + 1;
    }
    return versions;
}

std::vector<ParameterPair> ParseParameters(const std::string& text) {
    std::vector<ParameterPair> pairs;
    const auto isBlank = [](char c) { return std::isspace(static_cast<unsigned char>(c)) != 0; };
    std::string::size_type i = 0;
    while (i < text.size()) {
        if (isBlank(text[i])) {
            ++i;
            continue;
        }
        ParameterPair pair;
        const auto start = i;
        while (i < text.size() && !isBlank(text[i]) && text[i] != '=') ++i;
        pair.key = text.substr(start, i - start);
        if (pair.key.empty() || pair.key.find('"') != std::string::npos) {
            throw HostCtl::Lib::HostCtlException("Invalid parameter string '" +
                                                 CmdKit::MessageExcerpt(text) +
                                                 "': a parameter needs a name");
        }
        if (i < text.size() && text[i] == '=') {
            pair.hasValue = true;
            const auto valueStart = ++i;
            if (i < text.size() && text[i] == '"') {
                const auto close = text.find('"', i + 1);
                if (close == std::string::npos) {
                    throw HostCtl::Lib::HostCtlException("Invalid parameter string '" +
                                                         CmdKit::MessageExcerpt(text) +
                                                         "': unterminated quote");
                }
                i = close + 1;
                if (i < text.size() && !isBlank(text[i])) {
                    throw HostCtl::Lib::HostCtlException(
                        "Invalid parameter string '" + CmdKit::MessageExcerpt(text) +
                        "': a quoted value must be followed by a blank");
                }
            } else {
                while (i < text.size() && !isBlank(text[i])) ++i;
            }
            pair.raw = text.substr(valueStart, i - valueStart);
        }
        pairs.push_back(std::move(pair));
    }
    return pairs;
}

std::string JoinParameters(const std::vector<ParameterPair>& pairs) {
    std::string text;
    for (const auto& pair : pairs) {
        if (!text.empty()) text += ' ';
        text += pair.key;
        if (pair.hasValue) text += '=' + pair.raw;
    }
    return text;
}

std::string Unquote(const std::string& raw) {
    if (raw.size() >= 2 && raw.front() == '"' && raw.back() == '"') {
        return raw.substr(1, raw.size() - 2);
    }
    return raw;
}

}  // namespace BrixSim::Modules

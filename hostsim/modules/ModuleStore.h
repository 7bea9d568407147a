// The simulated kernel's module tables, shared by the module, parameter and log-level adapters.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "kernctl/Module.h"

namespace BrixSim {
class Store;
class Stmt;
}  // namespace BrixSim

namespace KernCtl::System {

struct ModuleImpl::Record {
    std::string name;
    std::string file;
    std::string license;
    std::string version;
    std::string buildType;
    std::string fileVersion;
    std::string provides;
    std::string providesVersions;  // comma-separated, may be empty
    std::string package;
    std::string acceptance;
    bool loaded = false;
    bool enabled = false;
};

}  // namespace KernCtl::System

namespace BrixSim::Modules {

// The columns a Record is read from, in Record's order.
extern const char kRecordColumns[];
std::unique_ptr<KernCtl::System::ModuleImpl::Record> ReadRecord(const Stmt& row);

// The module a name stands for: the module of that name, or the module an alias names.
std::optional<std::string> Resolve(Store& store, const std::string& name);
bool IsModule(Store& store, const std::string& name);

std::vector<std::string> SplitVersions(const std::string& commaSeparated);

// A parameter string as key / raw-value pairs, in order. A value keeps its quotes; a key
// without "=" has an empty raw value. Throws HostCtl::Lib::HostCtlException on bad syntax.
struct ParameterPair {
    std::string key;
    std::string raw;
    bool hasValue = false;
};
std::vector<ParameterPair> ParseParameters(const std::string& text);
std::string JoinParameters(const std::vector<ParameterPair>& pairs);
// The value of a raw token without its quotes.
std::string Unquote(const std::string& raw);

}  // namespace BrixSim::Modules

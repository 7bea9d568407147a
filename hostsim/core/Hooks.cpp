// Registries filled by every area at static initialisation. Each lives in a function-local
// static so that registrations from other translation units work whatever their order.
#include <set>
#include <stdexcept>

#include "hostsim/core/Registry.h"

namespace BrixSim {

namespace {

std::vector<TableSet>& Tables() {
    static std::vector<TableSet> tables;
    return tables;
}

std::map<uint32_t, SysinfoNode>& SysinfoNodes() {
    static std::map<uint32_t, SysinfoNode> nodes;
    return nodes;
}

std::map<std::string, FileSystemType>& FileSystemTypes() {
    static std::map<std::string, FileSystemType> types;
    return types;
}

std::map<std::string, std::function<int()>>& HeldFiles() {
    static std::map<std::string, std::function<int()>> files;
    return files;
}

std::vector<std::function<void(Store&)>>& BootSteps() {
    static std::vector<std::function<void(Store&)>> steps;
    return steps;
}

std::map<std::string, ScaleKey>& ScaleKeys() {
    static std::map<std::string, ScaleKey> keys;
    return keys;
}

}  // namespace

bool RegisterTables(TableSet tables) {
    for (const auto& existing : Tables()) {
        if (existing.name == tables.name) {
            throw std::logic_error("table set registered twice: " + tables.name);
        }
    }
    Tables().push_back(std::move(tables));
    return true;
}

bool RegisterSysinfoNode(uint32_t node, SysinfoNode handler) {
    SysinfoNodes()[node] = std::move(handler);
    return true;
}

bool RegisterFileSystemType(const std::string& fstype, FileSystemType handler) {
    FileSystemTypes()[fstype] = std::move(handler);
    return true;
}

bool RegisterHeldFile(const std::string& hostPath, std::function<int()> unlink) {
    HeldFiles()[hostPath] = std::move(unlink);
    return true;
}

const std::function<int()>* FindHeldFile(const std::string& hostPath) {
    const auto found = HeldFiles().find(hostPath);
    return found == HeldFiles().end() ? nullptr : &found->second;
}

bool RegisterBootStep(std::function<void(Store&)> step) {
    BootSteps().push_back(std::move(step));
    return true;
}

bool RegisterScaleKey(const std::string& key, ScaleKey handler) {
    if (!ScaleKeys().emplace(key, std::move(handler)).second) {
        throw std::logic_error("scale key registered twice: " + key);
    }
    return true;
}

const std::map<std::string, ScaleKey>& RegisteredScaleKeys() {
    return ScaleKeys();
}

void RunBootSteps(Store& store) {
    for (const auto& step : BootSteps()) step(store);
}

const std::vector<TableSet>& RegisteredTables() {
    return Tables();
}

const std::map<uint32_t, SysinfoNode>& RegisteredSysinfoNodes() {
    return SysinfoNodes();
}

const std::map<std::string, FileSystemType>& RegisteredFileSystemTypes() {
    return FileSystemTypes();
}

}  // namespace BrixSim

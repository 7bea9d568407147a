#include "hostsim/core/Operation.h"

#include <cstdio>
#include <cstdlib>
#include <map>
#include <stdexcept>

namespace BrixSim {

namespace {

// A function-local static, so that definitions in other translation units register whatever
// their order of initialisation.
std::map<std::string_view, const Operation*>& Registry() {
    static std::map<std::string_view, const Operation*> operations;
    return operations;
}

}  // namespace

Operation::Operation(const char* qualifiedName) : name_(qualifiedName) {
    if (!Registry().emplace(name_, this).second) {
        std::fprintf(stderr, "simulated host: operation %s is defined twice\n", name_);
        std::abort();
    }
}

const Operation& Operation::Named(std::string_view qualifiedName) {
    const auto found = Registry().find(qualifiedName);
    if (found == Registry().end()) {
        throw std::logic_error("simulated host: no operation " + std::string(qualifiedName) +
                               " is defined");
    }
    return *found->second;
}

std::vector<std::string> Operation::All() {
    std::vector<std::string> names;
    for (const auto& [name, operation] : Registry()) names.emplace_back(name);
    return names;
}

}  // namespace BrixSim

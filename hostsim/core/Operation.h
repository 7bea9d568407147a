// A platform operation the simulated host offers: what a fault can be armed on and what the
// journal records a call of. Its qualified name is written once, where the operation is defined
// (`const BrixSim::Operation kCommit{"HostCtl::...::Commit"};`), and that definition registers
// it; Store::Check and Store::JournalCall take the operation, so a misspelt one does not build.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace BrixSim {

class Operation {
  public:
    // Registers the operation at static initialisation; a name defined twice ends the program
    // at start-up (every test then fails at once).
    explicit Operation(const char* qualifiedName);
    Operation(const Operation&) = delete;
    Operation& operator=(const Operation&) = delete;

    const char* Name() const { return name_; }

    // The operation of a name composed at run time (an adapter shared by several classes).
    // Throws std::logic_error when no operation of that name is defined.
    static const Operation& Named(std::string_view qualifiedName);
    // Every operation, sorted by name, for `brixsim fault ops`.
    static std::vector<std::string> All();

  private:
    const char* name_;
};

}  // namespace BrixSim

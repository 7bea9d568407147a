// Test helpers: a fresh simulated host per test, and running the built programs against it.
#pragma once

#include <filesystem>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace BrixTest {

struct RunResult {
    int status = -1;  // exit status
    std::string out;  // standard output
    std::string err;  // standard error
};

// A new host root in a temporary folder, seeded on first use. While it lives, BRIX_HOST_ROOT
// names it and BRIXSIM_SLEEP_SCALE is 0, for this process and the programs it runs; the
// in-process store is reopened on it.
class TempHost {
  public:
    TempHost();
    ~TempHost();
    TempHost(const TempHost&) = delete;
    TempHost& operator=(const TempHost&) = delete;

    const std::filesystem::path& Root() const { return root_; }

    // Runs build/bin/brixcli with these words, e.g. {"system", "uuid", "get"}.
    RunResult Cli(const std::vector<std::string>& args, const std::string& input = "") const;
    // Runs build/bin/brixsim with these words.
    RunResult Sim(const std::vector<std::string>& args) const;
    // The journal records, oldest first.
    std::vector<nlohmann::json> Journal() const;
    // Arms a fault: `brixsim fault set OPERATION MESSAGE`.
    void Fault(const std::string& operation, const std::string& message) const;
    // Arms a fault for `times` calls (0: until cleared), with a detail text when not empty.
    void Fault(const std::string& operation, const std::string& message, int times,
               const std::string& detail = "") const;
    // Disarms every fault.
    void ClearFaults() const;
    // Merges `patch` into the exported state and imports it (tables replaced as given).
    void Import(const nlohmann::json& state) const;
    nlohmann::json Export() const;

  private:
    std::filesystem::path root_;
    // The environment this host replaced, restored when it goes.
    std::string oldRoot_, oldScale_;
    bool hadRoot_ = false, hadScale_ = false;
};

// Runs a program with arguments, capturing its output.
RunResult Run(const std::vector<std::string>& argv, const std::string& input = "");

}  // namespace BrixTest

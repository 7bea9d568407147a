// Helpers of the whole-process robustness tests: scaled iteration counts, programs started in
// the background and killed, host roots copied as templates.
#pragma once

#include <sys/types.h>

#include <chrono>
#include <filesystem>
#include <string>
#include <vector>

namespace BrixRobust {

// A positive count from the environment variable `name`, else `fallback`; lets a developer
// shorten the long loops (for example BRIX_ROBUST_KILLS=30).
int EnvCount(const char* name, int fallback);

// The path of a built program, e.g. Program("brixcli").
std::string Program(const std::string& name);

// Starts argv in the background with its standard streams on /dev/null.
pid_t Spawn(const std::vector<std::string>& argv);

// Waits for a child; true when it exited by itself (status in `exitCode`), false when a signal
// ended it (signal number in `exitCode`).
bool Reap(pid_t pid, int& exitCode);

// What became of a process that was to be killed.
struct KillOutcome {
    bool killed = false;  // SIGKILL ended it
    int exitCode = -1;    // its exit status when it finished first
};

// Sleeps `delay`, sends SIGKILL to `pid` and reaps it.
KillOutcome KillAfter(pid_t pid, std::chrono::microseconds delay);

// Copies a host root, keeping sparse files sparse (the seeded dump files are large and empty).
void CopyTree(const std::filesystem::path& from, const std::filesystem::path& to);

// Replaces the contents of `root` by a copy of `templateRoot`.
void ResetRoot(const std::filesystem::path& root, const std::filesystem::path& templateRoot);

// Splits a command line on blanks; words in single quotes keep their blanks.
std::vector<std::string> Words(const std::string& line);

}  // namespace BrixRobust

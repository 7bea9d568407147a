// Where the tests' build and source trees are: the tests run from build/bin, and the rest is read
// from the build's CMake cache. Nothing here is compiled in, so a test object is the same in any
// checkout and a compiler cache serves every clone.
#pragma once

#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>

namespace BrixTest {

// The folder of the programs, the test programs among them.
inline std::filesystem::path BinDir() {
    return std::filesystem::read_symlink("/proc/self/exe").parent_path();
}

// The build folder: the parent of build/bin.
inline std::filesystem::path BuildDir() {
    return BinDir().parent_path();
}

// A value of the build's CMake cache, e.g. "CMAKE_HOME_DIRECTORY"; empty when it is not there.
inline std::string CacheValue(const std::string& name) {
    std::ifstream cache(BuildDir() / "CMakeCache.txt");
    if (!cache) throw std::runtime_error("no CMakeCache.txt in " + BuildDir().string());
    for (std::string line; std::getline(cache, line);) {
        if (line.rfind(name + ":", 0) != 0) continue;
        const auto equals = line.find('=');
        if (equals != std::string::npos) return line.substr(equals + 1);
    }
    return "";
}

inline std::filesystem::path SourceDir() {
    return CacheValue("CMAKE_HOME_DIRECTORY");
}

}  // namespace BrixTest

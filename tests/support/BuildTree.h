// Where the tests' build and source trees are, read from the build's CMake cache.
#pragma once

#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>

namespace BrixTest {

// The build folder: the parent of build/bin.
inline std::filesystem::path BuildDir() {
    return std::filesystem::path(BRIX_BIN_DIR).parent_path();
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

// Helpers shared by the fuzz targets: a failed expectation, words from bytes, a temporary host.
#pragma once

#include <stdlib.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <string>
#include <string_view>
#include <system_error>
#include <vector>

namespace BrixFuzz {

// A broken invariant is a finding like a crash: say which, then abort so libFuzzer keeps the
// input.
[[noreturn]] inline void Fail(const char* what, const std::string& detail = {}) {
    std::fprintf(stderr, "fuzz check failed: %s%s%s\n", what, detail.empty() ? "" : ": ",
                 detail.c_str());
    std::abort();
}

#define BRIX_FUZZ_CHECK(condition, detail)                        \
    do {                                                          \
        if (!(condition)) ::BrixFuzz::Fail(#condition, (detail)); \
    } while (false)

// Whether `text` is well-formed UTF-8: the strict JSON encoder refuses anything else.
inline bool ValidUtf8(const std::string& text) {
    try {
        (void)nlohmann::json(text).dump();
        return true;
    } catch (const nlohmann::json::type_error&) {
        return false;
    }
}

inline std::string_view Text(const uint8_t* data, size_t size) {
    return {reinterpret_cast<const char*>(data), size};
}

// Words separated by a newline or a NUL byte, as a command line's arguments; a separator at the
// very end closes the last word rather than starting an empty one.
inline std::vector<std::string> Words(std::string_view text) {
    std::vector<std::string> words;
    size_t start = 0;
    while (start < text.size()) {
        size_t end = text.find_first_of(std::string_view("\n\0", 2), start);
        if (end == std::string_view::npos) end = text.size();
        words.emplace_back(text.substr(start, end - start));
        start = end + 1;
    }
    return words;
}

// A host root in a fresh temporary folder ($TMPDIR, else /tmp), named by BRIX_HOST_ROOT for the
// whole run and removed when the process exits normally. Commands and the store's clock sleep
// run at once.
inline const std::filesystem::path& TemporaryHostRoot() {
    static const std::filesystem::path root = [] {
        const char* tmp = std::getenv("TMPDIR");
        std::string pattern = std::string(tmp && *tmp ? tmp : "/tmp") + "/brixfuzz-XXXXXX";
        if (!mkdtemp(pattern.data())) {
            std::perror("brixfuzz: cannot make a temporary host root");
            std::exit(1);
        }
        setenv("BRIX_HOST_ROOT", pattern.c_str(), 1);
        setenv("BRIXSIM_SLEEP_SCALE", "0", 1);
        std::atexit([] {
            std::error_code ignored;
            std::filesystem::remove_all(std::getenv("BRIX_HOST_ROOT"), ignored);
        });
        return std::filesystem::path(pattern);
    }();
    return root;
}

}  // namespace BrixFuzz

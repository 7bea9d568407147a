// The layers stay one-way: every include of a layer's sources resolves inside what that layer may
// see. The plug-in sees the platform declarations and the framework, never the simulated host; the
// platform declarations see only themselves; the framework sees neither the plug-in nor the host.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <optional>
#include <regex>
#include <string>
#include <vector>

#include "support/BuildTree.h"

namespace fs = std::filesystem;

namespace {

struct Layer {
    const char* folder;
    // Folders (relative to the source tree) an include of this layer may resolve into.
    std::vector<std::string> allowed;
    // Third-party headers this layer must not include: they belong to another layer.
    std::vector<std::string> forbiddenSystemHeaders;
};

const std::vector<Layer>& Layers() {
    static const std::vector<Layer> layers = {
        {"platform", {"platform"}, {"sqlite3.h"}},
        {"cmdkit", {"cmdkit", "platform/cmdkit", "oskit"}, {"sqlite3.h"}},
        {"src", {"src", "platform", "include"}, {"sqlite3.h", "pugixml.hpp"}},
        {"hostsim", {"hostsim", "platform", "oskit"}, {}},
    };
    return layers;
}

// Where the compiler could find a quoted include: the including file's folder first, then every
// include root of the project. The first hit is the one that counts.
std::optional<fs::path> Resolve(const fs::path& source, const Layer& layer, const fs::path& file,
                                const std::string& include) {
    std::vector<fs::path> roots = {file.parent_path(), source / layer.folder};
    for (const char* root : {"src", "platform", "include", ""}) {
        roots.push_back(source / root);
    }
    for (const auto& root : roots) {
        const auto candidate = (root / include).lexically_normal();
        if (fs::is_regular_file(candidate)) return candidate;
    }
    return std::nullopt;
}

bool Under(const fs::path& path, const fs::path& folder) {
    const auto relative = path.lexically_relative(folder);
    return !relative.empty() && *relative.begin() != "..";
}

TEST(Layering, EveryIncludeStaysInsideWhatItsLayerMaySee) {
    const fs::path source = BrixTest::SourceDir();
    ASSERT_TRUE(fs::is_directory(source / "src")) << source;
    static const std::regex includeLine(R"(^\s*#\s*include\s*([<"])([^>"]+)[>"])");
    std::vector<std::string> violations;
    size_t checked = 0;
    for (const auto& layer : Layers()) {
        for (const auto& entry : fs::recursive_directory_iterator(source / layer.folder)) {
            const auto extension = entry.path().extension();
            if (!entry.is_regular_file() || (extension != ".h" && extension != ".cpp")) continue;
            std::ifstream in(entry.path());
            int lineNumber = 0;
            for (std::string line; std::getline(in, line);) {
                ++lineNumber;
                std::smatch match;
                if (!std::regex_search(line, match, includeLine)) continue;
                ++checked;
                const std::string where = entry.path().lexically_relative(source).string() + ":" +
                                          std::to_string(lineNumber) + ": " + match[2].str();
                if (match[1] == "<") {
                    for (const auto& header : layer.forbiddenSystemHeaders) {
                        if (match[2] == header) violations.push_back(where);
                    }
                    continue;
                }
                const auto resolved = Resolve(source, layer, entry.path(), match[2]);
                if (!resolved) continue;  // generated in the build tree
                bool allowed = false;
                for (const auto& folder : layer.allowed)
                    allowed |= Under(*resolved, source / folder);
                if (!allowed) {
                    violations.push_back(where + " -> " +
                                         resolved->lexically_relative(source).string());
                }
            }
        }
    }
    EXPECT_GT(checked, 500u);
    for (const auto& violation : violations) ADD_FAILURE() << violation;
}

}  // namespace

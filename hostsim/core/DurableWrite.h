// The one way the simulated host writes a file: whole or not at all, surviving a crash, and never
// through a link planted in the folder.
#pragma once

#include <sys/types.h>

#include <filesystem>
#include <string_view>

namespace BrixSim {

enum class Publish {
    Replace,  // the file takes the place of whatever `target` was (rename)
    Create,   // `target` must not exist yet (link); EEXIST otherwise
};

// Writes `content` to a new temporary file beside `target` (an unpredictable name, created
// exclusively and without following links), gives it `mode`, syncs it, publishes it under
// `target` and syncs the folder. A `size` beyond the content leaves the rest as a hole (sparse
// files). On any failure the temporary file is removed, `target` is as it was, and a
// std::system_error names the step and the path.
void WriteDurably(const std::filesystem::path& target, std::string_view content, mode_t mode,
                  Publish how = Publish::Replace, off_t size = -1);

}  // namespace BrixSim

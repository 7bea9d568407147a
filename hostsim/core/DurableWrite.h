// The one way the simulated host writes a file: whole or not at all, surviving a crash, and never
// through a link planted in the folder.
#pragma once

#include <sys/types.h>

#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

#include "hostsim/core/Fd.h"

namespace BrixSim {

enum class Publish {
    Replace,  // the file takes the place of whatever `target` was (rename)
    Create,   // `target` must not exist yet (link): EEXIST otherwise
};

// A new version of `target`, written in full to a temporary file beside it: an unpredictable
// name, created exclusively (a planted link is never followed), given `mode` and synced. A
// `size` beyond the content leaves the rest a hole (sparse files). Publish() puts it in place
// and syncs the folder; dropped unpublished, the temporary file is removed. Failures throw a
// std::system_error that names the step and the path; `target` is then as it was.
// Bytes at an offset of a file; the gaps between extents are holes.
struct Extent {
    off_t offset = 0;
    std::string data;
};

class StagedFile {
  public:
    StagedFile(const std::filesystem::path& target, std::string_view content, mode_t mode,
               off_t size = -1);
    StagedFile(const std::filesystem::path& target, const std::vector<Extent>& extents, mode_t mode,
               off_t size);
    ~StagedFile();
    StagedFile(const StagedFile&) = delete;
    StagedFile& operator=(const StagedFile&) = delete;

    void Publish(BrixSim::Publish how = BrixSim::Publish::Replace);

  private:
    std::filesystem::path target_;
    std::filesystem::path temp_;
    bool published_ = false;
};

// Stages and publishes at once.
void WriteDurably(const std::filesystem::path& target, std::string_view content, mode_t mode,
                  Publish how = Publish::Replace, off_t size = -1);

// Removes the temporary files of `target` that writers killed before publishing left behind.
// Call only while holding what keeps other writers of `target` out.
void RemoveStaleTemporaries(const std::filesystem::path& target);

}  // namespace BrixSim

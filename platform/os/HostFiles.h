// Host files read by the commands themselves (secret files given by path): the name under which
// this process opens a file of the managed host.
#pragma once

#include <string>

namespace HostOs {

// The name to open for the host file `path` (on the host itself, `path` unchanged). Empty, with
// errno set to EACCES, when `path` lies outside the host's file tree.
std::string HostFileName(const std::string& path);

}  // namespace HostOs

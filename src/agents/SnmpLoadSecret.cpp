#include "agents/SnmpLoadSecret.h"

#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/trim.hpp>
#include <cerrno>
#include <cstring>
#include <fstream>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "os/HostFiles.h"

namespace OstrelCli::System {

std::string LoadSecret(const std::string& name) {
    if (name.empty()) return std::string();
    std::string line;
    try {
        const std::string path = HostOs::HostFileName(name);
        std::ifstream file;
        file.exceptions(std::ifstream::failbit | std::ifstream::badbit);
        if (path.empty()) throw std::ios_base::failure("outside the host's files");
        errno = 0;
        file.open(path);
        std::getline(file, line);
    } catch (const std::ios_base::failure&) {
        const int error = errno;
        throw HostCtl::Lib::HostCtlException("File name '" + CmdKit::MessageExcerpt(name) +
                                             "' could not be read, " + std::strerror(error));
    }
    boost::trim_left_if(line, boost::is_space());
    boost::trim_right_if(line, boost::is_space());
    return line;
}

}  // namespace OstrelCli::System

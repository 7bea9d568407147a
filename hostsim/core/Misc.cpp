// The host interfaces' string tokenizer.
#include "hostctl/Misc.h"

#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/split.hpp>
#include <string>
#include <vector>

#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"

namespace {

const BrixSim::Operation kStringTokenize{"HostCtl::Misc::StringTokenize"};

}

namespace HostCtl::Misc {

std::vector<std::string> StringTokenize(const std::string& text, const std::string& delimiters) {
    BrixSim::Store::Get().Check(kStringTokenize);
    std::vector<std::string> pieces;
    boost::algorithm::split(pieces, text, boost::algorithm::is_any_of(delimiters),
                            boost::algorithm::token_compress_on);
    std::erase_if(pieces, [](const std::string& piece) { return piece.empty(); });
    return pieces;
}

}  // namespace HostCtl::Misc

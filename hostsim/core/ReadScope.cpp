// A platform read scope is a hold on the store's read transaction.
#include "hostctl/ReadScope.h"

#include "hostsim/core/Store.h"

namespace HostCtl::Lib {

struct ReadScope::State {
    BrixSim::Store::ReadHold hold{BrixSim::Store::Get()};
};

ReadScope::ReadScope() : state_(std::make_unique<State>()) {}
ReadScope::~ReadScope() = default;

}  // namespace HostCtl::Lib

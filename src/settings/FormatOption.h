#pragma once

#include "frame/CommandKit.h"

namespace HostCtl::Adv {
class AdvancedOption;
class AdvancedOptionBranch;
}  // namespace HostCtl::Adv

namespace OstrelCli::System {

// A SettingsAdvancedOption row for `option`. `include` is set to whether the row belongs in a
// listing: with `delta`, only options whose value differs from their default do.
std::shared_ptr<MetaObj::MetaStruct> FormatOption(HostCtl::Adv::AdvancedOption& option, bool delta,
                                                  bool& include);

// Hands the rows of the subtree at `branch` to `row`, pre-order: a branch's own options before
// its sub-branches. An option or sub-branch that fails to read is skipped.
void FormatBranch(HostCtl::Adv::AdvancedOptionBranch& branch, const RowCallback& row, bool delta);

}  // namespace OstrelCli::System

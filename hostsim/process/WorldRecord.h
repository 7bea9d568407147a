// The kernel's world record (node KSI_NODE_system_worlds_info), shared by the kernel side that
// publishes it and the resource library that reads it. Packed, little-endian.
#pragma once

#include <cstddef>

namespace BrixSim::WorldRecord {

constexpr size_t kId = 0;
constexpr size_t kCartelId = 4;
constexpr size_t kParentCartelId = 8;
constexpr size_t kWorldGroupId = 12;
constexpr size_t kCartelGroupId = 16;
constexpr size_t kSessionId = 20;
constexpr size_t kFlags = 24;
constexpr size_t kState = 28;   // one byte
constexpr size_t kType = 29;    // one byte
constexpr size_t kDomain = 30;  // unaligned
constexpr size_t kName = 34;
constexpr size_t kNameWidth = 64;
constexpr size_t kCommandLine = 98;
constexpr size_t kCommandLineWidth = 512;
constexpr size_t kSize = 610;

}  // namespace BrixSim::WorldRecord

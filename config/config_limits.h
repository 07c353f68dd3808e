#pragma once
// Limits that keep hostile or broken configuration text from building an
// absurd tree, shared by the file grammar and the path lookups.

#include <cstddef>

namespace config {

// Every node's name holds its whole key, so long keys multiply memory. The
// limit admits every key the tool writes itself: the register file's longest
// is the block name followed by kLongestRegisterSuffix, and the block name is
// held to kMaxBlockNameLength.
constexpr std::size_t kMaxKeyLength = 1024;
constexpr std::size_t kLongestRegisterSuffix = sizeof(".ctrlPoints[255].controlPointGR[9][9]") - 1;
constexpr std::size_t kMaxBlockNameLength = kMaxKeyLength - kLongestRegisterSuffix;

} // namespace config

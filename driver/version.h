#pragma once

#include <string>

namespace driver {

namespace lscversion {

inline constexpr char kShortName[] = "lsc";
inline constexpr int kMajor = 3, kMinor = 8, kPatch = 1;

// "3.8.1"
std::string versionText();
// "lsc version 3.8.1"
std::string versionLine();

} // namespace lscversion

} // namespace driver

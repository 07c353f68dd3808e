#pragma once
// Texts of the configuration subsystem, exactly as operators and station
// scripts see them.

namespace config::msg {

// Configuration tree
inline constexpr char kNoneHasNoValue[] = "None node does not have a value";
inline constexpr char kNotInitializedPrefix[] = "Parameter ";
inline constexpr char kNotInitializedSuffix[] = " not initialized";
inline constexpr char kIndexTooLargePrefix[] = "Index ";
inline constexpr char kIndexTooLargeMiddle[] = " of ";
inline constexpr char kIndexTooLargeSuffix[] = " is too large, the largest allowed index is 65535.";
inline constexpr char kBadPathPrefix[] = "Invalid configuration path: ";

} // namespace config::msg

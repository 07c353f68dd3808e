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

// Configuration file
inline constexpr char kCannotOpenConfig[] = "Unable to open configuration file.";
inline constexpr char kConfigTooLarge[] = "Configuration file is larger than 64 MiB.";
inline constexpr char kParseStopped[] = "Failed to parse configuration file parameters.";
inline constexpr char kStoppedAt[] = "Stopped at: ";
inline constexpr char kParseExpecting[] = "Failed to parse configuration file parameters, expecting ";
inline constexpr char kKeyTooLong[] =
    "Failed to parse configuration file parameters, key longer than 256 characters:";
inline constexpr char kKeyIndexTooLarge[] =
    "Failed to parse configuration file parameters, index larger than 65535:";
inline constexpr char kTooManyEntries[] =
    "Failed to parse configuration file parameters, more than 262144 new entries:";

} // namespace config::msg

#pragma once
// Reads calibration values out of configuration nodes for fields of a fixed
// width, refusing what the field cannot hold instead of cutting it down.
// Missing nodes raise the configuration tree's own errors; values are named
// in messages by their path below the "config" node.

#include <cstdint>
#include <string>
#include <vector>

#include "config/config_node.h"

namespace blob {

// A whole decimal number (optional sign) within [low, high]. Throws
// std::runtime_error "Value for <path> is not a whole number." or
// "... does not fit in the binary calibration data, value must be between
// <low> and <high>.".
std::int64_t fieldValue(const config::config_node& config, const config::config_node& node,
                        std::int64_t low, std::int64_t high);

// The child `name` (or `index`) of `parent`; throws std::runtime_error
// "Missing value for <path>." when the calibration data do not hold it, so
// the operator learns which entry is missing.
const config::config_node& requiredChild(const config::config_node& config,
                                         const config::config_node& parent,
                                         const std::string& name);
const config::config_node& requiredChild(const config::config_node& config,
                                         const config::config_node& parent, std::size_t index);

// The text without one pair of surrounding double quotes: the register file
// quotes a value that is empty or not a plain token.
std::string unquoted(const std::string& text);

// A serial number text (optionally quoted) as bytes, two hexadecimal digits
// a byte. Throws std::runtime_error for an odd length, other characters or
// more bytes than the tracking block holds.
std::vector<std::uint8_t> serialBytes(const config::config_node& config,
                                      const config::config_node& node);

// The posture character: the one between single quotes ('H', as the
// configuration parser keeps it), or a text of that one character. Throws
// std::runtime_error for an empty or longer text.
char postureCharacter(const config::config_node& config, const config::config_node& node);

} // namespace blob

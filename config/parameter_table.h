#pragma once
// The settings the program knows: their defaults, their allowed ranges, and
// the values derived from them for the output writers.

#include <cstdint>
#include <string>

#include "config/config_node.h"

namespace config {

// Writes every default (marked as default) under the "config" node.
void set_defaults(config_node& config);

// Checks every known setting under the "config" node; throws on the first
// failure (std::range_error for a value out of range, the conversion errors of
// the getters for a value that is not a number).
void validate(const config_node& config);

// Throw std::range_error naming the parameter (relative to `config`) when its
// value lies outside low..high. A float that is not finite lies outside every
// range: -inf is too low, +inf and nan are too high.
void check_int_range(const config_node& config, const config_node& parameter, int low, int high);
void check_float_range(const config_node& config, const config_node& parameter, float low,
                       float high);

// "<block_name>." or, with shared.block_num_flag, "<block_name>[<block_num>].".
std::string block_prefix(const config_node& root);

// Seconds since 1970-01-01 00:00 UTC of a "YYYY-MM-DDTHH:MM" text, whatever the
// machine's time zone. Throws std::invalid_argument for any other text.
std::int64_t config_date_seconds(const std::string& text);

} // namespace config

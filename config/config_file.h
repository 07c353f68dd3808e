#pragma once
// Reading configuration text (settings such as `lsc.sampling_factor = 8;`)
// into the configuration tree. Every accepted setting is stored under the
// given "config" node; settings applied before an error stay there.

#include <string>
#include <string_view>

#include "config/config_node.h"

namespace config {

// Reads the whole file and parses it. Throws std::invalid_argument when the
// file cannot be read, std::runtime_error when its text does not parse; both
// carry an ErrorDetail (image/error_detail.h): the path and the system's
// reason, or the file and line of the parse error.
void read_config_file(const std::string& path, config_node& config);

// The whole text of a configuration file, unparsed (errors as read_config_file).
std::string read_config_text(const std::string& path);

// Parses configuration text held in memory (errors as read_config_file; the
// detail names `sourceName`, when given, before the line).
void parse_config_text(std::string_view text, config_node& config,
                       const std::string& sourceName = std::string());

} // namespace config

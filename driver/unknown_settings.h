#pragma once
// Keys of the configuration that the tool does not know: kept and ignored,
// as always, but most often a typing slip that silently leaves a setting at
// its default. Each gets a warning, with the nearest known key when one is
// close.

#include <string>
#include <vector>

#include "config/config_node.h"

namespace driver {

// One text per unknown key, in the configuration's print order:
// "Unknown configuration key proc.min_pixle_val (ignored); did you mean
// proc.min_pixel_val?". Known are the parameter table's keys, the register
// file's keys (under `blockName` and global.configType/configVersion) and the
// autofocus data (module.*).
std::vector<std::string> unknownSettingWarnings(const config::config_node_impl& config,
                                                const std::string& blockName);

// Levenshtein distance (insertions, deletions and substitutions of one byte).
std::size_t editDistance(const std::string& a, const std::string& b);

} // namespace driver

#pragma once

#include <string>
#include <utility>
#include <vector>

#include "config/config_node.h"

namespace driver {

// Every setting below the "config" node whose value differs from the
// parameter table's default (or that the table does not know), as (path
// relative to "config", value), in the order the tree prints them. A value
// given in the file that equals its default, as number or as text, is left out.
std::vector<std::pair<std::string, std::string>>
changedSettings(const config::config_node_impl& config);

} // namespace driver

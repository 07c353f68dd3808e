#pragma once

#include "config/config_node.h"

#include <string>
#include <utility>
#include <vector>

// Every setting below the "config" node whose value came from a file rather
// than the parameter table, as (path relative to "config", value), in the
// order the tree prints them.
std::vector<std::pair<std::string, std::string>> changedSettings(const config_node_impl& config);

#include "driver/unknown_settings.h"

#include <algorithm>

#include "config/parameter_table.h"

namespace driver {

using config::config_node_impl;
using config::config_relative_path;
using config::set_defaults;

namespace {

// Every key of a tree that holds a value, depth-first in print order.
void collectKeys(const config_node_impl& base, const config_node_impl& node,
                 std::vector<std::string>& keys) {
    if (node.initialized() && &node != &base)
        keys.push_back(config_relative_path(base, node));
    for (const auto& [name, child] : node.namedChildren())
        collectKeys(base, *child, keys);
    for (const auto& child : node.indexedChildren())
        collectKeys(base, *child, keys);
}

std::string sectionOf(const std::string& key) {
    return key.substr(0, key.find_first_of(".["));
}

bool knownOutsideTable(const std::string& key, const std::string& blockName) {
    const std::string section = sectionOf(key);
    return section == blockName || section == "module" || key == "global.configType" ||
           key == "global.configVersion";
}

// A suggestion must be close: at most 3 edits, and fewer than a third of the key.
std::string nearestKey(const std::string& key, const std::vector<std::string>& known) {
    std::string best;
    std::size_t bestDistance = std::min<std::size_t>(3, key.size() / 3) + 1;
    for (const std::string& candidate : known) {
        const std::size_t distance = editDistance(key, candidate);
        if (distance < bestDistance) {
            bestDistance = distance;
            best = candidate;
        }
    }
    return best;
}

} // namespace

std::size_t editDistance(const std::string& a, const std::string& b) {
    std::vector<std::size_t> row(b.size() + 1);
    for (std::size_t j = 0; j <= b.size(); ++j)
        row[j] = j;
    for (std::size_t i = 1; i <= a.size(); ++i) {
        std::size_t diagonal = row[0];
        row[0] = i;
        for (std::size_t j = 1; j <= b.size(); ++j) {
            const std::size_t above = row[j];
            row[j] =
                std::min({row[j] + 1, row[j - 1] + 1, diagonal + (a[i - 1] == b[j - 1] ? 0u : 1u)});
            diagonal = above;
        }
    }
    return row[b.size()];
}

std::vector<std::string> unknownSettingWarnings(const config_node_impl& config,
                                                const std::string& blockName) {
    config_node_impl defaults("defaults");
    set_defaults(defaults);
    std::vector<std::string> known;
    collectKeys(defaults, defaults, known);

    std::vector<std::string> keys;
    collectKeys(config, config, keys);
    std::vector<std::string> warnings;
    std::string lastList;
    for (const std::string& key : keys) {
        if (defaults.find_path(key).initialized() || knownOutsideTable(key, blockName))
            continue;
        // The elements of an unknown list are named once, by the list.
        const std::string list = key.substr(0, key.find('['));
        if (list != key && list == lastList)
            continue;
        lastList = list;
        std::string text = "Unknown configuration key " + list + " (ignored)";
        const std::string nearest = nearestKey(list, known);
        if (!nearest.empty())
            text += "; did you mean " + nearest + "?";
        warnings.push_back(text);
    }
    return warnings;
}

} // namespace driver

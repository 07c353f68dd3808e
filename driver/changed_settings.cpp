#include "driver/changed_settings.h"

#include "config/parameter_table.h"
#include "config/value_text.h"

namespace driver {

using config::config_node;
using config::config_node_impl;
using config::config_relative_path;
using config::parseFloatText;
using config::set_defaults;

namespace {

bool sameValue(const std::string& value, const config_node& defaultNode) {
    if (!defaultNode.initialized())
        return false;
    const std::string& defaultValue = defaultNode.as_string();
    if (value == defaultValue)
        return true;
    // "6" and "6.0" are the same setting.
    float a, b;
    return parseFloatText(value, a) && parseFloatText(defaultValue, b) && a == b;
}

} // namespace

std::vector<std::pair<std::string, std::string>> changedSettings(const config_node_impl& config) {
    config_node_impl defaults("defaults");
    set_defaults(defaults);

    std::vector<std::pair<std::string, std::string>> changed;
    // Depth-first in print order, with an explicit stack: keys may nest deeply.
    std::vector<const config_node_impl*> pending;
    const auto pushChildren = [&](const config_node_impl& node) {
        const auto& indexed = node.indexedChildren();
        for (auto child = indexed.rbegin(); child != indexed.rend(); ++child)
            pending.push_back(child->get());
        const auto& named = node.namedChildren();
        for (auto child = named.rbegin(); child != named.rend(); ++child)
            pending.push_back(child->second.get());
    };
    pushChildren(config);
    while (!pending.empty()) {
        const config_node_impl& node = *pending.back();
        pending.pop_back();
        if (node.initialized() && !node.is_default()) {
            const std::string path = config_relative_path(config, node);
            if (!sameValue(node.as_string(), defaults.find_path(path)))
                changed.emplace_back(path, node.as_string());
        }
        pushChildren(node);
    }
    return changed;
}

} // namespace driver

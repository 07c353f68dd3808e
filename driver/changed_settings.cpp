#include "driver/changed_settings.h"

std::vector<std::pair<std::string, std::string>> changedSettings(const config_node_impl& config) {
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
        if (node.initialized() && !node.is_default())
            changed.emplace_back(config_relative_path(config, node), node.as_string());
        pushChildren(node);
    }
    return changed;
}

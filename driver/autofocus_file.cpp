#include "driver/autofocus_file.h"

#include <stdexcept>

#include "config/config_file.h"

namespace driver {

using config::config_node;
using config::config_node_impl;
using config::config_relative_path;
using config::parse_config_text;
using config::read_config_text;

namespace {

// The first setting of `added` (a tree of the file alone) that is not
// autofocus data and differs from `existing`; null when there is none.
const config_node_impl* firstChange(const config_node_impl& added, const config_node& existing) {
    if (added.initialized() &&
        !(existing.initialized() && existing.as_string() == added.as_string()))
        return &added;
    for (const auto& [name, child] : added.namedChildren())
        if (const config_node_impl* change = firstChange(*child, existing.find(name)))
            return change;
    const auto& indexed = added.indexedChildren();
    for (std::size_t i = 0; i < indexed.size(); ++i)
        if (const config_node_impl* change = firstChange(*indexed[i], existing.find(i)))
            return change;
    return nullptr;
}

} // namespace

void readAutofocusFile(const std::string& path, config_node& config) {
    const std::string text = read_config_text(path);
    config_node_impl scratchRoot("root");
    config_node& scratch = scratchRoot.child("config");
    parse_config_text(text, scratch, path);
    for (const auto& [name, child] : static_cast<config_node_impl&>(scratch).namedChildren()) {
        if (name == "module")
            continue;
        if (const config_node_impl* change = firstChange(*child, config.find(name)))
            throw std::runtime_error(
                "The autofocus file may only add autofocus data (module.*); it sets " +
                config_relative_path(scratch, *change) +
                ", which would change the calibration data.");
    }
    parse_config_text(text, config, path);
}

} // namespace driver

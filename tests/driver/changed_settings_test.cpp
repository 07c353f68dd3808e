#include <gtest/gtest.h>

#include "config/config_file.h"
#include "config/parameter_table.h"
#include "driver/changed_settings.h"

using config::config_node_impl;
using config::parse_config_text;
using config::set_defaults;

namespace {

using driver::changedSettings;

std::vector<std::pair<std::string, std::string>> changedAfter(const std::string& text) {
    config_node_impl root("root");
    auto& config = static_cast<config_node_impl&>(root.child("config"));
    set_defaults(config);
    parse_config_text(text, config);
    return changedSettings(config);
}

TEST(ChangedSettings, DefaultsAndRestatedDefaultsAreLeftOut) {
    EXPECT_TRUE(changedAfter("").empty());
    EXPECT_TRUE(changedAfter("lsc.max_gain = 6; shared.block_name = reference; "
                             "apply_lsc.ccm[1] = {0.0, 1.0, 0.0};")
                    .empty());
}

TEST(ChangedSettings, ChangedAndUnknownKeysAreListedInPrintOrder) {
    const auto changed = changedAfter("shared.bit_res = 10; lsc.max_gain = 4.5; "
                                      "apply_lsc.ccm[0][1] = 0.25; custom.note = hello;");
    const std::vector<std::pair<std::string, std::string>> expected = {
        {"apply_lsc.ccm[0][1]", "0.25"},
        {"custom.note", "hello"},
        {"lsc.max_gain", "4.5"},
        {"shared.bit_res", "10"},
    };
    EXPECT_EQ(changed, expected);
}

} // namespace

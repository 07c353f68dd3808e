// Defaults, range checks and dates of the configuration. Settings and the
// messages they give: tests/data/config/validation.json and .golden; dates:
// dates.json and .golden; the default tree: defaults.golden.

#include <cstdlib>
#include <ctime>
#include <sstream>
#include <stdexcept>
#include <string>

#include "config/config_file.h"
#include "config/parameter_table.h"
#include "tests/config/case_data.h"

namespace config {
namespace {

TEST(ParameterTable, DefaultsAreMarkedAndValid) {
    config_node_impl root("root");
    set_defaults(root.child("config"));
    std::ostringstream out;
    root.print(out);
    case_data::expectGolden("config/defaults.golden", out.str());
    EXPECT_NO_THROW(validate(root.find("config")));
    EXPECT_EQ(block_prefix(root), "reference.");
    parse_config_text("config.shared.block_num_flag = 1; config.shared.block_num = 3;", root);
    EXPECT_EQ(block_prefix(root), "reference[3].");
    parse_config_text("config.shared.block_num_flag = 0; config.shared.block_name = top;", root);
    EXPECT_EQ(block_prefix(root), "top.");
    root.child_path("config.shared.block_name").set("");
    EXPECT_EQ(case_data::errorOf([&] { validate(root.find("config")); }),
              "Empty string not allowed for shared.block_name.");
}

// Each text is applied to the defaults; the first check that fails speaks.
TEST(ParameterTable, SettingsGiveTheirRangeMessages) {
    case_data::expectTranscript("config/validation.json", "config/validation.golden",
                                [](const nlohmann::json& settings) {
                                    config_node_impl root("root");
                                    config_node& config = root.child("config");
                                    set_defaults(config);
                                    parse_config_text(settings.get<std::string>(), config);
                                    return case_data::errorOf([&] { validate(config); }, "(valid)");
                                });
    EXPECT_THROW(
        [] {
            config_node_impl config("config");
            set_defaults(config);
            parse_config_text("shared.bit_res = 3;", config);
            validate(config);
        }(),
        std::range_error);
}

TEST(ParameterTable, RangeChecksNameThePathBelowConfig) {
    config_node_impl config("config");
    config_node& node = config.child_path("custom.limit");
    node.set("12");
    EXPECT_EQ(case_data::errorOf([&] { check_int_range(config, node, 0, 10); }),
              "Value specified for custom.limit is too high, value must be between 0 and 10.");
    EXPECT_THROW(check_int_range(config, node, 13, 20), std::range_error);
    EXPECT_NO_THROW(check_int_range(config, node, 12, 12));
    EXPECT_NO_THROW(check_float_range(config, node, 11.5f, 12.0f));
}

TEST(ConfigDate, ConvertsAsUtcAndRefusesOtherShapes) {
    case_data::expectTranscript(
        "config/dates.json", "config/dates.golden", [](const nlohmann::json& text) {
            std::string result;
            const std::string error = case_data::errorOf(
                [&] { result = std::to_string(config_date_seconds(text.get<std::string>())); });
            return error.empty() ? result : error;
        });
    EXPECT_THROW(config_date_seconds("2012-02-30T10:00"), std::invalid_argument);
}

TEST(ConfigDate, IgnoresTheMachineTimeZone) {
    const char* previous = std::getenv("TZ");
    const std::string saved = previous ? previous : "";
    std::int64_t seconds[2];
    int i = 0;
    for (const char* zone : {"EST5EDT,M3.2.0,M11.1.0", "IST-5:30"}) { // POSIX rules: no zoneinfo
        setenv("TZ", zone, 1);
        tzset();
        seconds[i++] = config_date_seconds("2012-05-01T10:30");
    }
    previous ? setenv("TZ", saved.c_str(), 1) : unsetenv("TZ");
    tzset();
    EXPECT_EQ(seconds[0], 1335868200);
    EXPECT_EQ(seconds[1], 1335868200);
}

} // namespace
} // namespace config

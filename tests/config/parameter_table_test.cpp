#include <cstdlib>
#include <ctime>
#include <sstream>
#include <stdexcept>
#include <string>

#include <boost/lexical_cast/bad_lexical_cast.hpp>
#include <gtest/gtest.h>

#include "config/config_file.h"
#include "config/parameter_table.h"

namespace config {
namespace {

class ParameterTableTest : public ::testing::Test {
protected:
    ParameterTableTest() { set_defaults(config); }

    config_node_impl root{"root"};
    config_node& config = root.child("config");

    // The range message after applying `settings`, or "(valid)".
    std::string validationError(const std::string& settings) {
        parse_config_text(settings, config);
        try {
            validate(config);
        } catch (const std::range_error& e) {
            return e.what();
        }
        return "(valid)";
    }
};

// ---- defaults ---------------------------------------------------------------

TEST_F(ParameterTableTest, DefaultsAreMarkedAndValid) {
    const config_node& quality = config.find_path("shared.jpeg_quality");
    EXPECT_EQ(quality.as_string(), "75");
    EXPECT_TRUE(quality.is_default());
    EXPECT_TRUE(quality.initialized());
    EXPECT_EQ(config.find_path("shared.cfg_file_date").as_string(), "");
    EXPECT_TRUE(config.find_path("shared.cfg_file_date").initialized());
    EXPECT_NO_THROW(validate(config));
    EXPECT_EQ(block_prefix(root), "reference.");
}

TEST_F(ParameterTableTest, ColourMatrixDefaultsToIdentityAndBlockCountsToZero) {
    for (int r = 0; r < 3; ++r)
        for (int c = 0; c < 3; ++c)
            EXPECT_EQ(config.find_path("apply_lsc.ccm").find(r).find(c).as_string(),
                      r == c ? "1.0" : "0.0");
    EXPECT_EQ(config.find_path("apply_lsc.delta_ab_blocks[0]").as_string(), "0");
    EXPECT_EQ(config.find_path("apply_lsc.delta_ab_blocks[1]").as_string(), "0");
}

// ---- range checks -----------------------------------------------------------

TEST_F(ParameterTableTest, BitResolutionIsCheckedOnlyWhenSet) {
    EXPECT_EQ(validationError("shared.bit_res = 0;"), "(valid)");
    EXPECT_EQ(validationError("shared.bit_res = 3;"),
              "Value specified for shared.bit_res is too low, value must be between 4 and 15.");
    EXPECT_EQ(validationError("shared.bit_res = 16;"),
              "Value specified for shared.bit_res is too high, value must be between 4 and 15.");
}

TEST_F(ParameterTableTest, LightSourceMayBeMinusOne) {
    EXPECT_EQ(validationError("shared.light_source = -1;"), "(valid)");
    EXPECT_EQ(validationError("shared.light_source = -2;"),
              "Value specified for shared.light_source is too low, value must be between -1 and "
              "255.");
}

TEST_F(ParameterTableTest, FloatBoundsPrintWithSixSignificantDigits) {
    EXPECT_EQ(validationError("lsc.leftPatchFactor = 0.6;"),
              "Value specified for lsc.leftPatchFactor is too high, value must be between 0 and "
              "0.5.");
    EXPECT_EQ(validationError("lsc.leftPatchFactor = 0.5; lsc.max_gain = 1000.5;"),
              "Value specified for lsc.max_gain is too high, value must be between 0 and 1000.");
    EXPECT_EQ(validationError("lsc.max_gain = 6; lsc.max_rms_err = -0.1;"),
              "Value specified for lsc.max_rms_err is too low, value must be between 0 and 1.");
}

TEST_F(ParameterTableTest, FloatDefaultsOnTheBoundaryPass) {
    EXPECT_EQ(validationError("lsc.max_err = 0.2; lsc.max_rms_err = 1.0; "
                              "apply_lsc.max_delta_ab = 10; lsc.topPatchFactor = 0.5;"),
              "(valid)");
}

TEST_F(ParameterTableTest, NonFiniteFloatsLieOutsideEveryRange) {
    EXPECT_EQ(validationError("apply_lsc.max_delta_ab = nan;"),
              "Value specified for apply_lsc.max_delta_ab is too high, value must be between 0 "
              "and 10.");
    EXPECT_EQ(validationError("apply_lsc.max_delta_ab = inf;"),
              "Value specified for apply_lsc.max_delta_ab is too high, value must be between 0 "
              "and 10.");
    EXPECT_EQ(validationError("apply_lsc.max_delta_ab = -inf;"),
              "Value specified for apply_lsc.max_delta_ab is too low, value must be between 0 "
              "and 10.");
}

TEST_F(ParameterTableTest, ValueThatIsNoNumberGivesTheConversionError) {
    parse_config_text("shared.jpeg_quality = 7.5;", config);
    EXPECT_THROW(validate(config), boost::bad_lexical_cast);
}

TEST_F(ParameterTableTest, SharedChecksRunInTheirOwnOrder) {
    // proc_sampling_factor comes before light_source, light_source before block_name.
    EXPECT_EQ(validationError("shared.light_source = 300; shared.proc_sampling_factor = 0;"),
              "Value specified for shared.proc_sampling_factor is too low, value must be between 1 "
              "and 100.");
    EXPECT_EQ(validationError("shared.proc_sampling_factor = 1; shared.block_name = 9;"),
              "Value specified for shared.light_source is too high, value must be between -1 and "
              "255.");
    EXPECT_EQ(validationError("shared.light_source = 1; shared.program_number = 256;"),
              "Value for shared.block_name may only consist of letters, digits, dashes, and "
              "underscores and must start with a letter.");
    EXPECT_EQ(validationError("shared.block_name = a; lsc.max_gain = -1;"),
              "Value specified for shared.program_number is too high, value must be between 0 and "
              "255.");
}

TEST_F(ParameterTableTest, SectionsAreCheckedInTableOrder) {
    EXPECT_EQ(validationError("apply_lsc.sampling_factor = 0; blob.write_flag = 2;"),
              "Value specified for blob.write_flag is too high, value must be between 0 and 1.");
    EXPECT_EQ(validationError("blob.write_flag = 1; proc.median_filter_size = 11;"),
              "Value specified for proc.median_filter_size is too high, value must be between 1 "
              "and 10.");
    EXPECT_EQ(validationError("proc.median_filter_size = 10; lsc.sampling_margin = 501;"),
              "Value specified for lsc.sampling_margin is too high, value must be between 0 and "
              "500.");
    EXPECT_EQ(validationError("lsc.sampling_margin = 500;"),
              "Value specified for apply_lsc.sampling_factor is too low, value must be between 1 "
              "and 100.");
}

TEST_F(ParameterTableTest, PatchLayoutAndLuminanceBoundHaveTheirOwnChecks) {
    EXPECT_EQ(config.find_path("lsc.patch_layout").as_string(), "config");
    EXPECT_EQ(config.find_path("apply_lsc.max_luma_residual").as_string(), "0");
    EXPECT_EQ(validationError("lsc.patch_layout = auto; apply_lsc.max_luma_residual = 100;"),
              "(valid)");
    EXPECT_EQ(validationError("apply_lsc.max_luma_residual = 100.5;"),
              "Value specified for apply_lsc.max_luma_residual is too high, value must be "
              "between 0 and 100.");
    EXPECT_EQ(validationError("apply_lsc.max_luma_residual = 0; lsc.patch_layout = Auto;"),
              "Value specified for lsc.patch_layout must be config or auto.");
}

TEST_F(ParameterTableTest, SampleWindowMustBeOddFromOneToFifteen) {
    EXPECT_EQ(config.find_path("lsc.sample_window").as_string(), "1");
    EXPECT_TRUE(config.find_path("lsc.sample_window").is_default());
    EXPECT_EQ(validationError("lsc.sample_window = 15;"), "(valid)");
    EXPECT_EQ(validationError("lsc.sample_window = 4;"),
              "Value specified for lsc.sample_window must be odd.");
    EXPECT_EQ(validationError("lsc.sample_window = 0;"),
              "Value specified for lsc.sample_window is too low, value must be between 1 and 15.");
    EXPECT_EQ(validationError("lsc.sample_window = 17;"),
              "Value specified for lsc.sample_window is too high, value must be between 1 and "
              "15.");
    EXPECT_EQ(validationError("lsc.sample_window = -2;"),
              "Value specified for lsc.sample_window is too low, value must be between 1 and 15.");
}

TEST_F(ParameterTableTest, SampleWindowIsCheckedAfterTheOtherFitSettings) {
    EXPECT_EQ(validationError("lsc.sample_window = 2; lsc.avg_luma = 2;"),
              "Value specified for lsc.avg_luma is too high, value must be between 0 and 1.");
    EXPECT_EQ(validationError("lsc.avg_luma = 0; apply_lsc.max_delta_ab = 11;"),
              "Value specified for lsc.sample_window must be odd.");
}

TEST_F(ParameterTableTest, UncheckedAndUnknownSettingsPass) {
    EXPECT_EQ(validationError("lsc.left_patch_width = -7; proc.black_level = x; other.key = 1;"),
              "(valid)");
}

TEST_F(ParameterTableTest, RangeChecksNameThePathBelowConfig) {
    config_node& node = config.child_path("custom.limit");
    node.set("12");
    try {
        check_int_range(config, node, 0, 10);
        FAIL();
    } catch (const std::range_error& e) {
        EXPECT_STREQ(
            e.what(),
            "Value specified for custom.limit is too high, value must be between 0 and 10.");
    }
    EXPECT_NO_THROW(check_int_range(config, node, 12, 12));
    EXPECT_NO_THROW(check_float_range(config, node, 11.5f, 12.0f));
}

// ---- block name and prefix ---------------------------------------------------

TEST_F(ParameterTableTest, BlockNameRule) {
    EXPECT_EQ(validationError("shared.block_name = a-b_9;"), "(valid)");
    const std::string badName = "Value for shared.block_name may only consist of letters, digits, "
                                "dashes, and underscores and must start with a letter.";
    EXPECT_EQ(validationError("shared.block_name = 9abc;"), badName);
    EXPECT_EQ(validationError("shared.block_name = ab.c;"), badName);
    EXPECT_EQ(validationError("shared.block_name = \"reference\";"), badName);
    EXPECT_EQ(validationError("shared.block_name = _a;"), badName);
    config.child_path("shared.block_name").set("");
    try {
        validate(config);
        FAIL();
    } catch (const std::range_error& e) {
        EXPECT_STREQ(e.what(), "Empty string not allowed for shared.block_name.");
    }
}

TEST_F(ParameterTableTest, BlockPrefixCarriesTheBlockNumberWhenFlagged) {
    parse_config_text("shared.block_num_flag = 1; shared.block_num = 3;", config);
    EXPECT_EQ(block_prefix(root), "reference[3].");
    parse_config_text("shared.block_num_flag = 0; shared.block_name = top;", config);
    EXPECT_EQ(block_prefix(root), "top.");
}

// ---- configuration date -----------------------------------------------------

std::string dateError(const std::string& text) {
    try {
        config_date_seconds(text);
    } catch (const std::invalid_argument& e) {
        return e.what();
    }
    return "(accepted)";
}

TEST(ConfigDate, ConvertsAsUtc) {
    EXPECT_EQ(config_date_seconds("2012-05-01T10:30"), 1335868200);
    EXPECT_EQ(config_date_seconds("1970-01-01T00:00"), 0);
    EXPECT_EQ(config_date_seconds("2000-2-29T1:2"), 951786120);
    EXPECT_EQ(config_date_seconds("2106-02-07T06:28"), 4294967280);
    EXPECT_EQ(config_date_seconds("1969-12-31T23:59"), -60);
    EXPECT_EQ(config_date_seconds("0000-01-01T00:00"), -62167219200);
    EXPECT_EQ(config_date_seconds("9999-12-31T23:59"), 253402300740);
}

TEST(ConfigDate, IgnoresTheMachineTimeZone) {
    const char* previous = std::getenv("TZ");
    const std::string saved = previous ? previous : "";
    setenv("TZ", "EST5EDT,M3.2.0,M11.1.0", 1); // POSIX rules: no zoneinfo needed
    tzset();
    const std::int64_t eastern = config_date_seconds("2012-05-01T10:30");
    setenv("TZ", "IST-5:30", 1);
    tzset();
    const std::int64_t india = config_date_seconds("2012-05-01T10:30");
    if (previous)
        setenv("TZ", saved.c_str(), 1);
    else
        unsetenv("TZ");
    tzset();
    EXPECT_EQ(eastern, 1335868200);
    EXPECT_EQ(india, 1335868200);
}

TEST(ConfigDate, RefusesOtherShapes) {
    const std::string message = "Invalid ISO 8601 date value (must be YYYY-MM-DDTHH:MM).";
    for (const char* text :
         {"2012-05-01 10:30", "", "2012-05-01T10:30:00", "2012-05-01T10", "2012-05-01t10:30",
          " 2012-05-01T10:30", "2012-05-01T10:30 ", "2012/05/01T10:30", "-2012-05-01T10:30",
          "2012-05-01T10:-3", "1234567890-01-01T00:00", "10000-01-01T00:00",
          // Dates and times that do not exist: never carried over to another one.
          "2012-13-01T00:00", "2012-00-01T00:00", "2012-02-30T10:00", "2011-02-29T10:00",
          "2012-04-31T10:00", "2012-05-00T10:00", "2012-05-01T24:00", "2012-05-01T10:60",
          "1900-02-29T00:00"})
        EXPECT_EQ(dateError(text), message) << text;
}

} // namespace
} // namespace config

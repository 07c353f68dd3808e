#include <stdexcept>
#include <string>

#include <boost/lexical_cast/bad_lexical_cast.hpp>
#include <gtest/gtest.h>

#include "config/config_file.h"
#include "config/fit_settings.h"
#include "config/parameter_table.h"

namespace config {

using img::BayerImage;
using img::imageCreate;
using img::kBufferRawCfa;
using img::kCfaRggb;
using img::kDataNone;
using img::kPixelRaw;

using lsc::ShadingSettings;
namespace {

BayerImage imageOf(std::int32_t width, std::int32_t height, std::uint16_t bits = 10) {
    int result = 0;
    BayerImage image;
    image.reset(imageCreate(width, height, bits, 1, 1, 0, kCfaRggb, kPixelRaw, kBufferRawCfa,
                            kDataNone, &result));
    EXPECT_EQ(result, 0);
    return image;
}

class FitSettingsTest : public ::testing::Test {
protected:
    FitSettingsTest() { set_defaults(config); }

    ShadingSettings load(const std::string& settings, std::int32_t width = 640,
                         std::int32_t height = 480, std::uint16_t bits = 10) {
        parse_config_text(settings, config);
        const BayerImage image = imageOf(width, height, bits);
        return load_fit_settings(config, image);
    }

    std::string loadError(const std::string& settings, std::int32_t width = 640,
                          std::int32_t height = 480) {
        try {
            load(settings, width, height);
        } catch (const std::exception& e) {
            return e.what();
        }
        return "(loaded)";
    }

    config_node_impl root{"root"};
    config_node& config = root.child("config");
};

TEST_F(FitSettingsTest, DefaultsConvertOnce) {
    const ShadingSettings c = load("");
    EXPECT_EQ(c.procSamplingFactor, 4);
    EXPECT_EQ(c.sampleAngleStep, 8);
    EXPECT_EQ(c.sampleMargin, 0);
    EXPECT_EQ(c.falloff, 0.0f);
    EXPECT_FALSE(c.greenBalance);
    EXPECT_EQ(c.applyStep, 4u);
    EXPECT_EQ(c.maxGain, 6.0f);
    EXPECT_EQ(c.maxRmsError, 0.2f);
    EXPECT_EQ(c.maxError, 0.2f);
    EXPECT_FALSE(c.logFitError);
    EXPECT_EQ(c.sampleWindow, 1);
    EXPECT_EQ(c.maxDeltaAb, 10.0f);
    EXPECT_EQ(c.awbFilterSize, 100);
    EXPECT_EQ(c.lumaNormalizeFactor, 0.75f);
    EXPECT_FALSE(c.averageChannels);
    EXPECT_EQ(c.blackLevel, 0.0f);
    EXPECT_EQ(c.layout.left, 0.25);
    EXPECT_EQ(c.layout.center, 0.5);
}

TEST_F(FitSettingsTest, ConfiguredValuesArrive) {
    const ShadingSettings c = load(
        "lsc.falloff_factor = 50; lsc.green_balance = 1; lsc.avg_luma = 1;\n"
        "lsc.sampling_margin = 20; apply_lsc.max_delta_ab = 4.5; lsc.awb_avg_filter_size = 7;\n"
        "apply_lsc.ccm = {2, 0.5};\napply_lsc.ccm[2] = {0, -1, 3};\n"
        "lsc.log_err_flag = 1; lsc.sample_window = 7; lsc.max_gain = 3.5;");
    EXPECT_TRUE(c.logFitError);
    EXPECT_EQ(c.sampleWindow, 7);
    EXPECT_EQ(c.maxGain, 3.5f);
    EXPECT_EQ(c.falloff, 0.5f);
    EXPECT_TRUE(c.greenBalance);
    EXPECT_TRUE(c.averageChannels);
    EXPECT_EQ(c.sampleMargin, 20);
    EXPECT_EQ(c.maxDeltaAb, 4.5f);
    EXPECT_EQ(c.awbFilterSize, 7);
    // A list on the matrix itself sets its rows' values, not their elements:
    // the rows keep their elements.
    EXPECT_EQ(c.ccm[0][0], 1.0f);
    EXPECT_EQ(c.ccm[2][0], 0.0f);
    EXPECT_EQ(c.ccm[2][1], -1.0f);
    EXPECT_EQ(c.ccm[2][2], 3.0f);
}

TEST_F(FitSettingsTest, BlackLevelIsAFractionOfFullScale) {
    EXPECT_EQ(load("proc.black_level = 64; shared.bit_res = 10;", 640, 480, 12).blackLevel,
              64.0f / 1023.0f);
    EXPECT_EQ(load("shared.bit_res = 0;", 640, 480, 12).blackLevel, 64.0f / 4095.0f);
    EXPECT_EQ(load("", 640, 480, 32).blackLevel, 64.0f / 4294967295.0f);
}

TEST_F(FitSettingsTest, ImageWithoutBitDepthIsRefused) {
    parse_config_text("proc.black_level = 64;", config);
    try {
        (void)load_fit_settings(config, imageOf(640, 480, 0));
        FAIL();
    } catch (const std::runtime_error& e) {
        EXPECT_STREQ(e.what(),
                     "The image bit depth is 0; set shared.bit_res in the configuration file.");
    }
}

TEST_F(FitSettingsTest, LegacyPatchWidthsBecomeFractions) {
    const ShadingSettings c = load("lsc.left_patch_width = 16; lsc.center_patch_width = 32;\n"
                                   "lsc.top_patch_height = 12; lsc.middle_patch_height = 24;",
                                   64, 48);
    EXPECT_EQ(c.layout.left, 0.25);
    EXPECT_EQ(c.layout.center, 0.5);
    EXPECT_EQ(c.layout.top, 0.25);
    EXPECT_EQ(c.layout.middle, 0.5);
}

TEST_F(FitSettingsTest, ExplicitFactorsWinOverPatchWidths) {
    const ShadingSettings c = load("lsc.left_patch_width = 16; lsc.leftPatchFactor = 0.3;", 64, 48);
    EXPECT_EQ(c.layout.left, static_cast<double>(0.3f));
    EXPECT_EQ(c.layout.center, 0.5);
}

TEST_F(FitSettingsTest, DeltaAbBlocksFollowTheAspectRatio) {
    auto blocks = [this](std::int32_t w, std::int32_t h) {
        const ShadingSettings c = load("", w, h);
        return std::to_string(c.deltaAbBlocks[0]) + "x" + std::to_string(c.deltaAbBlocks[1]);
    };
    EXPECT_EQ(blocks(640, 480), "20x15");
    EXPECT_EQ(blocks(1920, 1080), "32x18");
    EXPECT_EQ(blocks(720, 480), "24x16");
    EXPECT_EQ(blocks(1000, 400), "37x15");
}

TEST_F(FitSettingsTest, ConfiguredDeltaAbBlocksAreUsedAsGiven) {
    const ShadingSettings c = load("apply_lsc.delta_ab_blocks = {10, 7};");
    EXPECT_EQ(c.deltaAbBlocks[0], 10);
    EXPECT_EQ(c.deltaAbBlocks[1], 7);
}

TEST_F(FitSettingsTest, DeltaAbBlockCountsThatLeaveBlocksEmptyAreRefused) {
    EXPECT_EQ(loadError("apply_lsc.delta_ab_blocks = {10, 0};"),
              "Value specified for apply_lsc.delta_ab_blocks[1] is too low, value must be between "
              "1 and 480.");
    EXPECT_EQ(loadError("apply_lsc.delta_ab_blocks = {-3, 4};"),
              "Value specified for apply_lsc.delta_ab_blocks[0] is too low, value must be between "
              "1 and 640.");
    EXPECT_EQ(loadError("apply_lsc.delta_ab_blocks = {641, 4};"),
              "Value specified for apply_lsc.delta_ab_blocks[0] is too high, value must be between "
              "1 and 640.");
}

TEST_F(FitSettingsTest, VeryTallOrTinyImagesNeedConfiguredBlocks) {
    EXPECT_EQ(loadError("", 16, 400),
              "The image size (16x400) gives no usable delta ab block counts; set "
              "apply_lsc.delta_ab_blocks in the configuration file.");
    EXPECT_EQ(loadError("", 20, 10),
              "The image size (20x10) gives no usable delta ab block counts; set "
              "apply_lsc.delta_ab_blocks in the configuration file.");
    EXPECT_EQ(loadError("apply_lsc.delta_ab_blocks = {2, 2};", 16, 400), "(loaded)");
}

TEST_F(FitSettingsTest, ConversionErrorsPassThrough) {
    parse_config_text("lsc.max_gain = big;", config);
    EXPECT_THROW(load_fit_settings(config, imageOf(640, 480)), boost::bad_lexical_cast);
}

} // namespace
} // namespace config

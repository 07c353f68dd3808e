#include <sstream>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "lsc/sample_collection.h"
#include "lsc_test_image.h"

namespace lsc {

using img::BayerImage;
using img::kCfaBggr;
using img::kCfaGbrg;
using img::kCfaGrbg;
using img::kCfaRggb;
namespace {

using lsc_test::channelLevels;
using lsc_test::makeImage;

const float kLevels[4] = {0.2f, 0.4f, 0.5f, 0.7f};

class SampleCollection : public ::testing::Test {
protected:
    BayerImage image;
    ShadingSettings settings;
    SampleSet set;
    std::ostringstream messages;
};

TEST_F(SampleCollection, LevelledImageLosesTheBlackLevelAndIsClampedToOne) {
    makeImage(image, 4, 4, kCfaRggb, [](int x, int) {
        return x == 0 ? 0.05f : x == 1 ? 0.5f : 1.0f;
    });
    image.pixels()[3] = 1.5f;
    const BayerImage levelled = levelledImage(image, 0.1f);
    const float* p = levelled.pixels();
    EXPECT_EQ(p[0], 0.0f);
    EXPECT_FLOAT_EQ(p[1], 0.4f);
    EXPECT_FLOAT_EQ(p[2], 0.9f);
    EXPECT_EQ(p[3], 1.0f);
}

TEST_F(SampleCollection, SineGridAndBorderLinesOfASmallImage) {
    makeImage(image, 64, 48, kCfaRggb, channelLevels(kCfaRggb, kLevels));
    settings.sampleAngleStep = 90; // angles -90, 0, 90
    (set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages));
    // Sine grid: x in {0, 32} (64 = W is dropped), y in {0, 24}; then 6 columns
    // of 24 samples (every T / 5 = 2 rows) and 6 rows of 22 (every L / 5 = 3 columns).
    ASSERT_EQ(set.samples.size(), 4u + 6 * 24 + 6 * 22);
    const std::uint32_t grid[4][2] = {{0, 0}, {0, 24}, {32, 0}, {32, 24}};
    for (int i = 0; i < 4; ++i) {
        EXPECT_EQ(set.samples[i].x, grid[i][0]);
        EXPECT_EQ(set.samples[i].y, grid[i][1]);
    }
    // The first border column is x = 3, read as the block at x = 2.
    EXPECT_EQ(set.samples[4].x, 2u);
    EXPECT_EQ(set.samples[4].y, 0u);
    EXPECT_EQ(set.samples[5].y, 2u);
    EXPECT_EQ(messages.str(), "Number of sample points = 280\n");
}

TEST_F(SampleCollection, QuietSuppressesTheCountLine) {
    makeImage(image, 64, 48, kCfaRggb, channelLevels(kCfaRggb, kLevels));
    settings.quiet = true;
    (set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages));
    EXPECT_FALSE(set.samples.empty());
    EXPECT_EQ(messages.str(), "");
}

class SampleChannels : public ::testing::TestWithParam<std::uint32_t> {};

TEST_P(SampleChannels, EachBlockPixelGoesToItsChannel) {
    BayerImage image;
    ShadingSettings settings;
    SampleSet set;
    std::ostringstream messages;
    makeImage(image, 64, 48, GetParam(), channelLevels(GetParam(), kLevels));
    (set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages));
    ASSERT_FALSE(set.samples.empty());
    for (const shadingSample& s : set.samples) {
        ASSERT_EQ(s.x % 2, 0u);
        ASSERT_EQ(s.y % 2, 0u);
        for (int k = 0; k < 4; ++k)
            ASSERT_EQ(s.value[k], kLevels[k]) << k;
    }
    for (int k = 0; k < 4; ++k)
        EXPECT_FLOAT_EQ(set.targetLevels[k], kLevels[k]) << k;
}

INSTANTIATE_TEST_SUITE_P(BayerOrders, SampleChannels,
                         ::testing::Values(kCfaRggb, kCfaGrbg, kCfaGbrg, kCfaBggr));

TEST_F(SampleCollection, MarginBeyondHalfTheHeightTakesNoSamples) {
    makeImage(image, 400, 40, kCfaRggb, channelLevels(kCfaRggb, kLevels));
    settings.sampleMargin = 300; // 120 pixels on both axes; the image is 40 high
    (set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages));
    EXPECT_TRUE(set.samples.empty());
    EXPECT_EQ(messages.str(), "Number of sample points = 0\n");
}

TEST_F(SampleCollection, MarginKeepsSamplesAwayFromTheBorders) {
    makeImage(image, 200, 100, kCfaRggb, channelLevels(kCfaRggb, kLevels));
    settings.sampleMargin = 100; // 20 pixels
    (set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages));
    ASSERT_FALSE(set.samples.empty());
    for (const shadingSample& s : set.samples) {
        EXPECT_GE(s.x, 20u);
        EXPECT_LT(s.x, 180u);
        EXPECT_GE(s.y, 20u);
        EXPECT_LT(s.y, 80u);
    }
}

TEST_F(SampleCollection, OddSizedImagesNeverSampleAHalfBlock) {
    makeImage(image, 65, 49, kCfaRggb, channelLevels(kCfaRggb, kLevels));
    (set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages));
    ASSERT_FALSE(set.samples.empty());
    for (const shadingSample& s : set.samples) {
        EXPECT_LT(s.x + 1, 65u);
        EXPECT_LT(s.y + 1, 49u);
    }
}

TEST_F(SampleCollection, PatchesUnderFivePixelsStillEndTheBorderLines) {
    makeImage(image, 16, 12, kCfaRggb, channelLevels(kCfaRggb, kLevels)); // L = 4, T = 3
    settings.sampleAngleStep = 180;
    (set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages));
    // Steps of at least one pixel: the sine grid's (0, 0), six columns of 12 rows,
    // and five rows (y = 12 lies outside) of 16 columns.
    EXPECT_EQ(set.samples.size(), 1u + 6 * 12 + 5 * 16);
}

TEST_F(SampleCollection, RefusesAnAngleStepBelowOne) {
    makeImage(image, 64, 48, kCfaRggb, channelLevels(kCfaRggb, kLevels));
    settings.sampleAngleStep = 0;
    try {
        (set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages));
        FAIL() << "no exception";
    } catch (const std::runtime_error& e) {
        EXPECT_STREQ(e.what(), "lsc.sampling_factor must be at least 1.");
    }
}

TEST_F(SampleCollection, SampleWindowKeepsABrightPixelOutOfItsSample) {
    makeImage(image, 64, 48, kCfaRggb, channelLevels(kCfaRggb, kLevels));
    settings.sampleAngleStep = 90;       // the sine grid holds the block at (32, 24)
    image.pixels()[24 * 64 + 32] = 1.0f; // its red pixel
    auto redAtCentre = [&] {
        (set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages));
        for (const shadingSample& s : set.samples)
            if (s.x == 32 && s.y == 24)
                return s.value[0];
        return -1.0f;
    };
    EXPECT_EQ(redAtCentre(), 1.0f);
    settings.sampleWindow = 3;
    EXPECT_EQ(redAtCentre(), kLevels[0]);
}

TEST_F(SampleCollection, RefusesASampleWindowItCannotUse) {
    makeImage(image, 64, 48, kCfaRggb, channelLevels(kCfaRggb, kLevels));
    for (int window : {0, 4, 17}) {
        settings.sampleWindow = window;
        try {
            (set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages));
            ADD_FAILURE() << "no exception for " << window;
        } catch (const std::runtime_error& e) {
            EXPECT_STREQ(e.what(), "lsc.sample_window must be an odd number from 1 to 15.");
        }
    }
}

TEST_F(SampleCollection, RefusesAMissingImage) {
    EXPECT_THROW(
        (set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages)),
        std::runtime_error);
}

TEST(TargetLevels, WindowShrinksAtThePlaneBorder) {
    BayerImage image;
    ShadingSettings settings;
    SampleSet set;
    std::ostringstream messages;
    // Red plane: one bright pixel at its corner (0, 0); window 3 x 3.
    makeImage(image, 20, 20, kCfaRggb, [](int x, int y) { return x == 0 && y == 0 ? 1.0f : 0.0f; });
    settings.awbFilterSize = 6; // 6 / (2 * 1) = 3
    (set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages));
    EXPECT_FLOAT_EQ(set.targetLevels[0], 0.25f); // mean over the 2 x 2 inside
    EXPECT_EQ(set.targetLevels[1], 0.0f);
}

TEST(TargetLevels, WindowSizeIsFilterSizeOverTwiceTheSamplingFactorMadeOdd) {
    BayerImage image;
    ShadingSettings settings;
    SampleSet set;
    std::ostringstream messages;
    // Bright red pixel in the middle of a 16 x 16 red plane.
    makeImage(image, 32, 32, kCfaRggb,
              [](int x, int y) { return x == 16 && y == 16 ? 1.0f : 0.0f; });
    settings.awbFilterSize = 16;
    settings.procSamplingFactor = 2; // 16 / 4 = 4, made odd: 5
    (set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages));
    EXPECT_FLOAT_EQ(set.targetLevels[0], 1.0f / 25);
}

TEST(TargetLevels, WindowLargerThanThePlaneAveragesTheWholePlane) {
    BayerImage image;
    ShadingSettings settings;
    SampleSet set;
    std::ostringstream messages;
    makeImage(image, 8, 8, kCfaRggb, [](int x, int y) { return x == 0 && y == 0 ? 1.0f : 0.0f; });
    (set = collectSamples(levelledImage(image, settings.blackLevel), settings,
                          messages)); // window 51 over a 4 x 4 plane
    EXPECT_FLOAT_EQ(set.targetLevels[0], 1.0f / 16);
}

} // namespace
} // namespace lsc

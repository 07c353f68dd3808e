#include <stdexcept>

#include <gtest/gtest.h>

#include "prep/white_balance.h"
#include "test_images.h"

using prep_test::makeImage;

using img::BayerImage;
using img::kCfaBggr;
using img::kCfaGbrg;
using img::kCfaGrbg;
using img::kCfaRggb;

namespace {

// The run's white balance: to the fit's target levels, or to the centre's
// when the red one is 0.
struct Balance {
    BayerImage corrected;
    float targetLevels[4] = {0, 0, 0, 0};
    int awbFilterSize = 100;
    int procSamplingFactor = 1;
};

void balance(Balance& run) {
    float levels[4];
    prep::balanceLevels(run.targetLevels, run.corrected, levels);
    prep::whiteBalance(run.corrected, levels);
}

// Channel of (x, y) for RGGB.
int rggbChannel(int x, int y) {
    return (x & 1) + (y & 1) * 2;
}

// Every pixel of channel k holds values[k].
BayerImage channelImage(std::int32_t width, std::int32_t height, const float (&values)[4]) {
    BayerImage image = makeImage(width, height, 1, kCfaRggb);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
            image.pixels()[y * width + x] = values[rggbChannel(x, y)];
    return image;
}

TEST(CentreWindow, SmallImageSpansWholeImage) {
    const prep::CentreWindow window = prep::centreWindow(150, 150);
    EXPECT_EQ(window.x0, 0);
    EXPECT_EQ(window.x1, 149);
    EXPECT_EQ(window.y0, 0);
    EXPECT_EQ(window.y1, 149);
}

TEST(CentreWindow, LargeImageGets201PixelsAroundCentre) {
    const prep::CentreWindow window = prep::centreWindow(640, 480);
    EXPECT_EQ(window.x0, 220);
    EXPECT_EQ(window.x1, 420);
    EXPECT_EQ(window.y0, 140);
    EXPECT_EQ(window.y1, 340);
}

TEST(CentreWindow, MixedBounds) {
    const prep::CentreWindow window = prep::centreWindow(250, 199);
    EXPECT_EQ(window.x0, 25);
    EXPECT_EQ(window.x1, 225);
    EXPECT_EQ(window.y0, 0);
    EXPECT_EQ(window.y1, 198);
}

class WhiteBalance : public ::testing::TestWithParam<std::uint32_t> {};

TEST_P(WhiteBalance, TargetLevelsGiveGainsPerChannel) {
    Balance run;
    run.corrected = makeImage(4, 4, 1, GetParam());
    prep_test::fill(run.corrected, 1.0f);
    const float levels[4] = {1.0f, 2.0f, 2.0f, 0.5f};
    std::copy(levels, levels + 4, run.targetLevels);
    balance(run);
    const float gains[4] = {2.0f, 1.0f, 1.0f, 4.0f};
    // Channel k of (x, y) for the pattern under test.
    const int phase = GetParam() == kCfaGrbg   ? 1
                      : GetParam() == kCfaGbrg ? 2
                      : GetParam() == kCfaBggr ? 3
                                               : 0;
    for (int y = 0; y < 4; ++y)
        for (int x = 0; x < 4; ++x) {
            const int channel = ((x + phase) & 1) + ((y + (phase >> 1)) & 1) * 2;
            EXPECT_EQ(run.corrected.pixels()[y * 4 + x], gains[channel]) << x << "," << y;
        }
}

INSTANTIATE_TEST_SUITE_P(BayerOrders, WhiteBalance,
                         ::testing::Values(kCfaRggb, kCfaGrbg, kCfaGbrg, kCfaBggr));

TEST(WhiteBalanceCentre, MeasuredLevelsBalanceTheChannels) {
    Balance run;
    run.corrected = channelImage(150, 150, {0.5f, 0.25f, 0.25f, 0.125f});
    balance(run);
    for (float v : prep_test::samplesOf(run.corrected))
        ASSERT_EQ(v, 0.5f);
}

TEST(WhiteBalanceCentre, OnlyTheCentreWindowCounts) {
    Balance run;
    run.corrected = channelImage(640, 480, {0.5f, 0.5f, 0.5f, 0.5f});
    // Red outside the window (x < 220) is darker; the gains must ignore it.
    for (int y = 0; y < 480; y += 2)
        run.corrected.pixels()[y * 640] = 0.1f;
    balance(run);
    EXPECT_EQ(run.corrected.pixels()[2 * 640 + 2], 0.5f);
    EXPECT_EQ(run.corrected.pixels()[0], 0.1f);
}

TEST(WhiteBalanceCentre, RefusesWindowWithoutEveryChannel) {
    Balance run;
    run.corrected = makeImage(1, 8, 1, kCfaRggb);
    prep_test::fill(run.corrected, 0.5f);
    try {
        balance(run);
        FAIL();
    } catch (const std::runtime_error& e) {
        EXPECT_STREQ(e.what(),
                     "The centre of the flattened image does not hold pixels of all four colour "
                     "channels.");
    }
}

TEST(WhiteBalanceCentre, RefusesZeroLevelAndLeavesImage) {
    Balance run;
    run.corrected = channelImage(8, 8, {0.5f, 0.5f, 0.0f, 0.5f});
    try {
        balance(run);
        FAIL();
    } catch (const std::runtime_error& e) {
        EXPECT_STREQ(e.what(), "A colour channel of the flattened image has no positive level; "
                               "it cannot be white balanced.");
    }
    EXPECT_EQ(run.corrected.pixels()[0], 0.5f);
}

TEST(BoxSide, OddSideFromFilterSizeAndSamplingFactor) {
    EXPECT_EQ(prep::boxSide(100, 1), 51);
    EXPECT_EQ(prep::boxSide(100, 4), 13);
    EXPECT_EQ(prep::boxSide(100, 2), 25);
    EXPECT_EQ(prep::boxSide(1, 1), 1);
}

TEST(MeasureLevels, FlatChannelsGiveTheirValues) {
    Balance run;
    run.corrected = channelImage(20, 16, {0.5f, 0.25f, 0.75f, 0.125f});
    run.awbFilterSize = 6;
    float levels[4];
    prep::measureLevels(levels, run.corrected, run.awbFilterSize, run.procSamplingFactor);
    EXPECT_FLOAT_EQ(levels[0], 0.5f);
    EXPECT_FLOAT_EQ(levels[1], 0.25f);
    EXPECT_FLOAT_EQ(levels[2], 0.75f);
    EXPECT_FLOAT_EQ(levels[3], 0.125f);
}

TEST(MeasureLevels, BoxMeanShrinksAtBorders) {
    Balance run;
    run.corrected = channelImage(10, 10, {0, 0, 0, 0}); // 5 x 5 planes
    run.awbFilterSize = 6;                              // side 3
    run.corrected.pixels()[2 * 2 * 10 + 2 * 2] = 9.0f;  // red plane (2, 2)
    run.corrected.pixels()[0 * 10 + 1] = 9.0f;          // green/red plane (0, 0)
    float levels[4];
    prep::measureLevels(levels, run.corrected, run.awbFilterSize, run.procSamplingFactor);
    EXPECT_FLOAT_EQ(levels[0], 1.0f);  // 9 over a full 3 x 3 window
    EXPECT_FLOAT_EQ(levels[1], 2.25f); // 9 over the 2 x 2 corner window
    EXPECT_FLOAT_EQ(levels[2], 0.0f);
}

TEST(MeasureLevels, RefusesImageBelowTwoByTwo) {
    Balance run;
    run.corrected = makeImage(1, 5);
    prep_test::fill(run.corrected, 0.5f);
    EXPECT_THROW(
        {
            float levels[4];
            prep::measureLevels(levels, run.corrected, run.awbFilterSize, run.procSamplingFactor);
        },
        std::runtime_error);
}

} // namespace

// Where the fit takes its samples, what each sample reads (window medians per
// channel) and the target levels.

#include <algorithm>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "lsc/sample_collection.h"
#include "lsc/sample_window.h"
#include "test_helpers.h"

namespace lsc {
namespace {

using lsc_test::kOrders;
using lsc_test::makeImage;

const float kLevels[4] = {0.2f, 0.4f, 0.5f, 0.7f};

class Sampling : public ::testing::Test {
protected:
    // Collects the samples of a width x height capture; the error text, or "".
    std::string collect(int width, int height, const std::function<float(int, int)>& value = {}) {
        makeImage(image, width, height, img::kCfaRggb,
                  value ? value : lsc_test::channelLevels(kOrders[0], kLevels));
        messages.str("");
        return lsc_test::runtimeError([&] {
            set = collectSamples(levelledImage(image, settings.blackLevel), settings, messages);
        });
    }
    img::BayerImage image;
    ShadingSettings settings;
    SampleSet set;
    std::ostringstream messages;
};

TEST_F(Sampling, LevelledImageLosesTheBlackLevelAndIsClampedToOne) {
    const float in[4] = {0.05f, 0.5f, 1.0f, 1.5f}, out[4] = {0.0f, 0.4f, 0.9f, 1.0f};
    makeImage(image, 4, 1, img::kCfaRggb, [&](int x, int) { return in[x]; });
    const img::BayerImage levelled = levelledImage(image, 0.1f);
    for (int x = 0; x < 4; ++x)
        EXPECT_FLOAT_EQ(levelled.pixels()[x], out[x]) << x;
}

TEST_F(Sampling, SineGridThenBorderLinesAndTheCountLine) {
    settings.sampleAngleStep = 90; // angles -90, 0, 90
    ASSERT_EQ(collect(64, 48), "");
    // Sine grid x in {0, 32} (64 = W is dropped), y in {0, 24}; then 6 columns
    // of 24 samples (every T / 5 = 2 rows) and 6 rows of 22 (every L / 5 = 3
    // columns); the first border column, x = 3, reads the block at x = 2.
    EXPECT_EQ(messages.str(), "Number of sample points = 280\n");
    std::string positions; // all of them, and those of odd patch sizes, against the kept list
    for (const int width : {64, 68}) {
        ASSERT_EQ(collect(width, width - 16), "");
        for (const shadingSample& s : set.samples)
            positions += std::to_string(s.x) + "," + std::to_string(s.y) + "\n";
    }
    lsc_test::expectGolden("lsc/sample_positions.txt", positions);
    settings.quiet = true;
    ASSERT_EQ(collect(64, 48), "");
    EXPECT_EQ(messages.str(), "");
    // Patches under five pixels (L = 4, T = 3) still end their border lines:
    // (0, 0), six columns of 12 rows and five rows (y = 12 lies outside) of 16.
    settings.sampleAngleStep = 180;
    ASSERT_EQ(collect(16, 12), "");
    EXPECT_EQ(set.samples.size(), 1u + 6 * 12 + 5 * 16);
}

TEST_F(Sampling, EachBlockPixelGoesToItsChannelInEveryBayerOrder) {
    for (const lsc_test::Order& order : kOrders) {
        makeImage(image, 64, 48, order.cfa, lsc_test::channelLevels(order, kLevels));
        settings.sampleWindow = settings.sampleWindow == 1 ? 5 : 1; // medians per channel too
        set = collectSamples(levelledImage(image, 0.0f), settings, messages);
        ASSERT_FALSE(set.samples.empty());
        for (const shadingSample& s : set.samples) {
            ASSERT_EQ(s.x % 2 + s.y % 2, 0u);
            for (int k = 0; k < 4; ++k)
                ASSERT_EQ(s.value[k], kLevels[k]) << order.name << " " << k;
        }
        for (int k = 0; k < 4; ++k)
            EXPECT_FLOAT_EQ(set.targetLevels[k], kLevels[k]) << order.name << " " << k;
    }
}

TEST_F(Sampling, MarginsAndOddSizesKeepSamplesInside) {
    const struct {
        int width, height, margin;
        std::uint32_t low, maxX, maxY;
    } cases[] = {{200, 100, 100, 20, 180, 80}, // 20 pixels
                 {65, 49, 0, 0, 64, 48}};      // never a half block
    for (const auto& c : cases) {
        settings.sampleMargin = c.margin;
        ASSERT_EQ(collect(c.width, c.height), "");
        ASSERT_FALSE(set.samples.empty());
        for (const shadingSample& s : set.samples) {
            EXPECT_GE(std::min(s.x, s.y), c.low);
            EXPECT_LT(s.x + (c.low ? 0 : 1), c.maxX);
            EXPECT_LT(s.y + (c.low ? 0 : 1), c.maxY);
        }
    }
    settings.sampleMargin = 300; // 120 pixels on both axes; the image is 40 high
    ASSERT_EQ(collect(400, 40), "");
    EXPECT_TRUE(set.samples.empty());
    EXPECT_EQ(messages.str(), "Number of sample points = 0\n");
}

TEST_F(Sampling, SampleWindowKeepsABrightPixelOutOfItsSample) {
    settings.sampleAngleStep = 90; // the sine grid holds the block at (32, 24)
    const auto bright = [](int x, int y) {
        return x == 32 && y == 24 ? 1.0f : lsc_test::channelLevels(kOrders[0], kLevels)(x, y);
    };
    for (int window : {1, 3}) {
        settings.sampleWindow = window;
        ASSERT_EQ(collect(64, 48, bright), "");
        const auto centre =
            std::find_if(set.samples.begin(), set.samples.end(),
                         [](const shadingSample& s) { return s.x == 32 && s.y == 24; });
        ASSERT_NE(centre, set.samples.end());
        EXPECT_EQ(centre->value[0], window == 1 ? 1.0f : kLevels[0]);
    }
}

TEST_F(Sampling, RefusesSettingsItCannotUseAndAMissingImage) {
    const char* const badWindow = "lsc.sample_window must be an odd number from 1 to 15.";
    const struct {
        int angleStep, window;
        const char* error;
    } cases[] = {{0, 1, "lsc.sampling_factor must be at least 1."},
                 {8, 0, badWindow},
                 {8, 4, badWindow},
                 {8, 17, badWindow}};
    for (const auto& c : cases) {
        settings.sampleAngleStep = c.angleStep;
        settings.sampleWindow = c.window;
        EXPECT_EQ(collect(64, 48), c.error);
    }
    EXPECT_THROW(
        collectSamples(levelledImage(img::BayerImage(), 0.0f), ShadingSettings(), messages),
        std::runtime_error);
}

TEST_F(Sampling, TargetLevelWindowIsFilterSizeOverTwiceTheFactorMadeOddAndShrinksAtBorders) {
    const struct {
        int size, brightX, filter, factor;
        float red;
    } cases[] = {{20, 0, 6, 1, 0.25f},       // window 3 at the corner: 2 x 2 inside
                 {32, 16, 16, 2, 1.0f / 25}, // 16 / 4 = 4, made odd: 5
                 {8, 0, 100, 1, 1.0f / 16}}; // window 51 over a 4 x 4 plane
    for (const auto& c : cases) {
        settings.awbFilterSize = c.filter;
        settings.procSamplingFactor = c.factor;
        ASSERT_EQ(
            collect(c.size, c.size,
                    [&](int x, int y) { return x == c.brightX && y == c.brightX ? 1.0f : 0.0f; }),
            "");
        EXPECT_FLOAT_EQ(set.targetLevels[0], c.red) << c.size;
        EXPECT_EQ(set.targetLevels[1], 0.0f);
    }
}

// A width x height RGGB working image over its own pixel store.
struct Plane {
    Plane(std::uint32_t width, std::uint32_t height, float fill)
        : pixels(std::size_t{width} * height, fill), image{width, height, img::kCfaRggb,
                                                           pixels.data()} {}
    // The pixel of `channel` in the 2x2 block at even (x, y): RGGB is in channel order.
    float& at(std::uint32_t x, std::uint32_t y, int k) {
        return pixels[(y + static_cast<std::uint32_t>(k / 2)) * image.width + x +
                      static_cast<std::uint32_t>(k % 2)];
    }
    std::vector<float> medians(std::uint32_t x, std::uint32_t y, int window) const {
        std::vector<float> result(kChannels);
        windowMedians(image, 0, x, y, window, result.data());
        return result;
    }
    std::vector<float> pixels;
    WorkingImage image;
};

TEST(SampleWindow, MedianOfEachChannelsOwnBlocksWithinTheImage) {
    Plane nine(20, 20, 100.0f); // blocks outside the window must not count
    const float greens[9] = {7, 3, 9, 1, 5, 8, 2, 6, 4};
    for (int i = 0; i < 9; ++i) {
        const std::uint32_t x = 6 + 2 * static_cast<std::uint32_t>(i % 3),
                            y = 6 + 2 * static_cast<std::uint32_t>(i / 3);
        nine.at(x, y, 0) = i < 4 ? 50.0f : 0.25f; // four outliers among nine
        nine.at(x, y, 1) = greens[i];
        nine.at(x, y, 2) = 0.5f;
        nine.at(x, y, 3) = 0.75f;
    }
    EXPECT_EQ(nine.medians(8, 8, 3), (std::vector<float>{0.25f, 5.0f, 0.5f, 0.75f}));
    // Clipped at the corner: an even count gives the mean of the middle two.
    Plane corner(20, 20, 100.0f);
    const float reds[4] = {1, 20, 2, 10};
    for (std::uint32_t i = 0; i < 4; ++i)
        corner.at(2 * (i % 2), 2 * (i / 2), 0) = reds[i];
    EXPECT_EQ(corner.medians(0, 0, 3)[0], 6.0f);
    // An odd-sized image leaves out the half block at its border.
    Plane odd(7, 7, 1000.0f);
    for (std::uint32_t i = 0; i < 4; ++i)
        odd.at(2 + 2 * (i % 2), 2 + 2 * (i / 2), 0) = static_cast<float>(i + 1);
    EXPECT_EQ(odd.medians(4, 4, 3)[0], 2.5f);
    // Fifteen blocks per side: blocks 2..16 around block 9 hold 225..1.
    Plane wide(40, 40, 1000.0f);
    float value = 225.0f;
    for (std::uint32_t y = 4; y <= 32; y += 2)
        for (std::uint32_t x = 4; x <= 32; x += 2)
            wide.at(x, y, 3) = value--;
    EXPECT_EQ(wide.medians(18, 18, 15)[3], 113.0f);
    for (int window : {1, 3, 9, 15})
        EXPECT_TRUE(sampleWindowUsable(window)) << window;
    for (int window : {0, -1, 2, 4, 16, 17})
        EXPECT_FALSE(sampleWindowUsable(window)) << window;
    EXPECT_THROW(wide.medians(18, 18, 17), std::invalid_argument);
    EXPECT_THROW(wide.medians(18, 18, 4), std::invalid_argument);
}

} // namespace
} // namespace lsc

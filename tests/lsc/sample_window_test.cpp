#include <numeric>
#include <stdexcept>
#include <vector>

#include <gtest/gtest.h>

#include "image/bayer_phase.h"
#include "image/image_buffer.h"
#include "lsc/sample_window.h"

namespace lsc {

using img::kCfaBggr;
using img::kCfaGbrg;
using img::kCfaGrbg;
using img::kCfaRggb;
namespace {

// A width x height RGGB working image over its own pixel store, every pixel
// at `fill` until set.
class TestImage {
public:
    TestImage(std::uint32_t width, std::uint32_t height, float fill = 0.5f,
              std::uint32_t cfa = kCfaRggb)
        : pixels_(static_cast<std::size_t>(width) * height, fill), image_{width, height, cfa,
                                                                          pixels_.data()} {}

    // The pixel of `channel` in the 2x2 block at even (blockX, blockY).
    float& at(std::uint32_t blockX, std::uint32_t blockY, int channel) {
        const int phase = img::bayerPhase(image_.cfa);
        for (std::uint32_t dy = 0; dy < 2; ++dy)
            for (std::uint32_t dx = 0; dx < 2; ++dx)
                if (img::bayerChannel(dx, dy, phase) == channel)
                    return pixel(blockX + dx, blockY + dy);
        throw std::logic_error("no such channel");
    }
    float& pixel(std::uint32_t x, std::uint32_t y) { return pixels_[y * image_.width + x]; }

    std::vector<float> medians(std::uint32_t blockX, std::uint32_t blockY, int window) const {
        std::vector<float> result(kChannels);
        windowMedians(image_, img::bayerPhase(image_.cfa), blockX, blockY, window, result.data());
        return result;
    }

private:
    std::vector<float> pixels_;
    WorkingImage image_;
};

TEST(SampleWindow, ThreeBlocksPerSideGiveEachChannelItsOwnMedianOfNine) {
    TestImage image(20, 20, 100.0f); // blocks outside the window must not count
    // Red: four outliers among nine; green/red: 1..9 in scrambled order.
    const float greens[9] = {7, 3, 9, 1, 5, 8, 2, 6, 4};
    int i = 0;
    for (std::uint32_t y = 6; y <= 10; y += 2)
        for (std::uint32_t x = 6; x <= 10; x += 2, ++i) {
            image.at(x, y, 0) = i < 4 ? 50.0f : 0.25f;
            image.at(x, y, 1) = greens[i];
            image.at(x, y, 2) = 0.5f;
            image.at(x, y, 3) = 0.75f;
        }
    EXPECT_EQ(image.medians(8, 8, 3), (std::vector<float>{0.25f, 5.0f, 0.5f, 0.75f}));
}

TEST(SampleWindow, ClippedAtTheCornerAnEvenCountGivesTheMeanOfTheTwoMiddleValues) {
    TestImage image(20, 20, 100.0f);
    // Window 3 at block (0, 0) keeps the blocks at x, y in {0, 2}.
    image.at(0, 0, 0) = 1.0f;
    image.at(2, 0, 0) = 20.0f;
    image.at(0, 2, 0) = 2.0f;
    image.at(2, 2, 0) = 10.0f;
    EXPECT_EQ(image.medians(0, 0, 3)[0], 6.0f);
}

TEST(SampleWindow, OddSizedImageLeavesOutTheHalfBlockAtItsBorder) {
    TestImage image(7, 7, 1000.0f); // the last column and row belong to no whole block
    const float reds[4] = {1, 2, 3, 4};
    int i = 0;
    for (std::uint32_t y = 2; y <= 4; y += 2)
        for (std::uint32_t x = 2; x <= 4; x += 2)
            image.at(x, y, 0) = reds[i++];
    EXPECT_EQ(image.medians(4, 4, 3)[0], 2.5f);
}

TEST(SampleWindow, FifteenBlocksPerSideTakeAllTwoHundredTwentyFiveValues) {
    TestImage image(40, 40, 1000.0f);
    // Blocks 2..16 (pixels 4..32) around block 9 (pixel 18): values 1..225.
    float value = 225.0f;
    for (std::uint32_t y = 4; y <= 32; y += 2)
        for (std::uint32_t x = 4; x <= 32; x += 2)
            image.at(x, y, 3) = value--;
    EXPECT_EQ(image.medians(18, 18, 15)[3], 113.0f);
}

class SampleWindowOrders : public ::testing::TestWithParam<std::uint32_t> {};

TEST_P(SampleWindowOrders, EachChannelReadsItsOwnPixels) {
    TestImage image(24, 24, 0.0f, GetParam());
    for (std::uint32_t y = 0; y < 24; y += 2)
        for (std::uint32_t x = 0; x < 24; x += 2)
            for (int k = 0; k < kChannels; ++k)
                image.at(x, y, k) = 0.2f * static_cast<float>(k + 1);
    EXPECT_EQ(image.medians(10, 12, 5), (std::vector<float>{0.2f, 0.4f, 0.6f, 0.8f}));
}

INSTANTIATE_TEST_SUITE_P(BayerOrders, SampleWindowOrders,
                         ::testing::Values(kCfaRggb, kCfaGrbg, kCfaGbrg, kCfaBggr));

TEST(SampleWindow, OnlyOddSizesFromOneToFifteenAreUsable) {
    for (int window : {1, 3, 9, 15})
        EXPECT_TRUE(sampleWindowUsable(window)) << window;
    for (int window : {0, -1, 2, 4, 16, 17})
        EXPECT_FALSE(sampleWindowUsable(window)) << window;
    TestImage image(40, 40);
    EXPECT_THROW(image.medians(18, 18, 17), std::invalid_argument);
    EXPECT_THROW(image.medians(18, 18, 4), std::invalid_argument);
}

} // namespace
} // namespace lsc

// Figures the calibration report computes: block means of a Bayer image and
// gain surfaces sampled from control grids.

#include <functional>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "lsc/eval_patch.h"
#include "report/report_data.h"

namespace report {

using img::BayerImage;
using img::imageCreate;
using img::kBufferRawCfa;
using img::kCfaBggr;
using img::kCfaGbrg;
using img::kCfaGrbg;
using img::kCfaRggb;
using img::kDataReal32;
using img::kPixelRaw;

using lsc::evalPatch;
using lsc::kChannelNames;
using lsc::kChannels;
using lsc::kGridPoints;
using lsc::PatchBreakpoints;
using lsc::patchBreakpoints;
using lsc::patchStart;
namespace {

BayerImage makeMosaic(int width, int height, std::uint32_t cfa,
                      const std::function<float(int, int)>& value) {
    int rc = 0;
    BayerImage image;
    image.reset(
        imageCreate(width, height, 10, 1, 1, 0, cfa, kPixelRaw, kBufferRawCfa, kDataReal32, &rc));
    EXPECT_NE(image.buffer(), nullptr) << rc;
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
            image.pixels()[y * width + x] = value(x, y);
    return image;
}

// Value 1, 2, 3 or 4 by the colour at (x, y) of pattern `order` ("RGGB", ...):
// red 1, the green beside red 2, the green beside blue 3, blue 4.
std::function<float(int, int)> colourCodes(const std::string& order) {
    return [order](int x, int y) {
        const char colour = order[(y & 1) * 2 + (x & 1)];
        if (colour == 'R')
            return 1.0f;
        if (colour == 'B')
            return 4.0f;
        const char besides = order[(y & 1) * 2 + ((x & 1) ^ 1)];
        return besides == 'R' ? 2.0f : 3.0f;
    };
}

std::string expectThrowText(const std::function<void()>& action) {
    try {
        action();
    } catch (const std::runtime_error& error) {
        return error.what();
    }
    ADD_FAILURE() << "no std::runtime_error";
    return "";
}

struct Order {
    const char* name;
    std::uint32_t cfa;
};

class BlockMeansByOrder : public ::testing::TestWithParam<Order> {};

TEST_P(BlockMeansByOrder, SortsPixelsIntoChannelsByBayerPhase) {
    const Order order = GetParam();
    const BayerImage image = makeMosaic(12, 8, order.cfa, colourCodes(order.name));
    const ChannelBlockMeans means = blockMeans(image, 3, 2);
    ASSERT_EQ(means.columns, 3);
    ASSERT_EQ(means.rows, 2);
    for (int k = 0; k < kChannels; ++k) {
        ASSERT_EQ(means.mean[k].size(), 6u);
        for (float value : means.mean[k])
            EXPECT_FLOAT_EQ(value, static_cast<float>(k + 1)) << kChannelNames[k];
    }
}

INSTANTIATE_TEST_SUITE_P(AllOrders, BlockMeansByOrder,
                         ::testing::Values(Order{"RGGB", kCfaRggb}, Order{"GRBG", kCfaGrbg},
                                           Order{"GBRG", kCfaGbrg}, Order{"BGGR", kCfaBggr}),
                         [](const ::testing::TestParamInfo<Order>& order) {
                             return std::string(order.param.name);
                         });

TEST(BlockMeans, AveragesEachBlockOverItsOwnCells) {
    // Red grows with the cell column: cells 0..5 across, two blocks of three cells.
    const BayerImage image = makeMosaic(12, 4, kCfaRggb, [](int x, int y) {
        return (x + y) % 2 ? 0.0f : static_cast<float>(x / 2);
    });
    const ChannelBlockMeans means = blockMeans(image, 2, 1);
    ASSERT_EQ(means.mean[0].size(), 2u);
    EXPECT_FLOAT_EQ(means.mean[0][0], 1.0f); // cells 0, 1, 2
    EXPECT_FLOAT_EQ(means.mean[0][1], 4.0f); // cells 3, 4, 5
}

TEST(BlockMeans, DealsUnevenCellsToBlocksInOrder) {
    // Five cells across into two blocks: cells 0..2 and 3..4.
    const BayerImage image = makeMosaic(10, 2, kCfaRggb, [](int x, int y) {
        return (x + y) % 2 ? 0.0f : static_cast<float>(x / 2);
    });
    const ChannelBlockMeans means = blockMeans(image, 2, 1);
    EXPECT_FLOAT_EQ(means.mean[0][0], 1.0f);
    EXPECT_FLOAT_EQ(means.mean[0][1], 3.5f);
}

TEST(BlockMeans, DealsUnevenCellsAndLeavesOutAnOddLastRowAndColumn) {
    // 5 x 3 pixels: 2 x 1 cells; the last column and row hold 100 and must not count.
    const BayerImage image =
        makeMosaic(5, 3, kCfaRggb, [](int x, int y) { return x == 4 || y == 2 ? 100.0f : 1.0f; });
    const ChannelBlockMeans means = blockMeans(image, 2, 1);
    for (int k = 0; k < kChannels; ++k)
        for (float value : means.mean[k])
            EXPECT_FLOAT_EQ(value, 1.0f);
}

TEST(BlockMeans, ReducesAGridFinerThanTheCells) {
    const BayerImage image = makeMosaic(6, 4, kCfaRggb, [](int, int) { return 0.5f; });
    const ChannelBlockMeans means = blockMeans(image, 10, 10);
    EXPECT_EQ(means.columns, 3);
    EXPECT_EQ(means.rows, 2);
    EXPECT_EQ(means.mean[3].size(), 6u);
}

TEST(BlockMeans, RefusesImagesWithoutAWholeCellAndEmptyGrids) {
    EXPECT_EQ(expectThrowText([] { blockMeans(BayerImage(), 2, 2); }),
              "The report needs a Bayer image of at least 2 x 2 float samples.");
    const BayerImage thin = makeMosaic(1, 8, kCfaRggb, [](int, int) { return 1.0f; });
    EXPECT_EQ(expectThrowText([&] { blockMeans(thin, 2, 2); }),
              "The report needs a Bayer image of at least 2 x 2 float samples.");
    const BayerImage image = makeMosaic(4, 4, kCfaRggb, [](int, int) { return 1.0f; });
    EXPECT_EQ(expectThrowText([&] { blockMeans(image, 0, 2); }),
              "The report's block grid needs at least one block.");
}

TEST(BlockMeans, ScaledToPeakAfterTheBlackLevel) {
    ChannelBlockMeans means;
    means.columns = 3;
    means.rows = 1;
    means.mean[0] = {0.3f, 0.6f, 0.5f};
    means.mean[1] = {0.0f, 0.0f, 0.0f};
    scaleToPeak(means, 0.1f);
    EXPECT_FLOAT_EQ(means.mean[0][0], 0.4f);
    EXPECT_FLOAT_EQ(means.mean[0][1], 1.0f);
    EXPECT_FLOAT_EQ(means.mean[0][2], 0.8f);
    // No signal: left at zero, no division.
    EXPECT_EQ(means.mean[1], (std::vector<float>{0.0f, 0.0f, 0.0f}));
}

TEST(BlockMeans, DeviationFromTheChannelMean) {
    ChannelBlockMeans means;
    means.columns = 4;
    means.rows = 1;
    means.mean[2] = {0.9f, 1.1f, 1.0f, 1.0f};
    deviationFromMean(means);
    EXPECT_NEAR(means.mean[2][0], -0.1f, 1e-6);
    EXPECT_NEAR(means.mean[2][1], 0.1f, 1e-6);
    EXPECT_NEAR(largestAbsolute(means.mean[2]), 0.1f, 1e-6);
    const ValueRange range = channelRange(means, 2);
    EXPECT_NEAR(range.minimum, -0.1f, 1e-6);
    EXPECT_NEAR(range.maximum, 0.1f, 1e-6);
}

TEST(BlockGridFor, KeepsBlocksAboutSquareOnEitherOrientation) {
    EXPECT_EQ(blockGridFor(640, 480, 16).columns, 16);
    EXPECT_EQ(blockGridFor(640, 480, 16).rows, 12);
    EXPECT_EQ(blockGridFor(480, 640, 16).columns, 12);
    EXPECT_EQ(blockGridFor(480, 640, 16).rows, 16);
    EXPECT_EQ(blockGridFor(4000, 2, 16).rows, 1);
    EXPECT_EQ(blockGridFor(0, 480, 16).columns, 0);
}

// A grid whose value at global point (r, c) is f(r, c).
void fillGrid(float (&grid)[kGridPoints], const std::function<float(int, int)>& f) {
    for (int r = 0; r < 10; ++r)
        for (int c = 0; c < 10; ++c)
            grid[r * 10 + c] = f(r, c);
}

const double kDefaultFractions[4] = {0.25, 0.5, 0.25, 0.5};

TEST(GainSurface, ConstantGridGivesThatGainEverywhere) {
    float grid[kGridPoints];
    fillGrid(grid, [](int, int) { return 1.5f; });
    const GainSurface surface = sampleGainSurface(grid, 640, 480, kDefaultFractions, 8, 6);
    ASSERT_EQ(surface.gain.size(), 48u);
    for (float gain : surface.gain)
        EXPECT_FLOAT_EQ(gain, 1.5f);
    EXPECT_FLOAT_EQ(surface.minimum, 1.5f);
    EXPECT_FLOAT_EQ(surface.maximum, 1.5f);
}

TEST(GainSurface, SamplesCellCentresWithTheCorrectionsPatchChoice) {
    float grid[kGridPoints];
    fillGrid(grid, [](int r, int c) {
        return 1.0f + 0.1f * static_cast<float>(r) + 0.01f * static_cast<float>(c);
    });
    const GainSurface surface = sampleGainSurface(grid, 1000, 800, kDefaultFractions, 4, 2);
    // Cell (column 1, row 0) has its centre at pixel (375, 200): centre patch
    // column with u = 125 / 500, top patch row with v = 0.
    const float expected = evalPatch(grid, patchStart(1, 1), 125.0f / 500.0f, 0.0f);
    EXPECT_FLOAT_EQ(surface.gain[1], expected);
    const PatchBreakpoints breaks = patchBreakpoints(1000, 800, 0.25, 0.5, 0.25, 0.5);
    EXPECT_FLOAT_EQ(gainAt(grid, breaks, 375, 200), expected);
}

TEST(GainSurface, ExtremesIncludeTheImageCorners) {
    // Only the bottom-right control point is raised: the largest gain is in
    // the last pixel, never at a cell centre.
    float grid[kGridPoints];
    fillGrid(grid, [](int r, int c) { return r == 9 && c == 9 ? 3.0f : 1.0f; });
    const GainSurface surface = sampleGainSurface(grid, 640, 480, kDefaultFractions, 4, 3);
    const PatchBreakpoints breaks = patchBreakpoints(640, 480, 0.25, 0.5, 0.25, 0.5);
    EXPECT_FLOAT_EQ(surface.maximum, gainAt(grid, breaks, 639, 479));
    EXPECT_GT(surface.maximum, 2.9f);
    EXPECT_FLOAT_EQ(surface.minimum, 1.0f);
}

TEST(GainSurface, RefusesUnusableGeometryAndEmptyGrids) {
    float grid[kGridPoints];
    fillGrid(grid, [](int, int) { return 1.0f; });
    const double squeezed[4] = {0.0, 0.5, 0.25, 0.5};
    EXPECT_THROW(sampleGainSurface(grid, 640, 480, squeezed, 4, 3), std::runtime_error);
    EXPECT_EQ(expectThrowText([&] { sampleGainSurface(grid, 640, 480, kDefaultFractions, 0, 3); }),
              "The report's block grid needs at least one block.");
    EXPECT_EQ(expectThrowText([&] { sampleGainSurface(grid, 0, 480, kDefaultFractions, 4, 3); }),
              "The report needs a Bayer image of at least 2 x 2 float samples.");
}

} // namespace
} // namespace report

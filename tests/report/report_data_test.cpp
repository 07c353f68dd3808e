// What the calibration report computes (block means of a Bayer image, gain
// surfaces sampled from control grids) and the pieces of its page that the
// kept pages do not reach: escaping of every kind of broken text, number
// formats and the colour scale's ends.

#include <cmath>
#include <functional>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "lsc/eval_patch.h"
#include "report/report_data.h"
#include "report/report_svg.h"
#include "report/report_text.h"
#include "tests/lsc/test_helpers.h"

namespace report {
namespace {

using img::BayerImage;
using lsc::kGridPoints;

BayerImage mosaic(int width, int height, std::uint32_t cfa,
                  const std::function<float(int, int)>& value) {
    BayerImage image;
    lsc_test::makeImage(image, width, height, cfa, value);
    return image;
}

const char* const kNoImage = "The report needs a Bayer image of at least 2 x 2 float samples.";
const char* const kNoBlocks = "The report's block grid needs at least one block.";

TEST(BlockMeans, SortsPixelsIntoChannelsByBayerOrder) {
    for (const lsc_test::Order& order : lsc_test::kOrders) {
        // The 2 x 2 cell holds the channel numbers 1..4 (red 1 ... blue 4).
        const ChannelBlockMeans means = blockMeans(
            mosaic(12, 8, order.cfa,
                   [&](int x, int y) {
                       return 1.0f + static_cast<float>(order.channelAt[(y & 1) * 2 + (x & 1)]);
                   }),
            3, 2);
        ASSERT_EQ(means.columns * means.rows, 6);
        for (int k = 0; k < lsc::kChannels; ++k)
            EXPECT_EQ(means.mean[k], std::vector<float>(6, static_cast<float>(k + 1)))
                << order.name;
    }
}

TEST(BlockMeans, DealsCellsToBlocksInOrderAndLeavesOutAnOddLastRowAndColumn) {
    // Red is the cell column (green 0); column 10 and row 2 hold 100 and do not count.
    const auto red = [](int x, int y) {
        return x == 10 || y == 2 ? 100.0f : (x + y) % 2 ? 0.0f : static_cast<float>(x / 2);
    };
    EXPECT_EQ(blockMeans(mosaic(11, 3, img::kCfaRggb, red), 2, 1).mean[0],
              (std::vector<float>{1.0f, 3.5f})); // cells 0..2 and 3..4
    const auto wider = [](int x, int y) { return (x + y) % 2 ? 0.0f : static_cast<float>(x / 2); };
    EXPECT_EQ(blockMeans(mosaic(12, 2, img::kCfaRggb, wider), 2, 1).mean[0],
              (std::vector<float>{1.0f, 4.0f})); // cells 0..2 and 3..5
    const ChannelBlockMeans coarse =
        blockMeans(mosaic(6, 4, img::kCfaRggb, [](int, int) { return 0.5f; }), 10, 10);
    EXPECT_EQ(coarse.columns, 3); // never finer than the cells
    EXPECT_EQ(coarse.rows, 2);
}

TEST(BlockMeans, ScaledToPeakAndDeviationFromTheMean) {
    ChannelBlockMeans means;
    means.columns = 4;
    means.rows = 1;
    means.mean[0] = {0.3f, 0.6f, 0.5f, 0.05f}; // below the black level: 0
    means.mean[1] = {0.0f, 0.0f, 0.0f, 0.0f};  // no signal: no division
    scaleToPeak(means, 0.1f);
    const float scaled[4] = {0.4f, 1.0f, 0.8f, 0.0f};
    for (int i = 0; i < 4; ++i)
        EXPECT_NEAR(means.mean[0][static_cast<std::size_t>(i)], scaled[i], 1e-6) << i;
    EXPECT_EQ(means.mean[1], (std::vector<float>{0.0f, 0.0f, 0.0f, 0.0f}));
    means.mean[2] = {0.9f, 1.1f, 1.0f, 1.2f};
    deviationFromMean(means); // mean 1.05
    EXPECT_NEAR(means.mean[2][0], -0.15f / 1.05f, 1e-6);
    EXPECT_NEAR(largestAbsolute(means.mean[2]), 0.15f / 1.05f, 1e-6);
    const ValueRange range = channelRange(means, 2);
    EXPECT_NEAR(range.minimum, -0.15f / 1.05f, 1e-6);
    EXPECT_NEAR(range.maximum, 0.15f / 1.05f, 1e-6);
}

TEST(BlockGridFor, KeepsBlocksAboutSquareOnEitherOrientation) {
    const int cases[][5] = {{640, 480, 16, 16, 12},
                            {480, 640, 16, 12, 16},
                            {480, 480, 8, 8, 8},
                            {4000, 2, 16, 16, 1},
                            {0, 480, 16, 0, 0}};
    for (const auto& c : cases) {
        const BlockGrid grid = blockGridFor(c[0], c[1], c[2]);
        EXPECT_EQ(grid.columns, c[3]) << c[0] << " x " << c[1];
        if (c[0] > 0) {
            EXPECT_EQ(grid.rows, c[4]) << c[0] << " x " << c[1];
        }
    }
}

const double kDefaultFractions[4] = {0.25, 0.5, 0.25, 0.5};

TEST(GainSurface, SamplesCellCentresAndTheImageCorners) {
    float grid[kGridPoints];
    for (int i = 0; i < kGridPoints; ++i)
        grid[i] = 1.0f + 0.1f * static_cast<float>(i / 10) + 0.01f * static_cast<float>(i % 10);
    const GainSurface surface = sampleGainSurface(grid, 1000, 800, kDefaultFractions, 4, 2);
    ASSERT_EQ(surface.gain.size(), 8u);
    // Cell (column 1, row 0) has its centre at pixel (375, 200): centre patch
    // column with u = 125 / 500, top patch row with v = 0.
    EXPECT_FLOAT_EQ(surface.gain[1], lsc::evalPatch(grid, lsc::patchStart(1, 1), 0.25f, 0.0f));
    const lsc::PatchBreakpoints breaks = lsc::patchBreakpoints(1000, 800, 0.25, 0.5, 0.25, 0.5);
    EXPECT_FLOAT_EQ(gainAt(grid, breaks, 375, 200), surface.gain[1]);
    // The extremes are the image corners, never a cell centre.
    EXPECT_FLOAT_EQ(surface.minimum, 1.0f);
    EXPECT_FLOAT_EQ(surface.maximum, gainAt(grid, breaks, 999, 799));
    EXPECT_GT(surface.maximum, 1.98f);
}

TEST(ReportData, RefusesImagesWithoutAWholeCellEmptyGridsAndUnusableGeometry) {
    float grid[kGridPoints] = {};
    const double squeezed[4] = {0.0, 0.5, 0.25, 0.5};
    const auto flat = [](int width, int height) {
        return mosaic(width, height, img::kCfaRggb, [](int, int) { return 1.0f; });
    };
    const std::pair<std::function<void()>, std::string> cases[] = {
        {[] { blockMeans(BayerImage(), 2, 2); }, kNoImage},
        {[&] { blockMeans(flat(1, 8), 2, 2); }, kNoImage},
        {[&] { blockMeans(flat(4, 4), 0, 2); }, kNoBlocks},
        {[&] { sampleGainSurface(grid, 640, 480, kDefaultFractions, 0, 3); }, kNoBlocks},
        {[&] { sampleGainSurface(grid, 0, 480, kDefaultFractions, 4, 3); }, kNoImage},
        {[&] { sampleGainSurface(grid, 640, 480, squeezed, 4, 3); },
         "Patch geometry leaves a patch without pixels: the patch factors (or patch sizes) must "
         "give left and top patches of at least one pixel and leave room for the right and bottom "
         "patches."}};
    for (const auto& [call, error] : cases)
        EXPECT_EQ(lsc_test::runtimeError(call), error);
}

const std::string kBad = "\xEF\xBF\xBD"; // U+FFFD

TEST(ReportText, EscapesMarkupKeepsUtf8AndReplacesBrokenBytes) {
    const std::pair<std::string, std::string> cases[] = {
        {"a<b>&\"c'd", "a&lt;b&gt;&amp;&quot;c&#39;d"},
        {"Gr\xC3\xBC\xC3\x9F"
         "e\t1\n2",
         "Gr\xC3\xBC\xC3\x9F"
         "e\t1\n2"},
        {"\xF0\x9F\x93\xB7", "\xF0\x9F\x93\xB7"}, // four bytes
        {"\xC2\xB1\xDF\xBF", "\xC2\xB1\xDF\xBF"}, // the ends of the two-byte leads
        {"a\xFF"
         "b",
         "a" + kBad + "b"},
        {"a\x01\x7F"
         "b",
         "a" + kBad + kBad + "b"},
        {"\xC0\xAF", kBad + kBad},            // overlong '/'
        {"\xED\xA0\x80", kBad + kBad + kBad}, // surrogate
        {"end\xE2\x82", "end" + kBad + kBad}, // cut short
    };
    for (const auto& [text, escaped] : cases)
        EXPECT_EQ(htmlEscape(text), escaped) << text;
}

TEST(ReportText, FormatsNumbersAsTheMessageStreamPrintsThem) {
    EXPECT_EQ(formatGeneral(0.0333f, 3), "0.0333");
    EXPECT_EQ(formatGeneral(1.0f, 3), "1");
    EXPECT_EQ(formatGeneral(1234.5, 3), "1.23e+03");
    EXPECT_EQ(formatGeneral(10.0f, 6), "10");
    EXPECT_EQ(formatFixed(0.6612903f, 6), "0.661290");
    EXPECT_EQ(formatFixed(1234.5, 2), "1234.50");
}

TEST(ColourScale, StepsSpanTheScaleAndClampOutsideIt) {
    const ColourScale scale{ScaleKind::Sequential, 1.0, 2.0};
    const ColourScale flat{ScaleKind::Sequential, 1.0, 1.0}; // its value in the middle
    const std::pair<double, int> cases[] = {{1.0, 0}, {1.5, 32}, {2.0, 63}, {-7.0, 0}, {9.0, 63}};
    for (const auto& [value, step] : cases)
        EXPECT_EQ(colourStep(scale, value), step) << value;
    EXPECT_EQ(colourStep(scale, std::nan("")), -1);
    EXPECT_EQ(stepColour(ScaleKind::Sequential, -1), "#bdbdbd");
    EXPECT_EQ(colourStep(flat, 1.0), 32);
    EXPECT_EQ(colourStep(flat, 0.5), 0);
    EXPECT_EQ(colourStep(flat, 1.5), 63);
    EXPECT_EQ(svgNumber(0.125), "0.13");
    EXPECT_EQ(svgNumber(-0.001), "0");
    EXPECT_EQ(svgNumber(std::nan("")), "0");
}

} // namespace
} // namespace report

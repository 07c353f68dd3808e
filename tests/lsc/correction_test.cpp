// Applying the correction: per-pixel gains of each channel's surface, the
// reduced output, refusals and the X-test surface.

#include <algorithm>
#include <cstdio>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "lsc/lens_shading_correction.h"
#include "lsc/xtest_surface.h"
#include "test_helpers.h"

namespace lsc {
namespace {

using lsc_test::kOrders;
using lsc_test::makeImage;

float ramp(int x, int y) {
    return 0.001f * static_cast<float>(y * 1000 + x);
}

struct Correction {
    img::BayerImage image, corrected;
    ShadingCorrection correction;
    float blackLevel = 0.0f;
    unsigned step = 1;

    Correction(int width, int height, std::uint32_t cfa, float (*value)(int, int),
               float gain = 1.0f) {
        makeImage(image, width, height, cfa, value, 12);
        for (auto& grid : correction.controlGrids)
            std::fill(grid, grid + kGridPoints, gain);
    }
    // The error text, or "" with the corrected image in `corrected`.
    std::string apply() {
        return lsc_test::runtimeError(
            [&] { corrected = applyLensShading(image, correction, blackLevel, step); });
    }
    float at(int x, int y) const { return corrected.pixels()[y * corrected.width() + x]; }
};

TEST(Correction, StepReducesTheImageBlockByBlock) {
    Correction run(40, 32, img::kCfaRggb, ramp);
    run.step = 2;
    ASSERT_EQ(run.apply(), "");
    ASSERT_EQ(run.corrected.width() * 100 + run.corrected.height(), 2016);
    // Output (2, 0) is input (4, 0): the first pixel of input block 2; (3, 1) is (5, 1).
    const int cases[][4] = {{2, 0, 4, 0}, {3, 1, 5, 1}, {19, 15, 37, 29}};
    for (const auto& c : cases)
        EXPECT_NEAR(run.at(c[0], c[1]), ramp(c[2], c[3]), 1e-5f) << c[0] << ", " << c[1];
}

// Each pixel less the black level times its channel's gain (grid k holds
// k + 1); the odd last row and column are dropped.
TEST(Correction, EachPixelUsesItsChannelsGridInEveryBayerOrder) {
    for (const lsc_test::Order& order : kOrders) {
        Correction run(5, 5, order.cfa, ramp);
        run.blackLevel = 0.25f;
        for (int k = 0; k < 4; ++k)
            std::fill(run.correction.controlGrids[k], run.correction.controlGrids[k] + kGridPoints,
                      static_cast<float>(k + 1));
        ASSERT_EQ(run.apply(), "");
        EXPECT_EQ(run.corrected.width() * 10 + run.corrected.height(), 44);
        EXPECT_EQ(run.corrected.cfa(), order.cfa);
        EXPECT_EQ(run.corrected.bitsPerSample(), 12);
        EXPECT_EQ(run.corrected.buffer()->dataType, static_cast<std::uint32_t>(img::kDataReal32));
        for (int y = 0; y < 4; ++y)
            for (int x = 0; x < 4; ++x)
                EXPECT_NEAR(run.at(x, y),
                            (ramp(x, y) - 0.25f) *
                                static_cast<float>(order.channelAt[(y & 1) * 2 + (x & 1)] + 1),
                            1e-5f)
                    << order.name << " " << x << ", " << y;
    }
}

TEST(Correction, GainFollowsThePatchSurface) {
    Correction run(
        40, 40, img::kCfaRggb, [](int, int) { return 1.0f; }, 0.0f);
    // Red gain rising with the global column index: 1 + column / 9 at the grid points.
    for (int i = 0; i < 100; ++i)
        run.correction.controlGrids[0][i] = 1.0f + static_cast<float>(i % 10) / 9.0f;
    ASSERT_EQ(run.apply(), "");
    EXPECT_NEAR(run.at(0, 0), 1.0f, 1e-6f);                // left edge
    EXPECT_NEAR(run.at(10, 0), 1.0f + 3.0f / 9.0f, 1e-6f); // x = L = 10: first centre point
    EXPECT_NEAR(run.at(20, 0), 1.0f + 4.5f / 9.0f, 1e-5f); // halfway through the centre patch
    EXPECT_EQ(run.at(1, 0), 0.0f);                         // green/red keeps its zero grid
}

TEST(Correction, RefusesWhatItCannotCorrect) {
    const std::string tooSmall = "Image is too small to correct: width and height must be at "
                                 "least twice apply_lsc.sampling_factor.";
    const struct {
        int width, height;
        unsigned step;
        double top;
        std::string error;
    } cases[] = {{7, 40, 4, 0.25, tooSmall},
                 {1, 1, 1, 0.25, tooSmall},
                 {8, 8, 0, 0.25, "apply_lsc.sampling_factor must be at least 1."},
                 {64, 64, 1, 0.0,
                  "Patch geometry leaves a patch without pixels: the patch factors (or patch "
                  "sizes) must give left and top patches of at least one pixel and leave room for "
                  "the right and bottom patches."}};
    for (const auto& c : cases) {
        Correction run(c.width, c.height, img::kCfaRggb, ramp);
        run.step = c.step;
        run.correction.layout.top = c.top;
        EXPECT_EQ(run.apply(), c.error) << c.width << " x " << c.height;
        EXPECT_TRUE(run.corrected.empty());
    }
    Correction none(2, 2, img::kCfaRggb, ramp);
    none.image = img::BayerImage();
    EXPECT_EQ(none.apply(), "No image to process for lens shading.");
}

TEST(XTestSurface, GridsAreTheKeptOnes) {
    ShadingCorrection correction;
    applyXTestSurface(correction);
    std::string text;
    char line[32];
    for (int k = 0; k < kChannels; ++k)
        for (int i = 0; i < kGridPoints; ++i) {
            std::snprintf(line, sizeof line, "%.9g%c",
                          static_cast<double>(correction.controlGrids[k][i]),
                          i % 10 == 9 ? '\n' : ' ');
            text += line;
        }
    lsc_test::expectGolden("lsc/xtest_surface.txt", text);
}

} // namespace
} // namespace lsc

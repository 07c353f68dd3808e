#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "lsc/lens_shading_correction.h"
#include "lsc_test_image.h"

namespace lsc {

using img::BayerImage;
using img::kCfaBggr;
using img::kCfaGbrg;
using img::kCfaGrbg;
using img::kCfaRggb;
using img::kDataReal32;
namespace {

using lsc_test::makeImage;

float ramp(int x, int y) {
    return 0.001f * static_cast<float>(y * 1000 + x);
}

// The correction's inputs and its result.
struct Correction {
    BayerImage image, corrected;
    ShadingCorrection correction;
    float blackLevel = 0.0f;
    unsigned applyStep = 1;
};

void apply(Correction& run) {
    run.corrected = applyLensShading(run.image, run.correction, run.blackLevel, run.applyStep);
}

void setGrids(Correction& run, const float gains[4]) {
    for (int k = 0; k < 4; ++k)
        for (float& g : run.correction.controlGrids[k])
            g = gains[k];
}

const float kOnes[4] = {1, 1, 1, 1};

std::string refusal(Correction& run) {
    try {
        apply(run);
    } catch (const std::runtime_error& e) {
        return e.what();
    }
    return "no exception";
}

TEST(LensShadingCorrection, UnitGainsLeaveTheInputMinusTheBlackLevel) {
    Correction run;
    makeImage(run.image, 4, 4, kCfaGbrg, ramp, 12);
    setGrids(run, kOnes);
    run.blackLevel = 0.25f;
    apply(run);
    ASSERT_FALSE(run.corrected.empty());
    EXPECT_EQ(run.corrected.width(), 4);
    EXPECT_EQ(run.corrected.height(), 4);
    EXPECT_EQ(run.corrected.cfa(), kCfaGbrg);
    EXPECT_EQ(run.corrected.bitsPerSample(), 12);
    EXPECT_EQ(run.corrected.buffer()->dataType, static_cast<std::uint32_t>(kDataReal32));
    for (int y = 0; y < 4; ++y)
        for (int x = 0; x < 4; ++x)
            EXPECT_NEAR(run.corrected.pixels()[y * 4 + x], ramp(x, y) - 0.25f, 1e-6f);
}

TEST(LensShadingCorrection, OddSizesDropTheLastRowAndColumn) {
    Correction run;
    makeImage(run.image, 5, 5, kCfaRggb, ramp);
    setGrids(run, kOnes);
    apply(run);
    EXPECT_EQ(run.corrected.width(), 4);
    EXPECT_EQ(run.corrected.height(), 4);
    EXPECT_NEAR(run.corrected.pixels()[15], ramp(3, 3), 1e-6f);
}

TEST(LensShadingCorrection, StepReducesTheImageBlockByBlock) {
    Correction run;
    makeImage(run.image, 1000, 800, kCfaRggb, ramp);
    setGrids(run, kOnes);
    run.applyStep = 2;
    apply(run);
    ASSERT_EQ(run.corrected.width(), 500);
    ASSERT_EQ(run.corrected.height(), 400);
    const float* out = run.corrected.pixels();
    // Output block (2, 0) is input block (4, 0); output (3, 1) is input (5, 1).
    EXPECT_NEAR(out[2], ramp(4, 0), 1e-4f);
    EXPECT_NEAR(out[1 * 500 + 3], ramp(5, 1), 1e-4f);
    EXPECT_NEAR(out[399 * 500 + 499], ramp(997, 797), 1e-3f);
}

class CorrectionChannels : public ::testing::TestWithParam<std::uint32_t> {};

TEST_P(CorrectionChannels, EachPixelUsesItsChannelsGrid) {
    Correction run;
    makeImage(run.image, 8, 6, GetParam(), [](int, int) { return 0.5f; });
    const float gains[4] = {1, 2, 3, 4};
    setGrids(run, gains);
    apply(run);
    const int phase = GetParam() == kCfaGrbg   ? 1
                      : GetParam() == kCfaGbrg ? 2
                      : GetParam() == kCfaBggr ? 3
                                               : 0;
    for (int y = 0; y < 6; ++y)
        for (int x = 0; x < 8; ++x) {
            const int k = ((x + phase) & 1) + ((y + (phase >> 1)) & 1) * 2;
            EXPECT_NEAR(run.corrected.pixels()[y * 8 + x], 0.5f * gains[k], 1e-5f);
        }
}

INSTANTIATE_TEST_SUITE_P(BayerOrders, CorrectionChannels,
                         ::testing::Values(kCfaRggb, kCfaGrbg, kCfaGbrg, kCfaBggr));

TEST(LensShadingCorrection, GainFollowsThePatchSurface) {
    Correction run;
    makeImage(run.image, 40, 40, kCfaRggb, [](int, int) { return 1.0f; });
    // Red gain rising with the global column index: 1 + column / 9 at the grid points.
    for (int i = 0; i < 100; ++i)
        run.correction.controlGrids[0][i] = 1.0f + static_cast<float>(i % 10) / 9.0f;
    apply(run);
    const float* out = run.corrected.pixels();
    EXPECT_NEAR(out[0], 1.0f, 1e-6f);                // x = 0: left edge
    EXPECT_NEAR(out[10], 1.0f + 3.0f / 9.0f, 1e-6f); // x = L = 10: first centre point
    EXPECT_NEAR(out[20], 1.0f + 4.5f / 9.0f, 1e-5f); // x = 20: halfway through the centre patch
    EXPECT_EQ(out[1], 0.0f);                         // green/red keeps its zero grid
}

TEST(LensShadingCorrection, RefusesImagesSmallerThanTwoSteps) {
    Correction run;
    makeImage(run.image, 7, 40, kCfaRggb, ramp);
    run.applyStep = 4;
    EXPECT_EQ(refusal(run), "Image is too small to correct: width and height must be at "
                            "least twice apply_lsc.sampling_factor.");
    EXPECT_TRUE(run.corrected.empty());
    makeImage(run.image, 1, 1, kCfaRggb, ramp);
    run.applyStep = 1;
    EXPECT_EQ(refusal(run), "Image is too small to correct: width and height must be at "
                            "least twice apply_lsc.sampling_factor.");
}

TEST(LensShadingCorrection, RefusesAStepOfZero) {
    Correction run;
    makeImage(run.image, 8, 8, kCfaRggb, ramp);
    run.applyStep = 0;
    EXPECT_EQ(refusal(run), "apply_lsc.sampling_factor must be at least 1.");
}

TEST(LensShadingCorrection, RefusesAPatchWithoutPixels) {
    Correction run;
    makeImage(run.image, 64, 64, kCfaRggb, ramp);
    run.correction.layout.top = 0.0;
    EXPECT_EQ(refusal(run),
              "Patch geometry leaves a patch without pixels: the patch factors (or patch sizes) "
              "must give left and top patches of at least one pixel and leave room for the right "
              "and bottom patches.");
}

TEST(LensShadingCorrection, RefusesAMissingImage) {
    Correction run;
    EXPECT_EQ(refusal(run), "No image to process for lens shading.");
}

} // namespace
} // namespace lsc

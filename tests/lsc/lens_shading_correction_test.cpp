#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "lsc/lens_shading_correction.h"
#include "lsc_test_image.h"

namespace {

using lsc_test::makeImage;

float ramp(int x, int y) {
    return 0.001f * static_cast<float>(y * 1000 + x);
}

void setGrids(ProcessingContext& context, const float gains[4]) {
    for (int k = 0; k < 4; ++k)
        for (float& g : context.controlGrids[k])
            g = gains[k];
}

const float kOnes[4] = {1, 1, 1, 1};

std::string refusal(ProcessingContext& context) {
    try {
        applyLensShading(context);
    } catch (const std::runtime_error& e) {
        return e.what();
    }
    return "no exception";
}

TEST(LensShadingCorrection, UnitGainsLeaveTheInputMinusTheBlackLevel) {
    ProcessingContext context;
    makeImage(context, 4, 4, kCfaGbrg, ramp, 12);
    setGrids(context, kOnes);
    context.blackLevel = 0.25f;
    applyLensShading(context);
    ASSERT_FALSE(context.corrected.empty());
    EXPECT_EQ(context.corrected.width(), 4);
    EXPECT_EQ(context.corrected.height(), 4);
    EXPECT_EQ(context.corrected.cfa(), kCfaGbrg);
    EXPECT_EQ(context.corrected.bitsPerSample(), 12);
    EXPECT_EQ(context.corrected.buffer()->dataType, static_cast<std::uint32_t>(kDataReal32));
    for (int y = 0; y < 4; ++y)
        for (int x = 0; x < 4; ++x)
            EXPECT_NEAR(context.corrected.pixels()[y * 4 + x], ramp(x, y) - 0.25f, 1e-6f);
}

TEST(LensShadingCorrection, OddSizesDropTheLastRowAndColumn) {
    ProcessingContext context;
    makeImage(context, 5, 5, kCfaRggb, ramp);
    setGrids(context, kOnes);
    applyLensShading(context);
    EXPECT_EQ(context.corrected.width(), 4);
    EXPECT_EQ(context.corrected.height(), 4);
    EXPECT_NEAR(context.corrected.pixels()[15], ramp(3, 3), 1e-6f);
}

TEST(LensShadingCorrection, StepReducesTheImageBlockByBlock) {
    ProcessingContext context;
    makeImage(context, 1000, 800, kCfaRggb, ramp);
    setGrids(context, kOnes);
    context.applyStep = 2;
    applyLensShading(context);
    ASSERT_EQ(context.corrected.width(), 500);
    ASSERT_EQ(context.corrected.height(), 400);
    const float* out = context.corrected.pixels();
    // Output block (2, 0) is input block (4, 0); output (3, 1) is input (5, 1).
    EXPECT_NEAR(out[2], ramp(4, 0), 1e-4f);
    EXPECT_NEAR(out[1 * 500 + 3], ramp(5, 1), 1e-4f);
    EXPECT_NEAR(out[399 * 500 + 499], ramp(997, 797), 1e-3f);
}

class CorrectionChannels : public ::testing::TestWithParam<std::uint32_t> {};

TEST_P(CorrectionChannels, EachPixelUsesItsChannelsGrid) {
    ProcessingContext context;
    makeImage(context, 8, 6, GetParam(), [](int, int) { return 0.5f; });
    const float gains[4] = {1, 2, 3, 4};
    setGrids(context, gains);
    applyLensShading(context);
    const int phase = GetParam() == kCfaGrbg   ? 1
                      : GetParam() == kCfaGbrg ? 2
                      : GetParam() == kCfaBggr ? 3
                                               : 0;
    for (int y = 0; y < 6; ++y)
        for (int x = 0; x < 8; ++x) {
            const int k = ((x + phase) & 1) + ((y + (phase >> 1)) & 1) * 2;
            EXPECT_NEAR(context.corrected.pixels()[y * 8 + x], 0.5f * gains[k], 1e-5f);
        }
}

INSTANTIATE_TEST_SUITE_P(BayerOrders, CorrectionChannels,
                         ::testing::Values(kCfaRggb, kCfaGrbg, kCfaGbrg, kCfaBggr));

TEST(LensShadingCorrection, GainFollowsThePatchSurface) {
    ProcessingContext context;
    makeImage(context, 40, 40, kCfaRggb, [](int, int) { return 1.0f; });
    // Red gain rising with the global column index: 1 + column / 9 at the grid points.
    for (int i = 0; i < 100; ++i)
        context.controlGrids[0][i] = 1.0f + static_cast<float>(i % 10) / 9.0f;
    applyLensShading(context);
    const float* out = context.corrected.pixels();
    EXPECT_NEAR(out[0], 1.0f, 1e-6f);                // x = 0: left edge
    EXPECT_NEAR(out[10], 1.0f + 3.0f / 9.0f, 1e-6f); // x = L = 10: first centre point
    EXPECT_NEAR(out[20], 1.0f + 4.5f / 9.0f, 1e-5f); // x = 20: halfway through the centre patch
    EXPECT_EQ(out[1], 0.0f);                         // green/red keeps its zero grid
}

TEST(LensShadingCorrection, RefusesImagesSmallerThanTwoSteps) {
    ProcessingContext context;
    makeImage(context, 7, 40, kCfaRggb, ramp);
    context.applyStep = 4;
    EXPECT_EQ(refusal(context), "Image is too small to correct: width and height must be at "
                                "least twice apply_lsc.sampling_factor.");
    EXPECT_TRUE(context.corrected.empty());
    makeImage(context, 1, 1, kCfaRggb, ramp);
    context.applyStep = 1;
    EXPECT_EQ(refusal(context), "Image is too small to correct: width and height must be at "
                                "least twice apply_lsc.sampling_factor.");
}

TEST(LensShadingCorrection, RefusesAStepOfZero) {
    ProcessingContext context;
    makeImage(context, 8, 8, kCfaRggb, ramp);
    context.applyStep = 0;
    EXPECT_EQ(refusal(context), "apply_lsc.sampling_factor must be at least 1.");
}

TEST(LensShadingCorrection, RefusesAPatchWithoutPixels) {
    ProcessingContext context;
    makeImage(context, 64, 64, kCfaRggb, ramp);
    context.topFraction = 0.0;
    EXPECT_EQ(refusal(context),
              "Patch geometry leaves a patch without pixels: the patch factors (or patch sizes) "
              "must give left and top patches of at least one pixel and leave room for the right "
              "and bottom patches.");
}

TEST(LensShadingCorrection, RefusesAMissingImage) {
    ProcessingContext context;
    EXPECT_EQ(refusal(context), "No image to process for lens shading.");
}

} // namespace

#include <cmath>
#include <limits>
#include <stdexcept>

#include <gtest/gtest.h>

#include "prep/delta_ab.h"
#include "test_images.h"

using prep_test::makeImage;

namespace {

constexpr float kGamma = 0.45454544f;

ProcessingContext greyContext(std::int32_t width, std::int32_t height, int columns, int rows) {
    ProcessingContext context;
    context.corrected = makeImage(width, height, 1, kCfaRggb);
    prep_test::fill(context.corrected, 0.5f);
    context.deltaAbBlocks[0] = columns;
    context.deltaAbBlocks[1] = rows;
    return context;
}

// Makes the RGB pixel (px, py) of an RGGB image reddish.
void tint(ProcessingContext& context, int px, int py) {
    context.corrected.pixels()[(2 * py) * context.corrected.width() + 2 * px] = 0.9f;
}

std::string evaluationError(ProcessingContext& context) {
    try {
        prep::evaluateDeltaAb(context);
    } catch (const std::runtime_error& e) {
        return e.what();
    }
    return "(no error)";
}

TEST(DeltaAb, GreyImageHasNoColourError) {
    ProcessingContext context = greyContext(64, 48, 4, 3);
    prep::evaluateDeltaAb(context);
    ASSERT_EQ(context.deltaImage.size(), 12u);
    for (float delta : context.deltaImage)
        EXPECT_EQ(delta, 0.0f);
    EXPECT_EQ(context.maxDelta, 0.0f);
    EXPECT_EQ(context.deltaStdDev, 0.0f);
    EXPECT_LT(context.meanChroma, 0.1f);
}

TEST(DeltaAb, NormalisesGreenPeakToLumaFactor) {
    ProcessingContext context = greyContext(8, 8, 1, 1);
    prep::evaluateDeltaAb(context);
    for (float v : prep_test::samplesOf(context.corrected))
        EXPECT_FLOAT_EQ(v, 0.75f);
}

TEST(DeltaAb, WritesEncodedColoursBackByPosition) {
    ProcessingContext context;
    context.corrected = makeImage(2, 2, 1, kCfaGbrg); // G B / R G
    const float mosaic[4] = {0.4f, 0.25f, 0.5f, 0.2f};
    std::copy(mosaic, mosaic + 4, context.corrected.pixels());
    context.deltaAbBlocks[0] = context.deltaAbBlocks[1] = 1;
    prep::evaluateDeltaAb(context);
    const float green = std::pow((0.4f + 0.2f) * 0.5f, kGamma);
    const float scale = 0.75f / green;
    const float* out = context.corrected.pixels();
    EXPECT_FLOAT_EQ(out[0], green * scale);
    EXPECT_FLOAT_EQ(out[3], green * scale);
    EXPECT_FLOAT_EQ(out[1], std::pow(0.25f, kGamma) * scale);
    EXPECT_FLOAT_EQ(out[2], std::pow(0.5f, kGamma) * scale);
}

TEST(DeltaAb, ColourMatrixTakesRowVector) {
    ProcessingContext context = greyContext(2, 2, 1, 1);
    const float matrix[3][3] = {{0, 1, 0}, {0, 0, 0}, {0, 0, 1}}; // red feeds green only
    for (int r = 0; r < 3; ++r)
        for (int c = 0; c < 3; ++c)
            context.ccm[r][c] = matrix[r][c];
    prep::evaluateDeltaAb(context);
    const float* out = context.corrected.pixels();
    EXPECT_EQ(out[0], 0.0f);        // red position: nothing feeds out 0
    EXPECT_FLOAT_EQ(out[1], 0.75f); // green: the red sample, normalised
    EXPECT_GT(out[3], 0.0f);        // blue passes through
}

TEST(DeltaAb, NegativeColoursClipToZero) {
    ProcessingContext context = greyContext(2, 2, 1, 1);
    context.ccm[0][0] = -1.0f;
    prep::evaluateDeltaAb(context);
    EXPECT_EQ(context.corrected.pixels()[0], 0.0f);
}

TEST(DeltaAb, DefaultGridOnVgaUsesSixteenPixelBlocks) {
    ProcessingContext context = greyContext(640, 480, 20, 15);
    for (int py = 16; py < 32; ++py)
        for (int px = 16; px < 32; ++px)
            tint(context, px, py); // exactly block (1, 1)
    prep::evaluateDeltaAb(context);
    ASSERT_EQ(context.deltaImage.size(), 300u);
    const float tinted = context.deltaImage[1 * 20 + 1];
    EXPECT_EQ(context.maxDelta, tinted);
    EXPECT_GT(tinted, 1.0f);
    // All other blocks are alike.
    EXPECT_EQ(context.deltaImage[0], context.deltaImage[2]);
    EXPECT_EQ(context.deltaImage[0], context.deltaImage[299]);
    EXPECT_LT(context.deltaImage[0], tinted / 100);
}

TEST(DeltaAb, PixelsBeyondLastWholeBlockAreIgnored) {
    // RGB image 10 x 4 with 3 x 1 blocks of 3 x 4: column 9 belongs to none.
    ProcessingContext context = greyContext(20, 8, 3, 1);
    for (int py = 0; py < 4; ++py)
        tint(context, 9, py);
    prep::evaluateDeltaAb(context);
    for (float delta : context.deltaImage)
        EXPECT_EQ(delta, 0.0f);

    ProcessingContext inside = greyContext(20, 8, 3, 1);
    tint(inside, 8, 0);
    prep::evaluateDeltaAb(inside);
    EXPECT_EQ(inside.maxDelta, inside.deltaImage[2]);
    EXPECT_GT(inside.maxDelta, 0.0f);
}

TEST(DeltaAb, StatisticsOverBlocks) {
    ProcessingContext context = greyContext(4, 2, 2, 1);
    tint(context, 1, 0);
    prep::evaluateDeltaAb(context);
    // Two blocks symmetric about their mean: equal deltas, no spread.
    EXPECT_FLOAT_EQ(context.deltaImage[0], context.deltaImage[1]);
    EXPECT_EQ(context.maxDelta, std::max(context.deltaImage[0], context.deltaImage[1]));
    EXPECT_NEAR(context.deltaStdDev, 0.0f, 1e-4f);
    EXPECT_GT(context.meanChroma, 0.0f);
}

TEST(DeltaAb, NotANumberBlockGivesNotANumberMaximum) {
    ProcessingContext context = greyContext(8, 4, 2, 1);
    context.corrected.pixels()[0] = std::numeric_limits<float>::quiet_NaN();
    prep::evaluateDeltaAb(context);
    EXPECT_TRUE(std::isnan(context.maxDelta));
}

TEST(DeltaAb, RefusesEmptyBlockGrid) {
    ProcessingContext context = greyContext(8, 8, 0, 2);
    EXPECT_EQ(evaluationError(context), "The delta ab block counts must be at least 1.");
}

TEST(DeltaAb, RefusesBlocksOfZeroSize) {
    ProcessingContext context = greyContext(8, 8, 5, 1); // 4 RGB columns for 5 blocks
    EXPECT_EQ(evaluationError(context),
              "The flattened image is too small for the delta ab block grid.");
    EXPECT_EQ(context.corrected.pixels()[0], 0.5f);
}

TEST(DeltaAb, RefusesImageWithoutGreen) {
    ProcessingContext context = greyContext(8, 8, 2, 2);
    prep_test::fill(context.corrected, 0.0f);
    EXPECT_EQ(evaluationError(context),
              "The flattened image has no green signal; its delta ab cannot be measured.");
}

} // namespace

#include <cmath>
#include <limits>
#include <stdexcept>

#include <gtest/gtest.h>

#include "prep/delta_ab.h"
#include "test_images.h"

using prep_test::makeImage;

using lsc::ShadingSettings;

using img::BayerImage;
using img::kCfaGbrg;
using img::kCfaRggb;

namespace {

constexpr float kGamma = 0.45454544f;

// The evaluation's input, settings and result.
struct Evaluation {
    BayerImage corrected;
    ShadingSettings settings;
    prep::DeltaAbResult result;
};

void evaluate(Evaluation& run) {
    run.result = prep::evaluateDeltaAb(run.corrected, run.settings);
}

Evaluation greyImage(std::int32_t width, std::int32_t height, int columns, int rows) {
    Evaluation run;
    run.corrected = makeImage(width, height, 1, kCfaRggb);
    prep_test::fill(run.corrected, 0.5f);
    run.settings.deltaAbBlocks[0] = columns;
    run.settings.deltaAbBlocks[1] = rows;
    return run;
}

// Makes the RGB pixel (px, py) of an RGGB image reddish.
void tint(Evaluation& run, int px, int py) {
    run.corrected.pixels()[(2 * py) * run.corrected.width() + 2 * px] = 0.9f;
}

std::string evaluationError(Evaluation& run) {
    try {
        evaluate(run);
    } catch (const std::runtime_error& e) {
        return e.what();
    }
    return "(no error)";
}

TEST(DeltaAb, GreyImageHasNoColourError) {
    Evaluation run = greyImage(64, 48, 4, 3);
    evaluate(run);
    ASSERT_EQ(run.result.deltaImage.size(), 12u);
    for (float delta : run.result.deltaImage)
        EXPECT_EQ(delta, 0.0f);
    EXPECT_EQ(run.result.maxDelta, 0.0f);
    EXPECT_EQ(run.result.deltaStdDev, 0.0f);
    EXPECT_LT(run.result.meanChroma, 0.1f);
}

TEST(DeltaAb, NormalisesGreenPeakToLumaFactor) {
    Evaluation run = greyImage(8, 8, 1, 1);
    evaluate(run);
    for (float v : prep_test::samplesOf(run.corrected))
        EXPECT_FLOAT_EQ(v, 0.75f);
}

TEST(DeltaAb, WritesEncodedColoursBackByPosition) {
    Evaluation run;
    run.corrected = makeImage(2, 2, 1, kCfaGbrg); // G B / R G
    const float mosaic[4] = {0.4f, 0.25f, 0.5f, 0.2f};
    std::copy(mosaic, mosaic + 4, run.corrected.pixels());
    run.settings.deltaAbBlocks[0] = run.settings.deltaAbBlocks[1] = 1;
    evaluate(run);
    const float green = std::pow((0.4f + 0.2f) * 0.5f, kGamma);
    const float scale = 0.75f / green;
    const float* out = run.corrected.pixels();
    EXPECT_FLOAT_EQ(out[0], green * scale);
    EXPECT_FLOAT_EQ(out[3], green * scale);
    EXPECT_FLOAT_EQ(out[1], std::pow(0.25f, kGamma) * scale);
    EXPECT_FLOAT_EQ(out[2], std::pow(0.5f, kGamma) * scale);
}

TEST(DeltaAb, ColourMatrixTakesRowVector) {
    Evaluation run = greyImage(2, 2, 1, 1);
    const float matrix[3][3] = {{0, 1, 0}, {0, 0, 0}, {0, 0, 1}}; // red feeds green only
    for (int r = 0; r < 3; ++r)
        for (int c = 0; c < 3; ++c)
            run.settings.ccm[r][c] = matrix[r][c];
    evaluate(run);
    const float* out = run.corrected.pixels();
    EXPECT_EQ(out[0], 0.0f);        // red position: nothing feeds out 0
    EXPECT_FLOAT_EQ(out[1], 0.75f); // green: the red sample, normalised
    EXPECT_GT(out[3], 0.0f);        // blue passes through
}

TEST(DeltaAb, NegativeColoursClipToZero) {
    Evaluation run = greyImage(2, 2, 1, 1);
    run.settings.ccm[0][0] = -1.0f;
    evaluate(run);
    EXPECT_EQ(run.corrected.pixels()[0], 0.0f);
}

TEST(DeltaAb, DefaultGridOnVgaUsesSixteenPixelBlocks) {
    Evaluation run = greyImage(640, 480, 20, 15);
    for (int py = 16; py < 32; ++py)
        for (int px = 16; px < 32; ++px)
            tint(run, px, py); // exactly block (1, 1)
    evaluate(run);
    ASSERT_EQ(run.result.deltaImage.size(), 300u);
    const float tinted = run.result.deltaImage[1 * 20 + 1];
    EXPECT_EQ(run.result.maxDelta, tinted);
    EXPECT_GT(tinted, 1.0f);
    // All other blocks are alike.
    EXPECT_EQ(run.result.deltaImage[0], run.result.deltaImage[2]);
    EXPECT_EQ(run.result.deltaImage[0], run.result.deltaImage[299]);
    EXPECT_LT(run.result.deltaImage[0], tinted / 100);
}

TEST(DeltaAb, PixelsBeyondLastWholeBlockAreIgnored) {
    // RGB image 10 x 4 with 3 x 1 blocks of 3 x 4: column 9 belongs to none.
    Evaluation run = greyImage(20, 8, 3, 1);
    for (int py = 0; py < 4; ++py)
        tint(run, 9, py);
    evaluate(run);
    for (float delta : run.result.deltaImage)
        EXPECT_EQ(delta, 0.0f);

    Evaluation inside = greyImage(20, 8, 3, 1);
    tint(inside, 8, 0);
    evaluate(inside);
    EXPECT_EQ(inside.result.maxDelta, inside.result.deltaImage[2]);
    EXPECT_GT(inside.result.maxDelta, 0.0f);
}

TEST(DeltaAb, StatisticsOverBlocks) {
    Evaluation run = greyImage(4, 2, 2, 1);
    tint(run, 1, 0);
    evaluate(run);
    // Two blocks symmetric about their mean: equal deltas, no spread.
    EXPECT_FLOAT_EQ(run.result.deltaImage[0], run.result.deltaImage[1]);
    EXPECT_EQ(run.result.maxDelta, std::max(run.result.deltaImage[0], run.result.deltaImage[1]));
    EXPECT_NEAR(run.result.deltaStdDev, 0.0f, 1e-4f);
    EXPECT_GT(run.result.meanChroma, 0.0f);
}

TEST(DeltaAb, NotANumberBlockGivesNotANumberMaximum) {
    Evaluation run = greyImage(8, 4, 2, 1);
    run.corrected.pixels()[0] = std::numeric_limits<float>::quiet_NaN();
    evaluate(run);
    EXPECT_TRUE(std::isnan(run.result.maxDelta));
}

TEST(DeltaAb, RefusesEmptyBlockGrid) {
    Evaluation run = greyImage(8, 8, 0, 2);
    EXPECT_EQ(evaluationError(run), "The delta ab block counts must be at least 1.");
}

TEST(DeltaAb, RefusesBlocksOfZeroSize) {
    Evaluation run = greyImage(8, 8, 5, 1); // 4 RGB columns for 5 blocks
    EXPECT_EQ(evaluationError(run),
              "The flattened image is too small for the delta ab block grid.");
    EXPECT_EQ(run.corrected.pixels()[0], 0.5f);
}

TEST(DeltaAb, RefusesImageWithoutGreen) {
    Evaluation run = greyImage(8, 8, 2, 2);
    prep_test::fill(run.corrected, 0.0f);
    EXPECT_EQ(evaluationError(run),
              "The flattened image has no green signal; its delta ab cannot be measured.");
}

} // namespace
